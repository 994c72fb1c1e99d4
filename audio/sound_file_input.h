// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sndfile.h>

#include <memory>
#include <string>

#include "audio/converting_input.h"
#include "base/file_descriptor.h"

namespace qz::audio {

// A sound file in any container that libsndfile knows, recognised by its contents. One that was cut
// off gives what is there, and then the error.
class SoundFileInput final : public ConvertingInput {
 public:
  // `name` is the file's name in messages; `file` is seekable and at its beginning. Throws
  // AudioError.
  SoundFileInput(std::string name, base::FileDescriptor file);

  std::string Description() const override;
  uint64_t ExpectedSamples() const override;

 protected:
  size_t Decode(float* frames, size_t max_frames) override;
  void CheckEnd() const override;

 private:
  struct CloseSoundFile {
    void operator()(SNDFILE* file) const { sf_close(file); }
  };

  bool LengthKnown() const { return info_.frames < SF_COUNT_MAX; }

  base::FileDescriptor file_;
  std::string truncation_;  // what shows that the file was cut off; empty if nothing does
  SF_INFO info_ = {};
  std::unique_ptr<SNDFILE, CloseSoundFile> sound_file_;
};

}  // namespace qz::audio
