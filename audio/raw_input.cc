#include "audio/raw_input.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <utility>

#include "base/interrupt.h"

namespace qz::audio {

RawInput::RawInput(std::string name, base::FileDescriptor file)
    : name_(std::move(name)), file_(std::move(file)) {
  struct stat status = {};
  if (fstat(file_.get(), &status) == 0 && S_ISREG(status.st_mode)) {
    expected_samples_ = static_cast<uint64_t>(status.st_size) / sizeof(int16_t);
  }
}

std::string RawInput::Description() const {
  return name_ + ": headerless 16-bit little-endian, 16000 Hz, 1 channel, taken as it is";
}

size_t RawInput::Read(int16_t* samples, size_t count) {
  auto* bytes = reinterpret_cast<uint8_t*>(samples);
  while (base::WaitReadable(file_.get())) {
    size_t held = 0;
    if (half_sample_) bytes[held++] = *half_sample_;
    const ssize_t got = read(file_.get(), bytes + held, count * sizeof(int16_t) - held);
    if (got < 0 && (errno == EINTR || errno == EAGAIN)) continue;
    if (got < 0) throw AudioError(name_ + ": can't be read: " + std::strerror(errno));
    bytes_read_ += static_cast<uint64_t>(got);
    if (got == 0) {
      if (bytes_read_ == 0) throw AudioError(name_ + ": empty: 0 bytes");
      if (half_sample_) {
        throw AudioError(name_ + ": ends after " + std::to_string(bytes_read_) +
                         " bytes, in the middle of a 16-bit sample");
      }
      return 0;
    }
    held += static_cast<size_t>(got);
    half_sample_.reset();
    if (held % 2 != 0) half_sample_ = bytes[held - 1];
    if (held >= 2) return held / 2;
  }
  return 0;
}

}  // namespace qz::audio
