#pragma once

#include <optional>
#include <string>

#include "audio/audio_input.h"
#include "base/file_descriptor.h"

namespace qz::audio {

// Headerless 16-bit little-endian samples, handed on as they arrive.
class RawInput final : public AudioInput {
 public:
  // `name` stands for the file in messages.
  RawInput(std::string name, base::FileDescriptor file);

  size_t Read(int16_t* samples, size_t count) override;
  std::string Description() const override;
  uint64_t ExpectedSamples() const override { return expected_samples_; }

 private:
  std::string name_;
  base::FileDescriptor file_;
  uint64_t expected_samples_ = 0;
  uint64_t bytes_read_ = 0;
  std::optional<uint8_t> half_sample_;  // the first byte of a sample whose second is still to come
};

}  // namespace qz::audio
