// The second half of AudioClassifier: from the network's scores to detections and the periodic
// report.

#include "chre.h"
#include "classifier/audio_classifier.h"
#include "classifier/detection_tables.h"
#include "classifier/types/log_prefix.h"
#include "network/mobilenet_backend.h"

namespace tarn::contexthub::sound {
namespace {

constexpr uint32_t kDetectionVersion = 202208271;

// The two outputs that are smoothed over the runs: what the periodic report tells.
constexpr uint32_t kShortSmoothedOutput = 1;
constexpr uint32_t kLongSmoothedOutput = 3;
constexpr uint32_t kReportSize = 2;

// In single precision, oldest first: the order decides the last bit.
template <uint16_t N>
float Sum(const circular_buffer_lite<N, float>& buffer) {
  float sum = 0.0f;
  for (uint16_t i = 0; i < buffer.size(); ++i) sum += buffer[i];
  return sum;
}

void FillReport(ConfidenceEvent* confidences, float short_smoothed, float long_smoothed) {
  confidences[0] = {kSoundCategoryIndexMap[kShortSmoothedOutput], short_smoothed};
  confidences[1] = {kSoundCategoryIndexMap[kLongSmoothedOutput], long_smoothed};
}

}  // namespace

void AudioClassifier::ClearConfidenceBuffer() {
  short_confidence_buffer_.clear();
  long_confidence_buffer_.clear();
}

// Means over the capacity: what a filling buffer lacks counts as 0.
float AudioClassifier::Smooth(uint32_t output, float score) {
  if (output == kShortSmoothedOutput) {
    short_confidence_buffer_.push_back(score);
    return Sum(short_confidence_buffer_) / 5.0f;
  }
  if (output == kLongSmoothedOutput) {
    long_confidence_buffer_.push_back(score);
    return Sum(long_confidence_buffer_) * 0.0625f;
  }
  return score;
}

void AudioClassifier::ProcessModelOutput(float* pass_confidences) {
  for (uint32_t i = 0; i < kSoundCategoryCount; ++i) {
    const float score = mobilenet_backend_output_ptr[i];
    if (score > 1.0f) {
      is_confidence_valid_ = false;
      return;
    }
    const float value = Smooth(i, score);
    // This way round a NaN never gets in.
    if (pass_confidences[i] < value) pass_confidences[i] = value;
  }
}

void AudioClassifier::GenerateDetectionEvent(float* pass_confidences, uint32_t confidence_size,
                                             ConfidenceEvent* confidences, uint64_t timestamp_ns) {
  if (!is_confidence_valid_) {
    chreLog(CHRE_LOG_INFO,
            "%s Invalid sound confidence found. Model is still in cold start stage. Skip the "
            "detection events for now.",
            kApplicationLogPrefix);
    ClearConfidenceBuffer();
    if (confidence_size == kReportSize) FillReport(confidences, 0.0f, 0.0f);
    return;
  }

  const uint64_t now_ns = chreGetTime();
  ConfidenceEvents events;
  for (uint32_t i = 0; i < kSoundCategoryCount; ++i) {
    if (!(pass_confidences[i] > kSoundThresholds[i])) continue;
    const uint64_t last_ns = last_detection_time_ns_[i];
    if (last_ns != 0 && last_ns + kSoundDetectionCoolingTimeNs[i] >= now_ns) continue;
    events.push_back({kSoundCategoryIndexMap[i], pass_confidences[i]});
    last_detection_time_ns_[i] = now_ns;
  }

  if (confidence_size == kReportSize) {
    FillReport(confidences, pass_confidences[kShortSmoothedOutput],
               pass_confidences[kLongSmoothedOutput]);
  } else {
    chreLog(CHRE_LOG_ERROR, "%s Confidence size is expected to be 2", kApplicationLogPrefix);
  }

  if (events.empty()) return;
  if (listener_ == nullptr) {
    chreLog(CHRE_LOG_WARN, "%s ES detected but no listener registered", kApplicationLogPrefix);
    return;
  }
  listener_->OnSoundDetectionEvent(events, kDetectionVersion, timestamp_ns);
}

}  // namespace tarn::contexthub::sound
