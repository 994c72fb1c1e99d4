#include "audio/truncation.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>

namespace qz::audio {
namespace {

// Programs that write to a pipe state a size near 2^31 or 2^32 for "until the end".
constexpr uint32_t kUntilTheEnd = 0x7FFF0000;

std::string ReadAt(int fd, off_t location, size_t count) {
  std::string bytes(count, '\0');
  const ssize_t got = pread(fd, bytes.data(), count, location);
  bytes.resize(got > 0 ? static_cast<size_t>(got) : 0);
  return bytes;
}

// Four bytes of `bytes` as a number.
uint32_t Number(const std::string& bytes, size_t location, bool big_endian) {
  uint32_t number = 0;
  for (size_t i = 0; i < 4; ++i) {
    const size_t from = big_endian ? i : 3 - i;
    number = number << 8 | static_cast<uint8_t>(bytes[location + from]);
  }
  return number;
}

std::string CheckSize(uint32_t stated, off_t there) {
  if (stated >= kUntilTheEnd || there >= static_cast<off_t>(stated)) return {};
  return "truncated: the header promises " + std::to_string(stated) +
         " bytes of audio, the file holds " + std::to_string(std::max<off_t>(there, 0));
}

// Walks the chunks up to the one that holds the audio.
std::string CheckChunks(int fd, off_t file_size, const char* audio_chunk, bool big_endian) {
  constexpr size_t kChunkHeader = 8;
  off_t location = 12;
  while (true) {
    const std::string chunk = ReadAt(fd, location, kChunkHeader);
    if (chunk.size() < kChunkHeader) return {};
    const uint32_t size = Number(chunk, 4, big_endian);
    location += kChunkHeader;
    if (chunk.compare(0, 4, audio_chunk) == 0) return CheckSize(size, file_size - location);
    location += static_cast<off_t>(size) + size % 2;
  }
}

std::string CheckLastOggPage(int fd, off_t file_size) {
  constexpr off_t kMaxPage = 27 + 255 + 255 * 255;
  constexpr size_t kFlagsOffset = 5;
  constexpr char kLastPage = 4;
  const off_t start = std::max<off_t>(file_size - kMaxPage, 0);
  const std::string end = ReadAt(fd, start, kMaxPage);
  const size_t page = end.rfind("OggS");
  if (page == std::string::npos || page + kFlagsOffset >= end.size() ||
      (end[page + kFlagsOffset] & kLastPage) == 0) {
    return "truncated: the page that ends the stream is missing";
  }
  return {};
}

}  // namespace

std::string FindTruncation(int fd) {
  struct stat status = {};
  const std::string head = ReadAt(fd, 0, 12);
  if (fstat(fd, &status) != 0 || head.size() < 12) return {};
  const std::string magic = head.substr(0, 4);
  if (magic == "RIFF") return CheckChunks(fd, status.st_size, "data", false);
  if (magic == "FORM") return CheckChunks(fd, status.st_size, "SSND", true);
  if (magic == "OggS") return CheckLastOggPage(fd, status.st_size);
  if (magic == ".snd") {
    return CheckSize(Number(head, 8, true), status.st_size - Number(head, 4, true));
  }
  return {};
}

}  // namespace qz::audio
