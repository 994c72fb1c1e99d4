// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "audio/audio_input.h"
#include "audio/sample_converter.h"

namespace qz::audio {

// An input whose frames have any rate and channels: it decodes them in blocks, and they are
// converted here.
class ConvertingInput : public AudioInput {
 public:
  size_t Read(int16_t* samples, size_t count) final;

 protected:
  static constexpr size_t kBlockFrames = 4096;

  // `name` is the input's name in messages.
  explicit ConvertingInput(std::string name) : name_(std::move(name)) {}

  // To be called before Read. Throws AudioError for what is out of range.
  void SetFormat(int rate_hz, int channels);

  // Writes up to `max_frames` interleaved frames in full scale ±1 and gives their number; 0 at the
  // end or after an interrupt. Throws AudioError.
  virtual size_t Decode(float* frames, size_t max_frames) = 0;
  // Throws AudioError if the end came early. Called once, after the last sample was handed on.
  virtual void CheckEnd() const = 0;

  // "NAME: KIND16000 Hz, 1 channel, ..." `exact` if each sample has 16 bits or fewer.
  std::string DescriptionOf(const std::string& kind, bool exact) const;
  // How many samples come of that many frames.
  uint64_t ConvertedCount(uint64_t frames) const;
  // "NAME: frame N: ", where N frames have been decoded.
  std::string Location() const;

  const std::string& name() const { return name_; }
  uint64_t frames_decoded() const { return frames_decoded_; }

 private:
  void ConvertBlock();
  void CheckFinite(size_t frames) const;

  std::string name_;
  int rate_hz_ = 0;
  int channels_ = 0;
  std::unique_ptr<SampleConverter> converter_;
  std::vector<float> block_;        // frames as decoded
  std::vector<int16_t> converted_;  // the samples they gave,
  size_t converted_read_ = 0;       // and how many of them have been read
  uint64_t frames_decoded_ = 0;
  bool decoded_all_ = false;
  bool at_end_ = false;
};

}  // namespace qz::audio
