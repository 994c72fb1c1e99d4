// SPDX-License-Identifier: Apache-2.0
#include "classifier/audio_classifier.h"

#include <cstring>

#include "chre.h"
#include "chrex.h"
#include "classifier/network_engine.h"
#include "classifier/types/log_prefix.h"
#include "detector/framing.h"
#include "frontend/audio_frontend.h"

namespace tarn::contexthub::sound {
namespace {

// The frame being assembled.
uint32_t sample_count = 0;
int16_t frontend_input_buffer[qz::config::kFrameSamples];

}  // namespace

AudioClassifier::AudioClassifier() {
  chreLog(CHRE_LOG_INFO, "%s audio model initialization", kApplicationLogPrefix);
  audio_frontend_reset();
}

void AudioClassifier::Classify(const int16_t* samples, ConfidenceEvent* confidences,
                               uint32_t confidence_size, uint32_t* model_version) {
  chrexClockRateChangeRequest(1);
  is_confidence_valid_ = true;
  *model_version = qz::config::kReportVersion;
  float pass_confidences[kSoundCategoryCount] = {};
  const int64_t host_offset_ns = chreGetEstimatedHostTimeOffset();
  const uint64_t timestamp_ns = chreGetTime() + static_cast<uint64_t>(host_offset_ns);

  qz::detector::PushSamples(samples, qz::config::kBufferSamples, frontend_input_buffer,
                            &sample_count, [&] { ProcessFrame(pass_confidences); });

  GenerateDetectionEvent(pass_confidences, confidence_size, confidences, timestamp_ns);
  chrexClockRateChangeRequest(0);
}

void AudioClassifier::ProcessFrame(float* pass_confidences) {
  memcpy(audio_frontend_input_ptr, frontend_input_buffer, sizeof(frontend_input_buffer));
  audio_frontend_invoke();
  if (TakeFrame(audio_frontend_output_ptr)) ProcessModelOutput(pass_confidences);
}

}  // namespace tarn::contexthub::sound
