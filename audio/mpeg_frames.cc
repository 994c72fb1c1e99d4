// SPDX-License-Identifier: Apache-2.0
// The frame header of MPEG audio is that of ISO/IEC 11172-3, its extension to lower rates that of
// 13818-3; the information frame is a habit of encoders.

#include "audio/mpeg_frames.h"

#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cstdint>
#include <optional>

namespace qz::audio {
namespace {

constexpr size_t kFrameHeader = 4;

// A file, byte by byte, through a buffer.
class ByteReader {
 public:
  explicit ByteReader(int fd) : fd_(fd) {
    struct stat status = {};
    if (fstat(fd, &status) == 0) size_ = status.st_size;
  }

  int64_t size() const { return size_; }

  // The `count` bytes at `offset`, as one number; all must lie within the file.
  uint32_t BigEndian(int64_t offset, int count) {
    uint32_t number = 0;
    for (int i = 0; i < count; ++i) number = number << 8 | Byte(offset + i);
    return number;
  }

 private:
  uint8_t Byte(int64_t offset) {
    if (offset < begin_ || offset >= begin_ + held_) {
      begin_ = offset;
      held_ = pread(fd_, buffer_.data(), buffer_.size(), offset);
      if (held_ <= 0) return 0;
    }
    return buffer_[static_cast<size_t>(offset - begin_)];
  }

  int fd_;
  int64_t size_ = 0;
  int64_t begin_ = 0;
  ssize_t held_ = 0;
  std::array<uint8_t, 16384> buffer_;
};

struct FrameHeader {
  uint32_t version;  // as coded: 3 is MPEG 1, 2 and 0 are its extensions to lower rates
  uint32_t layer;    // 1 to 3
  uint32_t rate_hz;
  bool mono;
  int64_t bytes;  // of the whole frame
};

bool SameStream(const FrameHeader& a, const FrameHeader& b) {
  return a.version == b.version && a.layer == b.layer && a.rate_hz == b.rate_hz;
}

uint32_t BitRate(bool mpeg1, uint32_t layer, uint32_t index) {
  static constexpr uint16_t kKilobits[5][15] = {
      {0, 32, 64, 96, 128, 160, 192, 224, 256, 288, 320, 352, 384, 416, 448},  // MPEG 1, layer I
      {0, 32, 48, 56, 64, 80, 96, 112, 128, 160, 192, 224, 256, 320, 384},     // II
      {0, 32, 40, 48, 56, 64, 80, 96, 112, 128, 160, 192, 224, 256, 320},      // III
      {0, 32, 48, 56, 64, 80, 96, 112, 128, 144, 160, 176, 192, 224, 256},     // lower rates, I
      {0, 8, 16, 24, 32, 40, 48, 56, 64, 80, 96, 112, 128, 144, 160}};         // II and III
  const uint32_t row = mpeg1 ? layer - 1 : layer == 1 ? 3 : 4;
  return 1000u * kKilobits[row][index];
}

// Nothing for a free bit rate, too, which does not state a size.
std::optional<FrameHeader> ParseHeader(uint32_t bits) {
  const uint32_t version = bits >> 19 & 3;
  const uint32_t layer_code = bits >> 17 & 3;
  const uint32_t bit_rate_index = bits >> 12 & 15;
  const uint32_t rate_index = bits >> 10 & 3;
  if (bits >> 21 != 0x7FF || version == 1 || layer_code == 0 || bit_rate_index == 0 ||
      bit_rate_index == 15 || rate_index == 3) {
    return std::nullopt;
  }
  constexpr uint32_t kRates[] = {44100, 48000, 32000};
  const bool mpeg1 = version == 3;
  FrameHeader header = {};
  header.version = version;
  header.layer = 4 - layer_code;
  header.rate_hz = kRates[rate_index] / (mpeg1 ? 1 : version == 2 ? 2 : 4);
  header.mono = (bits >> 6 & 3) == 3;
  const uint32_t padding = bits >> 9 & 1;
  const uint32_t bit_rate = BitRate(mpeg1, header.layer, bit_rate_index);
  if (header.layer == 1) {
    header.bytes = 4 * (int64_t{12} * bit_rate / header.rate_hz + padding);
  } else {
    const uint32_t slots = header.layer == 3 && !mpeg1 ? 72 : 144;
    header.bytes = int64_t{slots} * bit_rate / header.rate_hz + padding;
  }
  return header;
}

// Where the frames begin: behind an ID3 tag of version 2, whose size has 7 bits a byte.
int64_t SkipTag(ByteReader* file) {
  constexpr int64_t kTagHeader = 10;
  if (file->size() < kTagHeader || file->BigEndian(0, 3) != 0x494433) return 0;
  int64_t size = 0;
  for (int i = 6; i < 10; ++i) size = size << 7 | (file->BigEndian(i, 1) & 0x7F);
  return kTagHeader + size;
}

// The number of frames that an information frame at `offset` states; 0 if it is none.
uint32_t StatedFrames(ByteReader* file, int64_t offset, const FrameHeader& header) {
  constexpr uint32_t kXing = 0x58696E67;
  constexpr uint32_t kInfo = 0x496E666F;
  constexpr uint32_t kCountIsThere = 1;
  const bool mpeg1 = header.version == 3;
  const int64_t side_information = mpeg1 ? (header.mono ? 17 : 32) : (header.mono ? 9 : 17);
  const int64_t mark = offset + int64_t{kFrameHeader} + side_information;
  if (header.layer != 3 || mark + 12 > file->size()) return 0;
  const uint32_t name = file->BigEndian(mark, 4);
  if (name != kXing && name != kInfo) return 0;
  return (file->BigEndian(mark + 4, 4) & kCountIsThere) != 0 ? file->BigEndian(mark + 8, 4) : 0;
}

}  // namespace

std::string FindMpegTruncation(int fd) {
  ByteReader file(fd);
  int64_t offset = SkipTag(&file);
  std::optional<FrameHeader> first;
  uint32_t stated = 0;
  uint32_t frames = 0;  // whole ones
  for (; offset + int64_t{kFrameHeader} <= file.size(); ++frames) {
    const auto header = ParseHeader(file.BigEndian(offset, kFrameHeader));
    if (!header || (first && !SameStream(*header, *first))) return {};
    if (!first) {
      first = header;
      stated = StatedFrames(&file, offset, *header);
    }
    if (offset + header->bytes > file.size()) break;
    offset += header->bytes;
  }
  if (!first) return {};
  // Whether the information frame counts itself depends on the encoder.
  if (stated > frames) {
    return "truncated: the header promises " + std::to_string(stated) +
           " MPEG frames, the file holds " + std::to_string(frames);
  }
  const bool all_are_there = stated > 0 && frames > stated;
  const bool cut_frame = offset < file.size() && file.BigEndian(offset, 1) == 0xFF;
  return cut_frame && !all_are_there ? "truncated: its last MPEG frame is cut off" : "";
}

}  // namespace qz::audio
