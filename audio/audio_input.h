// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "audio/pcm_format.h"
#include "base/error.h"

namespace qz::audio {

// The rate of everything that leaves an AudioInput, in Hz.
constexpr uint32_t kSampleRateHz = 16000;

// Audio that can't be used: one line that names the file, the location and the error.
class AudioError : public base::InputError {
 public:
  using base::InputError::InputError;
};

// A stream of 16-bit samples, mono at 16 kHz, in full scale ±32768. Memory does not grow with its
// length.
class AudioInput {
 public:
  virtual ~AudioInput() = default;

  // Writes up to `count` samples, which is at least 1, and gives their number: at least one, or 0
  // at the end or after an interrupt. Throws AudioError, if the input breaks off after all that is
  // there.
  virtual size_t Read(int16_t* samples, size_t count) = 0;

  // One line: the file, what it holds, and how it is converted.
  virtual std::string Description() const = 0;

  // How many samples there will be, as far as the header states it; 0 if it is unknown.
  virtual uint64_t ExpectedSamples() const = 0;
};

// Opens a file, or standard input for "-". `raw` is the format of headerless samples; without it
// the file is a container that libsndfile reads. Headerless samples, WAV and AU without compression
// are converted as they arrive. Anything else that is not a regular file is first copied to an
// unnamed temporary one, after a line to `notice`. Throws AudioError.
std::unique_ptr<AudioInput> OpenAudio(
    const std::string& path, const std::optional<PcmFormat>& raw = std::nullopt,
    const std::function<void(const std::string& line)>& notice = {});

}  // namespace qz::audio
