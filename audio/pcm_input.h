// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "audio/converting_input.h"
#include "audio/pcm_format.h"
#include "base/file_descriptor.h"

namespace qz::audio {

// A file or stream of samples without compression, behind a header or without one, converted as
// they arrive.
class PcmInput final : public ConvertingInput {
 public:
  struct Source {
    std::string name;
    base::FileDescriptor file;
    std::string read_already;  // what was read from `file` before, from the first sample on
  };

  // Headerless samples, to the end of the file. Throws AudioError.
  PcmInput(Source source, const PcmFormat& format);
  // The samples behind a header of the kind `container`, which states their bytes, or nothing if
  // they go on until the end. Throws AudioError.
  PcmInput(Source source, const PcmFormat& format, std::string container,
           std::optional<uint64_t> stated_bytes);

  std::string Description() const override;
  uint64_t ExpectedSamples() const override;

 protected:
  size_t Decode(float* frames, size_t max_frames) override;
  void CheckEnd() const override;

 private:
  bool ReadMore();
  void CheckHeaderlessEnd() const;

  base::FileDescriptor file_;
  PcmFormat format_;
  std::string container_;  // empty if there is no header
  std::optional<uint64_t> stated_bytes_;
  std::optional<uint64_t> expected_bytes_;
  std::vector<uint8_t> bytes_;  // a block; the first `held_` bytes are still to be decoded
  size_t held_ = 0;
  uint64_t bytes_read_ = 0;
  bool interrupted_ = false;
};

}  // namespace qz::audio
