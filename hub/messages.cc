// SPDX-License-Identifier: Apache-2.0
#include "hub/messages.h"

#include "hub/precondition.h"
#include "sound_detection.pb.h"

namespace qz::hub {
namespace {

std::vector<uint8_t> Serialise(const google::protobuf::MessageLite& message) {
  std::vector<uint8_t> bytes(message.ByteSizeLong());
  message.SerializeToArray(bytes.data(), static_cast<int>(bytes.size()));
  return bytes;
}

}  // namespace

std::vector<uint8_t> EncodeEnableRequest(uint32_t client_id,
                                         const std::vector<uint32_t>& categories) {
  sound_detection::SoundDetectionEnableRequest request;
  for (const uint32_t category : categories) request.add_categories(category);
  request.set_client_id(client_id);
  return Serialise(request);
}

std::vector<uint8_t> EncodeDisableRequest(uint32_t client_id) {
  sound_detection::SoundDetectionDisableRequest request;
  request.set_client_id(client_id);
  return Serialise(request);
}

std::optional<std::vector<uint32_t>> DecodeQueryResponse(const uint8_t* bytes, size_t size) {
  sound_detection::SoundDetectionQueryResponse response;
  if (!response.ParseFromArray(bytes, static_cast<int>(size))) return std::nullopt;
  return std::vector<uint32_t>(response.supported_categories().begin(),
                               response.supported_categories().end());
}

std::optional<SoundReport> DecodeSoundReport(const uint8_t* bytes, size_t size) {
  sound_detection::SoundDetectionEventResponse response;
  if (!response.ParseFromArray(bytes, static_cast<int>(size))) return std::nullopt;
  SoundReport report{
      response.timestamp_ns(), response.response_time_ns(), response.model_version(), {}};
  for (const auto& result : response.sound_results()) {
    report.results.push_back({result.category(), result.confidence()});
  }
  return report;
}

std::optional<SoundReport> DecodeFramedSoundReport(const void* data, size_t size) {
  constexpr size_t kPrefixBytes = 4;
  QZ_HUB_REQUIRE(data != nullptr || size == 0);
  const auto* bytes = static_cast<const uint8_t*>(data);
  if (size < kPrefixBytes) return std::nullopt;
  const size_t length = bytes[0] | bytes[1] << 8 | bytes[2] << 16 | size_t{bytes[3]} << 24;
  if (length != size - kPrefixBytes) return std::nullopt;
  return DecodeSoundReport(bytes + kPrefixBytes, length);
}

}  // namespace qz::hub
