#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

#include "base/error.h"

namespace qz::audio {

// The rate of everything that leaves an AudioInput, in Hz.
constexpr uint32_t kSampleRateHz = 16000;

// Audio that can't be used: one line that names the file, the place and what is wrong.
class AudioError : public base::InputError {
 public:
  using base::InputError::InputError;
};

// A stream of 16-bit samples, mono at 16 kHz, in full scale ±32768. Memory does not grow with its
// length.
class AudioInput {
 public:
  virtual ~AudioInput() = default;

  // Fills in up to `count` samples and returns how many: at least one, or 0 at the end or after an
  // interrupt. Throws AudioError. `count` is at least 1.
  virtual size_t Read(int16_t* samples, size_t count) = 0;

  // One sentence: the file, what it holds, and what is done to it.
  virtual std::string Description() const = 0;

  // How many samples there will be, as far as the header can tell; 0 if nobody knows.
  virtual uint64_t ExpectedSamples() const = 0;
};

// Opens a file, or standard input for "-". `raw` is headerless 16-bit little-endian mono at 16 kHz
// and streams as it arrives; anything else must be a container that libsndfile knows, and what is
// not a regular file is first copied to an unnamed temporary one. Throws AudioError.
std::unique_ptr<AudioInput> OpenAudio(const std::string& path, bool raw);

}  // namespace qz::audio
