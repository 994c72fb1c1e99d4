#pragma once

#include <sndfile.h>

#include <memory>
#include <string>
#include <vector>

#include "audio/audio_input.h"
#include "audio/sample_converter.h"
#include "base/file_descriptor.h"

namespace qz::audio {

// A sound file in any container that libsndfile knows, recognised by its contents. One that was cut
// off gives what is there, and then the error.
class SoundFileInput final : public AudioInput {
 public:
  // `name` is the file's name in messages; `file` is seekable and at its beginning. Throws
  // AudioError.
  SoundFileInput(std::string name, base::FileDescriptor file);

  size_t Read(int16_t* samples, size_t count) override;
  std::string Description() const override;
  uint64_t ExpectedSamples() const override;

 private:
  struct CloseSoundFile {
    void operator()(SNDFILE* file) const { sf_close(file); }
  };

  void CheckHeader() const;
  bool TakenAsItIs() const;
  void ConvertBlock();
  sf_count_t ReadBlock();
  sf_count_t ReadAndConvertBlock();
  void CheckFinite(size_t frames) const;
  void CheckEnd() const;
  bool LengthKnown() const { return info_.frames < SF_COUNT_MAX; }

  std::string name_;
  base::FileDescriptor file_;
  std::string truncation_;  // what shows that the file was cut off; empty if nothing does
  SF_INFO info_ = {};
  std::unique_ptr<SNDFILE, CloseSoundFile> sound_file_;
  std::unique_ptr<SampleConverter> converter_;
  std::vector<float> block_;        // frames as decoded
  std::vector<int16_t> converted_;  // what came of them,
  size_t converted_read_ = 0;       // and how much of that has been read
  sf_count_t frames_decoded_ = 0;
  bool at_end_ = false;
};

}  // namespace qz::audio
