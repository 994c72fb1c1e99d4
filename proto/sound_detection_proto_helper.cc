// SPDX-License-Identifier: Apache-2.0
#include "proto/sound_detection_proto_helper.h"

#include <pb_decode.h>
#include <pb_encode.h>

#include "chre.h"
#include "classifier/types/log_prefix.h"

namespace tarn::contexthub::sound {
namespace {

constexpr const char* kSourceFile = "sound_detection_proto_helper.cc";

// Numbers of this file's out-of-memory log lines: fixed, so that a line from the field keeps its
// meaning when the file changes.
constexpr int kRawAudioOomLine = 124;
constexpr int kDetectionOomLine = 155;
constexpr int kQueryOomLine = 175;

void LogOom(int line) {
  chreLog(CHRE_LOG_ERROR, "%s OOM at %s:%d", kApplicationLogPrefix, kSourceFile, line);
}

// Encode callbacks. nanopb calls each twice, for the size and for the bytes.

// `*arg` is the ConfidenceEvents.
bool EncodeDetectionSoundResult(pb_ostream_t* stream, const pb_field_t* field, void* const* arg) {
  const auto& events = *static_cast<const ConfidenceEvents*>(*arg);
  for (const ConfidenceEvent& event : events) {
    sound_detection_SoundResult result = sound_detection_SoundResult_init_zero;
    result.has_category = true;
    result.category = event.category;
    result.has_confidence = true;
    result.confidence = event.confidence;
    if (!pb_encode_tag_for_field(stream, field) ||
        !pb_encode_submessage(stream, sound_detection_SoundResult_fields, &result)) {
      return false;
    }
  }
  return true;
}

bool EncodeQueryResponseSupportedCategories(pb_ostream_t* stream, const pb_field_t* field,
                                            void* const* /*arg*/) {
  for (const uint8_t category : kSoundCategoryIndexMap) {
    if (!pb_encode_tag_for_field(stream, field) || !pb_encode_varint(stream, category)) {
      return false;
    }
  }
  return true;
}

// `*arg` is the RawAudioInfo.
bool EncodeRawAudioValues(pb_ostream_t* stream, const pb_field_t* field, void* const* arg) {
  const auto& info = *static_cast<const RawAudioInfo*>(*arg);
  return pb_encode_tag_for_field(stream, field) && pb_encode_string(stream, info.data, info.size);
}

constexpr sound_detection_SoundDetectionQueryResponse kQueryResponse = {
    {{.encode = EncodeQueryResponseSupportedCategories}, nullptr}};

// How one kind of message is put into a heap buffer, and what is logged when it can't be.
struct HeapEncoding {
  const pb_msgdesc_t* fields;
  const char* size_failure;
  int oom_line;
  const char* encode_failure;
};

constexpr uint32_t kPrefixBytes = 4;

ChreBuffer Encode(const HeapEncoding& encoding, const void* message, bool with_length_prefix,
                  uint32_t* size) {
  size_t length = 0;
  if (!pb_get_encoded_size(&length, encoding.fields, message)) {
    chreLog(CHRE_LOG_ERROR, encoding.size_failure, kApplicationLogPrefix);
    return {};
  }
  const uint32_t prefix = with_length_prefix ? kPrefixBytes : 0;
  *size = static_cast<uint32_t>(length) + prefix;
  ChreBuffer buffer = ChreBuffer::Allocate(*size);
  if (!buffer) {
    LogOom(encoding.oom_line);
    return {};
  }
  for (uint32_t i = 0; i < prefix; ++i) buffer.get()[i] = static_cast<uint8_t>(length >> (8 * i));
  pb_ostream_t stream = pb_ostream_from_buffer(buffer.get() + prefix, length);
  if (!pb_encode(&stream, encoding.fields, message)) {
    chreLog(CHRE_LOG_ERROR, encoding.encode_failure, kApplicationLogPrefix);
    return {};
  }
  return buffer;
}

// A zero tag ends a message, as nanopb 0.3 had it for every message. 0.4, with which this is built,
// also refuses a known field of another wire type than declared; 0.3 read the value as declared.
bool Decode(pb_istream_t* stream, const pb_msgdesc_t* fields, void* request) {
  return pb_decode_ex(stream, fields, request, PB_DECODE_NULLTERMINATED);
}

}  // namespace

sound_detection_SoundDetectionEventResponse GetDetectionEventResponse(
    const ConfidenceEvents* events, uint32_t model_version, uint64_t timestamp_ns) {
  sound_detection_SoundDetectionEventResponse response =
      sound_detection_SoundDetectionEventResponse_init_zero;
  response.has_timestamp_ns = true;
  response.timestamp_ns = timestamp_ns;
  response.sound_results.funcs.encode = EncodeDetectionSoundResult;
  // nanopb hands the argument back to the callback, which only reads it.
  response.sound_results.arg = const_cast<ConfidenceEvents*>(events);
  response.has_response_time_ns = true;
  response.response_time_ns = chreGetTime();
  response.has_model_version = true;
  response.model_version = model_version;
  return response;
}

sound_detection_RawAudioSegment GetRawAudioSegment(uint32_t model_version, uint64_t timestamp_ns,
                                                   RawAudioInfo* info) {
  sound_detection_RawAudioSegment segment = sound_detection_RawAudioSegment_init_zero;
  segment.has_model_version = true;
  segment.model_version = model_version;
  segment.has_timestamp_ns = true;
  segment.timestamp_ns = timestamp_ns;
  segment.audio_data.funcs.encode = EncodeRawAudioValues;
  segment.audio_data.arg = info;
  return segment;
}

ChreBuffer EncodeDetectionResponseMessage(sound_detection_SoundDetectionEventResponse response,
                                          bool with_length_prefix, uint32_t* size) {
  constexpr HeapEncoding kEncoding = {sound_detection_SoundDetectionEventResponse_fields,
                                      "%s Unable to find response message size", kDetectionOomLine,
                                      "%s Failed to encode detection response message."};
  return Encode(kEncoding, &response, with_length_prefix, size);
}

ChreBuffer EncodeRawAudioSegment(sound_detection_RawAudioSegment segment, uint32_t* size) {
  constexpr HeapEncoding kEncoding = {sound_detection_RawAudioSegment_fields,
                                      "%s Unable to find segment message size", kRawAudioOomLine,
                                      "%s Failed to encode raw audio segment."};
  return Encode(kEncoding, &segment, /*with_length_prefix=*/false, size);
}

bool EncodeQueryResponseMessage(uint8_t* buffer, uint32_t& size) {
  if (buffer == nullptr) {
    LogOom(kQueryOomLine);
    return false;
  }
  pb_ostream_t stream = pb_ostream_from_buffer(buffer, size);
  const sound_detection_SoundDetectionQueryResponse response = kQueryResponse;
  if (!pb_encode(&stream, sound_detection_SoundDetectionQueryResponse_fields, &response)) {
    chreLog(CHRE_LOG_ERROR, "%s Failed to encode query response message.", kApplicationLogPrefix);
    return false;
  }
  size = static_cast<uint32_t>(stream.bytes_written);
  return true;
}

bool DecodeSoundDetectionEnableRequestMessage(
    const uint8_t* data, uint32_t size, sound_detection_SoundDetectionEnableRequest* request) {
  pb_istream_t stream = pb_istream_from_buffer(data, size);
  if (Decode(&stream, sound_detection_SoundDetectionEnableRequest_fields, request)) return true;
  chreLog(CHRE_LOG_ERROR, "%s Unable to decode message SoundDetectionEnableRequest, error %s",
          kApplicationLogPrefix, PB_GET_ERROR(&stream));
  return false;
}

bool DecodeSoundDetectionDisableRequestMessage(
    const uint8_t* data, uint32_t size, sound_detection_SoundDetectionDisableRequest* request) {
  pb_istream_t stream = pb_istream_from_buffer(data, size);
  if (Decode(&stream, sound_detection_SoundDetectionDisableRequest_fields, request)) return true;
  chreLog(CHRE_LOG_ERROR, "%s Unable to decode message, error %s", kApplicationLogPrefix,
          PB_GET_ERROR(&stream));
  return false;
}

}  // namespace tarn::contexthub::sound
