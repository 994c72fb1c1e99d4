// SPDX-License-Identifier: Apache-2.0
// Samples without compression, as headerless files, WAV and AU hold them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace qz::audio {

// What any audio may have.
constexpr int kMinRateHz = 1000;
constexpr int kMaxRateHz = 768000;
constexpr int kMaxChannels = 64;

enum class PcmKind { kUnsigned, kSigned, kFloat };

struct PcmFormat {
  int rate_hz = 16000;
  int channels = 1;
  PcmKind kind = PcmKind::kSigned;
  int sample_bytes = 2;  // 1 (the only size of kUnsigned) to 4; of kFloat 4 or 8
  bool big_endian = false;

  size_t frame_bytes() const {
    return static_cast<size_t>(channels) * static_cast<size_t>(sample_bytes);
  }
};

// "s16le" and the like: kind (u, s, f), bits, byte order. The names of all encodings.
std::vector<std::string> PcmEncodingNames();
// The name of the encoding that `format` has.
std::string PcmEncodingName(const PcmFormat& format);
// Gives `*format` the encoding of that name; false if there is none.
bool SetPcmEncoding(const std::string& name, PcmFormat* format);

// Decodes `count` samples to full scale ±1.
void DecodePcm(const uint8_t* bytes, size_t count, const PcmFormat& format, float* samples);

}  // namespace qz::audio
