// SPDX-License-Identifier: Apache-2.0
#include "audio/pcm_format.h"

#include <cstring>

namespace qz::audio {
namespace {

struct Encoding {
  const char* name;
  PcmKind kind;
  int sample_bytes;
  bool big_endian;
};

constexpr Encoding kEncodings[] = {
    {"u8", PcmKind::kUnsigned, 1, false},  {"s8", PcmKind::kSigned, 1, false},
    {"s16le", PcmKind::kSigned, 2, false}, {"s16be", PcmKind::kSigned, 2, true},
    {"s24le", PcmKind::kSigned, 3, false}, {"s24be", PcmKind::kSigned, 3, true},
    {"s32le", PcmKind::kSigned, 4, false}, {"s32be", PcmKind::kSigned, 4, true},
    {"f32le", PcmKind::kFloat, 4, false},  {"f32be", PcmKind::kFloat, 4, true},
    {"f64le", PcmKind::kFloat, 8, false},  {"f64be", PcmKind::kFloat, 8, true},
};

// The bits of a sample, its most significant one at the top.
uint64_t BitsAtTop(const uint8_t* bytes, const PcmFormat& format) {
  uint64_t bits = 0;
  for (int i = 0; i < format.sample_bytes; ++i) {
    const int from = format.big_endian ? i : format.sample_bytes - 1 - i;
    bits |= uint64_t{bytes[from]} << (56 - 8 * i);
  }
  return bits;
}

float DecodeSample(const uint8_t* bytes, const PcmFormat& format) {
  const uint64_t bits = BitsAtTop(bytes, format);
  const auto upper = static_cast<uint32_t>(bits >> 32);
  if (format.kind == PcmKind::kFloat && format.sample_bytes == 8) {
    double value = 0;
    std::memcpy(&value, &bits, sizeof(value));
    return static_cast<float>(value);
  }
  if (format.kind == PcmKind::kFloat) {
    float value = 0;
    std::memcpy(&value, &upper, sizeof(value));
    return value;
  }
  const uint32_t offset = format.kind == PcmKind::kUnsigned ? 0x80000000u : 0;
  return static_cast<float>(static_cast<int32_t>(upper ^ offset)) * 0x1p-31f;
}

}  // namespace

std::vector<std::string> PcmEncodingNames() {
  std::vector<std::string> names;
  names.reserve(std::size(kEncodings));
  for (const Encoding& encoding : kEncodings) names.emplace_back(encoding.name);
  return names;
}

std::string PcmEncodingName(const PcmFormat& format) {
  for (const Encoding& encoding : kEncodings) {
    if (encoding.kind == format.kind && encoding.sample_bytes == format.sample_bytes &&
        encoding.big_endian == format.big_endian) {
      return encoding.name;
    }
  }
  return "unknown encoding";
}

bool SetPcmEncoding(const std::string& name, PcmFormat* format) {
  for (const Encoding& encoding : kEncodings) {
    if (name != encoding.name) continue;
    format->kind = encoding.kind;
    format->sample_bytes = encoding.sample_bytes;
    format->big_endian = encoding.big_endian;
    return true;
  }
  return false;
}

void DecodePcm(const uint8_t* bytes, size_t count, const PcmFormat& format, float* samples) {
  const auto sample_bytes = static_cast<size_t>(format.sample_bytes);
  for (size_t i = 0; i < count; ++i) samples[i] = DecodeSample(bytes + i * sample_bytes, format);
}

}  // namespace qz::audio
