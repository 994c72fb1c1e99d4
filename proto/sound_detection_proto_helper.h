// SPDX-License-Identifier: Apache-2.0
// Builds, encodes and decodes the messages of sound_detection.proto. No state; failures are logged
// and reported as a null buffer or false.
#pragma once

#include <cstdint>

#include "classifier/types/confidence_event.h"
#include "proto/chre_buffer.h"
#include "sound_detection.nanopb.h"

namespace tarn::contexthub::sound {

// One segment of raw audio; never owned.
struct RawAudioInfo {
  uint16_t size;  // bytes at `data`
  const uint8_t* data;
};

// Structures to encode. What they are built from is referred to, not copied: it must outlive the
// encoding.

// `timestamp_ns` is the time of the pass in the host's clock; the response time is read here.
sound_detection_SoundDetectionEventResponse GetDetectionEventResponse(
    const ConfidenceEvents* events, uint32_t model_version, uint64_t timestamp_ns);

sound_detection_RawAudioSegment GetRawAudioSegment(uint32_t model_version, uint64_t timestamp_ns,
                                                   RawAudioInfo* info);

// Encoders into a heap buffer of exactly the encoded size, which `*size` receives (also when the
// heap then gives no buffer; it stays when the message can't be sized).

// With the prefix the buffer begins with the length of the message, 4 bytes, least significant
// first.
ChreBuffer EncodeDetectionResponseMessage(sound_detection_SoundDetectionEventResponse response,
                                          bool with_length_prefix, uint32_t* size);

ChreBuffer EncodeRawAudioSegment(sound_detection_RawAudioSegment segment, uint32_t* size);

// Encodes the supported categories into the caller's buffer. `size` is its capacity going in and
// the bytes written coming out; it stays on failure.
bool EncodeQueryResponseMessage(uint8_t* buffer, uint32_t& size);

// Decoders. The caller zeroes `request` before.

bool DecodeSoundDetectionEnableRequestMessage(const uint8_t* data, uint32_t size,
                                              sound_detection_SoundDetectionEnableRequest* request);

bool DecodeSoundDetectionDisableRequestMessage(
    const uint8_t* data, uint32_t size, sound_detection_SoundDetectionDisableRequest* request);

}  // namespace tarn::contexthub::sound
