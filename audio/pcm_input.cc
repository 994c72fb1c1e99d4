// SPDX-License-Identifier: Apache-2.0
#include "audio/pcm_input.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <utility>

#include "base/interrupt.h"

namespace qz::audio {
namespace {

// How many bytes follow in a regular file.
std::optional<uint64_t> BytesLeft(const base::FileDescriptor& file) {
  struct stat status = {};
  if (fstat(file.get(), &status) != 0 || !S_ISREG(status.st_mode)) return std::nullopt;
  const off_t offset = lseek(file.get(), 0, SEEK_CUR);
  return offset < 0 ? 0 : static_cast<uint64_t>(std::max<off_t>(status.st_size - offset, 0));
}

}  // namespace

PcmInput::PcmInput(Source source, const PcmFormat& format)
    : PcmInput(std::move(source), format, "", std::nullopt) {
  if (const auto left = BytesLeft(file_)) expected_bytes_ = held_ + *left;
}

PcmInput::PcmInput(Source source, const PcmFormat& format, std::string container,
                   std::optional<uint64_t> stated_bytes)
    : ConvertingInput(std::move(source.name)),
      file_(std::move(source.file)),
      format_(format),
      container_(std::move(container)),
      stated_bytes_(stated_bytes),
      expected_bytes_(stated_bytes) {
  SetFormat(format_.rate_hz, format_.channels);
  held_ = source.read_already.size();
  bytes_read_ = held_;
  bytes_.resize(std::max(kBlockFrames * format_.frame_bytes(), held_));
  std::copy(source.read_already.begin(), source.read_already.end(), bytes_.begin());
}

std::string PcmInput::Description() const {
  const std::string encoding = PcmEncodingName(format_);
  return DescriptionOf(container_.empty() ? "headerless " + encoding + ", " : "",
                       format_.kind == PcmKind::kSigned && format_.sample_bytes == 2);
}

uint64_t PcmInput::ExpectedSamples() const {
  return expected_bytes_ ? ConvertedCount(*expected_bytes_ / format_.frame_bytes()) : 0;
}

size_t PcmInput::Decode(float* frames, size_t max_frames) {
  const size_t frame_bytes = format_.frame_bytes();
  while (held_ < frame_bytes) {
    if (!ReadMore()) return 0;
  }
  const size_t count = std::min(max_frames, held_ / frame_bytes);
  DecodePcm(bytes_.data(), count * static_cast<size_t>(format_.channels), format_, frames);
  held_ -= count * frame_bytes;
  std::memmove(bytes_.data(), bytes_.data() + count * frame_bytes, held_);
  return count;
}

// Reads what is there, at least a byte; false at the end or after an interrupt.
bool PcmInput::ReadMore() {
  uint64_t wanted = bytes_.size() - held_;
  if (stated_bytes_) wanted = std::min(wanted, *stated_bytes_ - bytes_read_);
  if (wanted == 0) return false;
  while (base::WaitReadable(file_.get())) {
    const ssize_t got = read(file_.get(), bytes_.data() + held_, wanted);
    if (got < 0 && (errno == EINTR || errno == EAGAIN)) continue;
    if (got < 0) throw AudioError(name() + ": can't be read: " + std::strerror(errno));
    held_ += static_cast<size_t>(got);
    bytes_read_ += static_cast<uint64_t>(got);
    return got > 0;
  }
  interrupted_ = true;
  return false;
}

void PcmInput::CheckEnd() const {
  if (interrupted_) return;
  if (container_.empty()) {
    CheckHeaderlessEnd();
  } else if (stated_bytes_ && bytes_read_ < *stated_bytes_) {
    throw AudioError(Location() + "truncated: the header promises " +
                     std::to_string(*stated_bytes_) + " bytes of audio, the stream held " +
                     std::to_string(bytes_read_));
  } else if (frames_decoded() == 0) {
    throw AudioError(name() + ": no audio: 0 frames");
  }
}

void PcmInput::CheckHeaderlessEnd() const {
  if (bytes_read_ == 0) throw AudioError(name() + ": empty: 0 bytes");
  if (held_ == 0) return;
  const std::string unit = format_.channels == 1
                               ? "a " + std::to_string(8 * format_.sample_bytes) + "-bit sample"
                               : "a frame of " + std::to_string(format_.frame_bytes()) + " bytes";
  throw AudioError(name() + ": ends after " + std::to_string(bytes_read_) +
                   " bytes, in the middle of " + unit);
}

}  // namespace qz::audio
