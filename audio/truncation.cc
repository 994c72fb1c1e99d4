// SPDX-License-Identifier: Apache-2.0
#include "audio/truncation.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>

#include "audio/mpeg_frames.h"
#include "audio/stream_header.h"

namespace qz::audio {
namespace {

// More chunks than any real file has before its audio.
constexpr int kMaxChunks = 10000;

std::string ReadAt(int fd, off_t offset, size_t count) {
  std::string bytes(count, '\0');
  const ssize_t got = pread(fd, bytes.data(), count, offset);
  bytes.resize(got > 0 ? static_cast<size_t>(got) : 0);
  return bytes;
}

// Four bytes of `bytes` as a number.
uint32_t Number(const std::string& bytes, size_t offset, bool big_endian) {
  uint32_t number = 0;
  for (size_t i = 0; i < 4; ++i) {
    const size_t from = big_endian ? i : 3 - i;
    number = number << 8 | static_cast<uint8_t>(bytes[offset + from]);
  }
  return number;
}

std::string CheckSize(uint32_t stated, off_t present) {
  if (stated >= kUntilTheEnd || present >= static_cast<off_t>(stated)) return {};
  return "truncated: the header promises " + std::to_string(stated) +
         " bytes of audio, the file holds " + std::to_string(std::max<off_t>(present, 0));
}

// Walks the chunks up to the one that holds the audio.
std::string CheckChunks(int fd, off_t file_size, const char* audio_chunk, bool big_endian) {
  constexpr size_t kChunkHeader = 8;
  off_t offset = 12;
  for (int i = 0; i < kMaxChunks; ++i) {
    const std::string chunk = ReadAt(fd, offset, kChunkHeader);
    if (chunk.size() < kChunkHeader) return {};
    const uint32_t size = Number(chunk, 4, big_endian);
    offset += kChunkHeader;
    if (chunk.compare(0, 4, audio_chunk) == 0) return CheckSize(size, file_size - offset);
    offset += static_cast<off_t>(size) + size % 2;
  }
  return {};
}

std::string CheckOgg(int fd, off_t file_size) {
  return FindOggTruncation(
      ReadAt(fd, std::max<off_t>(file_size - off_t{kOggTailBytes}, 0), kOggTailBytes));
}

// The size of the Ogg page at `offset`; npos when not even its table of segments is whole.
size_t OggPageSize(const std::string& bytes, size_t offset) {
  constexpr size_t kFixedHeader = 27;
  constexpr size_t kSegmentsOffset = 26;
  if (bytes.size() - offset < kFixedHeader) return std::string::npos;
  const size_t segments = static_cast<uint8_t>(bytes[offset + kSegmentsOffset]);
  size_t size = kFixedHeader + segments;
  if (bytes.size() - offset < size) return std::string::npos;
  for (size_t i = 0; i < segments; ++i) {
    size += static_cast<uint8_t>(bytes[offset + kFixedHeader + i]);
  }
  return size;
}

}  // namespace

std::string FindOggTruncation(const std::string& tail) {
  const char kCapture[] = "OggS";
  const size_t last = tail.rfind(kCapture);
  if (last == std::string::npos) return "truncated: its end is not that of an Ogg page";
  // The four letters may occur within a page, too: any page that ends with the file will do.
  for (size_t page = last; page != std::string::npos;
       page = page == 0 ? std::string::npos : tail.rfind(kCapture, page - 1)) {
    if (OggPageSize(tail, page) == tail.size() - page) return {};
  }
  const size_t size = OggPageSize(tail, last);
  if (size == std::string::npos || size > tail.size() - last) {
    return "truncated: its last Ogg page is cut off";
  }
  // What follows the last page is the beginning of another one, or none of the stream's.
  const std::string rest = tail.substr(last + size);
  const bool cut_page = rest.size() < 4 && std::string(kCapture).compare(0, rest.size(), rest) == 0;
  return cut_page ? "truncated: its last Ogg page is cut off" : "";
}

std::string FindTruncation(int fd) {
  struct stat status = {};
  const std::string head = ReadAt(fd, 0, 12);
  if (fstat(fd, &status) != 0 || head.size() < 12) return {};
  const std::string magic = head.substr(0, 4);
  if (magic == "RIFF") return CheckChunks(fd, status.st_size, "data", false);
  if (magic == "FORM") return CheckChunks(fd, status.st_size, "SSND", true);
  if (magic == "OggS") return CheckOgg(fd, status.st_size);
  if (magic == ".snd") {
    return CheckSize(Number(head, 8, true), status.st_size - Number(head, 4, true));
  }
  return FindMpegTruncation(fd);
}

}  // namespace qz::audio
