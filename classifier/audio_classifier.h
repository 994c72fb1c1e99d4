// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "classifier/types/confidence_event.h"
#include "classifier/types/sound_detection_event_listener_interface.h"
#include "detector/scores.h"

namespace tarn::contexthub::sound {

// Turns the microphone stream into category confidences, and at the end of every pass into
// detections and the periodic report. The steps are those of detector/; this class connects them
// with the runtime: log, clocks and listener.
//
// The frame being assembled, the front end and the network are static: there
// must be at most one classifier, and framing continues across pauses of the audio.
class AudioClassifier {
 public:
  AudioClassifier();

  // Is called with detections; not owned. A later call replaces it.
  void RegisterListener(SoundDetectionEventListenerInterface* listener) { listener_ = listener; }

  // Forgets the smoothed scores.
  void ClearConfidenceBuffer();

  // One pass over 32000 samples (two seconds, 16 kHz). `confidences` holds `confidence_size`
  // records; when that is 2 they receive the periodic report: categories 6 and 15. `*model_version`
  // receives the version that travels with it.
  void Classify(const int16_t* samples, ConfidenceEvent* confidences, uint32_t confidence_size,
                uint32_t* model_version);

 private:
  // Folds the scores of a network run into the maxima of the pass.
  void ProcessModelOutput(float* pass_confidences);
  // Decides what the pass detected, calls the listener, and fills the periodic report.
  // `timestamp_ns` is the start of the pass in the host's clock.
  void GenerateDetectionEvent(float* pass_confidences, uint32_t confidence_size,
                              ConfidenceEvent* confidences, uint64_t timestamp_ns);

  // Runs the front end on the assembled frame, and hands its features to the network.
  void ProcessFrame(float* pass_confidences);

  // By network output, in the hub's clock; 0 means never.
  uint64_t last_detection_time_ns_[kSoundCategoryCount] = {};
  qz::detector::ShortScores short_confidence_buffer_;
  qz::detector::LongScores long_confidence_buffer_;
  SoundDetectionEventListenerInterface* listener_ = nullptr;
  // False once a score of the pass was above 1.0.
  bool is_confidence_valid_ = false;
};

}  // namespace tarn::contexthub::sound
