// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "chre/dynamic_vector.h"
#include "classifier/types/confidence_event.h"

namespace tarn::contexthub::sound {

// Events between client nanoapps and this one. Requests carry no data: the sender is the client.
constexpr uint16_t kSoundServiceRegisterEvent = 0x8203;
constexpr uint16_t kSoundServiceUnregisterEvent = 0x8205;
// To each client: 4-byte little-endian length, then a SoundDetectionEventResponse of that length.
constexpr uint16_t kSoundServiceDetectionEvent = 0x8207;

// The client nanoapps on this hub, and what is published to them after every pass. Failures are
// logged.
class SoundService {
 public:
  void RegisterClient(uint32_t instance_id);
  void UnregisterClient(uint32_t instance_id);

  // Sends each client, in order of registration, its own copy of the report. `timestamp_ns` is the
  // time of the pass in the host's clock.
  void PublishEvent(const ConfidenceEvents* events, uint32_t model_version, uint64_t timestamp_ns);

  bool HasClients() const { return !clients_.empty(); }

 private:
  // Instance IDs, in order of registration, without duplicates.
  chre::DynamicVector<uint32_t> clients_;
};

}  // namespace tarn::contexthub::sound
