// SPDX-License-Identifier: Apache-2.0
// The second half of AudioClassifier: from the network's scores to detections and the periodic
// report.

#include "chre.h"
#include "classifier/audio_classifier.h"
#include "classifier/detection_tables.h"
#include "classifier/network_engine.h"
#include "classifier/types/log_prefix.h"

namespace tarn::contexthub::sound {
namespace {

using qz::config::kLongSmoothedOutput;
using qz::config::kReportSize;
using qz::config::kShortSmoothedOutput;

void FillReport(ConfidenceEvent* confidences, float short_smoothed, float long_smoothed) {
  confidences[0] = {kSoundCategoryIndexMap[kShortSmoothedOutput], short_smoothed};
  confidences[1] = {kSoundCategoryIndexMap[kLongSmoothedOutput], long_smoothed};
}

}  // namespace

void AudioClassifier::ClearConfidenceBuffer() {
  short_confidence_buffer_.clear();
  long_confidence_buffer_.clear();
}

void AudioClassifier::ProcessModelOutput(float* pass_confidences) {
  if (!qz::detector::FoldScores(NetworkScores(), &short_confidence_buffer_,
                                &long_confidence_buffer_, pass_confidences)) {
    is_confidence_valid_ = false;
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
    if (qz::detector::Detect(pass_confidences[i], kSoundThresholds[i],
                             kSoundDetectionCoolingTimeNs[i], now_ns,
                             &last_detection_time_ns_[i])) {
      events.push_back({kSoundCategoryIndexMap[i], pass_confidences[i]});
    }
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
  listener_->OnSoundDetectionEvent(events, qz::config::kDetectionVersion, timestamp_ns);
}

}  // namespace tarn::contexthub::sound
