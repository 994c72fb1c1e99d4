// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "classifier/types/confidence_event.h"

namespace tarn::contexthub::sound {

struct RawAudioInfo;

// How the classifier reports to whoever owns it. Arguments are valid during the call only.
class SoundDetectionEventListenerInterface {
 public:
  virtual ~SoundDetectionEventListenerInterface() = default;

  // One to five categories were detected in the pass that began at `timestamp_ns` (host clock).
  virtual void OnSoundDetectionEvent(const ConfidenceEvents& events, uint32_t model_version,
                                     uint64_t timestamp_ns) = 0;

  // A segment of raw audio may go to the host.
  virtual void OnRawAudioTransmissibleSegment(uint32_t model_version, uint64_t timestamp_ns,
                                              RawAudioInfo* info) = 0;
};

}  // namespace tarn::contexthub::sound
