#include "classifier/audio_classifier.h"

#include <algorithm>
#include <cstring>

#include "chre.h"
#include "chrex.h"
#include "classifier/types/log_prefix.h"
#include "frontend/audio_frontend.h"
#include "network/mobilenet_backend.h"

namespace tarn::contexthub::sound {
namespace {

constexpr uint32_t kPassSamples = 32000;
constexpr uint32_t kHopSamples = 160;
constexpr uint32_t kFrameSamples = qz::frontend::kFrameSamples;
constexpr uint32_t kCarriedSamples = kFrameSamples - kHopSamples;
constexpr uint32_t kFeatures = qz::frontend::kFeatureChannels;
constexpr uint32_t kWindowFrames = 382;
constexpr uint32_t kFramesBetweenRuns = 64;
constexpr uint32_t kCarriedFrames = kWindowFrames - kFramesBetweenRuns;
constexpr uint32_t kReportVersion = 202208270;

// The frame being assembled and the network's window; frame f stands at kFeatures * f, oldest
// first.
uint32_t sample_count = 0;
int16_t frontend_input_buffer[kFrameSamples];
uint32_t feature_count = 0;
int8_t inference_input_buffer[kWindowFrames * kFeatures];

// Four times as loud, saturated. Compared before it is multiplied, so that 16 bits do for all of
// it.
int16_t Amplified(int16_t sample) {
  if (sample < INT16_MIN / 4) return INT16_MIN;
  if (sample > INT16_MAX / 4) return INT16_MAX;
  return static_cast<int16_t>(sample * 4);
}

// Appends samples to the frame, amplified.
void AppendSamples(const int16_t* samples, uint32_t count) {
  int16_t* frame = frontend_input_buffer + sample_count;
  for (uint32_t i = 0; i < count; ++i) {
    frame[i] = Amplified(samples[i]);
  }
  sample_count += count;
}

// Moves the front end's features into the window: 128 becomes 0.
void AppendFeatures() {
  int8_t* frame = inference_input_buffer + feature_count * kFeatures;
  for (uint32_t i = 0; i < kFeatures; ++i) {
    frame[i] = static_cast<int8_t>(std::min<int>(audio_frontend_output_ptr[i], 255) - 128);
  }
  ++feature_count;
}

}  // namespace

AudioClassifier::AudioClassifier() {
  chreLog(CHRE_LOG_INFO, "%s audio model initialization", kApplicationLogPrefix);
  audio_frontend_reset();
}

void AudioClassifier::Classify(const int16_t* samples, ConfidenceEvent* confidences,
                               uint32_t confidence_size, uint32_t* model_version) {
  chrexClockRateChangeRequest(1);
  is_confidence_valid_ = true;
  *model_version = kReportVersion;
  float pass_confidences[kSoundCategoryCount] = {};
  const int64_t host_offset_ns = chreGetEstimatedHostTimeOffset();
  const uint64_t timestamp_ns = chreGetTime() + static_cast<uint64_t>(host_offset_ns);

  for (const int16_t* chunk = samples; chunk != samples + kPassSamples; chunk += kHopSamples) {
    const uint32_t space = kFrameSamples - sample_count;
    const uint32_t taken = space < kHopSamples ? space : kHopSamples;
    AppendSamples(chunk, taken);
    if (sample_count == kFrameSamples) {
      ProcessFrame(pass_confidences);
      AppendSamples(chunk + taken, kHopSamples - taken);
    }
  }

  GenerateDetectionEvent(pass_confidences, confidence_size, confidences, timestamp_ns);
  chrexClockRateChangeRequest(0);
}

void AudioClassifier::ProcessFrame(float* pass_confidences) {
  memcpy(audio_frontend_input_ptr, frontend_input_buffer, sizeof(frontend_input_buffer));
  audio_frontend_invoke();
  AppendFeatures();
  if (feature_count == kWindowFrames) {
    memcpy(mobilenet_backend_input_ptr, inference_input_buffer, sizeof(inference_input_buffer));
    mobilenet_backend_invoke();
    ProcessModelOutput(pass_confidences);
    memmove(inference_input_buffer, inference_input_buffer + kFramesBetweenRuns * kFeatures,
            kCarriedFrames * kFeatures);
    feature_count = kCarriedFrames;
  }
  memmove(frontend_input_buffer, frontend_input_buffer + kHopSamples,
          kCarriedSamples * sizeof(int16_t));
  sample_count = kCarriedSamples;
}

}  // namespace tarn::contexthub::sound
