// SPDX-License-Identifier: Apache-2.0
// The messages between host or client nanoapps and the detector, encoded and decoded by the
// official protobuf library: a second implementation beside the module's own.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace qz::hub {

// Types of host messages.
enum MessageType : uint32_t {
  kQueryRequest = 1,
  kQueryResponse = 2,
  kEnableRequest = 3,
  kEnableResponse = 4,
  kDisableRequest = 5,
  kDisableResponse = 6,
  kSoundEventDetection = 7,
  kRawAudioSegment = 8,
};

// Types of events between client nanoapps and the detector.
enum EventType : uint16_t {
  kRegisterEvent = 0x8203,
  kUnregisterEvent = 0x8205,
  kReportEvent = 0x8207,
};

struct SoundResult {
  uint32_t category = 0;
  float confidence = 0;
};

// A detection event (to the host) or a periodic report (to client nanoapps).
struct SoundReport {
  uint64_t timestamp_ns = 0;      // of the pass, host clock
  uint64_t response_time_ns = 0;  // when the message was built, hub clock
  uint32_t model_version = 0;
  std::vector<SoundResult> results;
};

// Payloads of the requests.
std::vector<uint8_t> EncodeEnableRequest(uint32_t client_id,
                                         const std::vector<uint32_t>& categories = {});
std::vector<uint8_t> EncodeDisableRequest(uint32_t client_id);

// Empty when the bytes are not such a message.
std::optional<std::vector<uint32_t>> DecodeQueryResponse(const uint8_t* bytes, size_t size);
std::optional<SoundReport> DecodeSoundReport(const uint8_t* bytes, size_t size);
// A report preceded by its 4-byte little-endian length; `size` bytes can be read at `data`.
std::optional<SoundReport> DecodeFramedSoundReport(const void* data, size_t size);

}  // namespace qz::hub
