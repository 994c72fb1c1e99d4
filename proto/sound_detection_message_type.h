// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

namespace tarn::contexthub::sound {

// Types of the messages between the nanoapp and host endpoints. Payloads are bare protobuf
// messages.
enum SoundDetectionMessageType : uint32_t {
  QUERY_REQUEST = 1,          // from the host; payload not read
  QUERY_RESPONSE = 2,         // SoundDetectionQueryResponse
  ENABLE_REQUEST = 3,         // from the host; SoundDetectionEnableRequest
  ENABLE_RESPONSE = 4,        // empty
  DISABLE_REQUEST = 5,        // from the host; SoundDetectionDisableRequest
  DISABLE_RESPONSE = 6,       // empty
  SOUND_EVENT_DETECTION = 7,  // SoundDetectionEventResponse
  RAW_AUDIO_SEGMENT = 8,      // RawAudioSegment
};

}  // namespace tarn::contexthub::sound
