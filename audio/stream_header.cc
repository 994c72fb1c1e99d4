// SPDX-License-Identifier: Apache-2.0
#include "audio/stream_header.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "audio/audio_input.h"
#include "base/interrupt.h"

namespace qz::audio {
namespace {

// Chunks before the audio hold titles and pictures at most.
constexpr size_t kMaxHeader = size_t{1} << 20;

// Little-endian numbers of WAV, big-endian ones of AU.
uint32_t Little(const std::string& bytes, size_t offset, size_t count) {
  uint32_t number = 0;
  for (size_t i = count; i-- > 0;) number = number << 8 | static_cast<uint8_t>(bytes[offset + i]);
  return number;
}

uint32_t Big(const std::string& bytes, size_t offset) {
  uint32_t number = 0;
  for (size_t i = 0; i < 4; ++i) number = number << 8 | static_cast<uint8_t>(bytes[offset + i]);
  return number;
}

// The format that a WAV's "fmt " chunk of `size` bytes at `offset` states.
std::optional<PcmFormat> WavFormat(const std::string& bytes, size_t offset, size_t size) {
  constexpr uint32_t kPcm = 1, kFloat = 3, kExtensible = 0xFFFE;
  constexpr size_t kShortest = 16, kExtensibleSize = 26, kSubformat = 24;
  if (size < kShortest) return std::nullopt;
  uint32_t tag = Little(bytes, offset, 2);
  if (tag == kExtensible && size >= kExtensibleSize) tag = Little(bytes, offset + kSubformat, 2);
  const uint32_t channels = Little(bytes, offset + 2, 2);
  const uint32_t rate_hz = Little(bytes, offset + 4, 4);
  const uint32_t frame_bytes = Little(bytes, offset + 12, 2);
  if (channels == 0 || frame_bytes % channels != 0 || rate_hz > INT32_MAX) return std::nullopt;
  const uint32_t sample_bytes = frame_bytes / channels;
  PcmFormat format;
  format.channels = static_cast<int>(channels);
  format.rate_hz = static_cast<int>(rate_hz);
  format.sample_bytes = static_cast<int>(sample_bytes);
  format.kind = tag == kFloat       ? PcmKind::kFloat
                : sample_bytes == 1 ? PcmKind::kUnsigned
                                    : PcmKind::kSigned;
  const bool known = tag == kPcm     ? sample_bytes >= 1 && sample_bytes <= 4
                     : tag == kFloat ? sample_bytes == 4 || sample_bytes == 8
                                     : false;
  return known ? std::optional<PcmFormat>(format) : std::nullopt;
}

std::optional<PcmStream> ReadWavHeader(StreamHead* head) {
  constexpr size_t kChunkHeader = 8;
  const uint32_t file_size = Little(head->bytes(), 4, 4);
  std::optional<PcmFormat> format;
  for (size_t offset = 12; head->Need(offset + kChunkHeader);) {
    const std::string name = head->bytes().substr(offset, 4);
    const uint32_t size = Little(head->bytes(), offset + 4, 4);
    offset += kChunkHeader;
    if (name == "data") {
      if (!format) return std::nullopt;
      // A size of 0 was never filled in, unless the file's counts other chunks behind.
      const bool counts_more = file_size < kUntilTheEnd && file_size + kChunkHeader > offset;
      if (size == 0 && !counts_more) return PcmStream{*format, std::nullopt, true};
      if (size >= kUntilTheEnd) return PcmStream{*format, std::nullopt};
      return PcmStream{*format, size};
    }
    if (size > kMaxHeader - offset || !head->Need(offset + size + size % 2)) return std::nullopt;
    if (name == "fmt ") format = WavFormat(head->bytes(), offset, size);
    offset += size + size % 2;
    if (offset + kChunkHeader > kMaxHeader) return std::nullopt;
  }
  return std::nullopt;
}

std::optional<PcmStream> ReadAuHeader(StreamHead* head) {
  constexpr size_t kShortest = 24;
  if (!head->Need(kShortest)) return std::nullopt;
  const uint32_t header_bytes = Big(head->bytes(), 4);
  const uint32_t size = Big(head->bytes(), 8);
  const uint32_t encoding = Big(head->bytes(), 12);
  const uint32_t rate_hz = Big(head->bytes(), 16);
  const uint32_t channels = Big(head->bytes(), 20);
  const char* const encodings[] = {"s8", "s16be", "s24be", "s32be", "f32be", "f64be"};
  constexpr uint32_t kFirstEncoding = 2;
  PcmStream stream;
  if (encoding < kFirstEncoding || encoding >= kFirstEncoding + std::size(encodings) ||
      rate_hz > INT32_MAX || channels > UINT16_MAX || header_bytes < kShortest ||
      header_bytes > kMaxHeader || !head->Need(header_bytes)) {
    return std::nullopt;
  }
  SetPcmEncoding(encodings[encoding - kFirstEncoding], &stream.format);
  stream.format.rate_hz = static_cast<int>(rate_hz);
  stream.format.channels = static_cast<int>(channels);
  if (size < kUntilTheEnd) stream.bytes = size;
  return stream;
}

}  // namespace

bool StreamHead::Need(size_t count) {
  while (bytes_.size() < count) {
    if (!base::WaitReadable(file_.get())) {
      throw AudioError(name_ + ": interrupted before the first sample");
    }
    const size_t held = bytes_.size();
    bytes_.resize(count);
    const ssize_t got = read(file_.get(), bytes_.data() + held, count - held);
    const int error = errno;
    bytes_.resize(held + (got > 0 ? static_cast<size_t>(got) : 0));
    if (got == 0) return false;
    if (got < 0 && error != EINTR && error != EAGAIN) {
      throw AudioError(name_ + ": can't be read: " + std::strerror(error));
    }
  }
  return true;
}

std::optional<PcmStream> ReadPcmHeader(StreamHead* head) {
  if (!head->Need(12)) return std::nullopt;
  const std::string& bytes = head->bytes();
  if (bytes.compare(0, 4, "RIFF") == 0 && bytes.compare(8, 4, "WAVE") == 0) {
    return ReadWavHeader(head);
  }
  return bytes.compare(0, 4, ".snd") == 0 ? ReadAuHeader(head) : std::nullopt;
}

}  // namespace qz::audio
