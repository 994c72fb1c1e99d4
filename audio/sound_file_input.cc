// SPDX-License-Identifier: Apache-2.0
#include "audio/sound_file_input.h"

#include <algorithm>
#include <utility>

#include "audio/truncation.h"

namespace qz::audio {
namespace {

// libsndfile's messages may begin with "Error : ", span lines and end in a dot.
std::string OneLine(std::string text) {
  const std::string prefix = "Error : ";
  if (text.compare(0, prefix.size(), prefix) == 0) text.erase(0, prefix.size());
  std::replace(text.begin(), text.end(), '\n', ' ');
  while (!text.empty() && (text.back() == ' ' || text.back() == '.')) text.pop_back();
  return text;
}

}  // namespace

SoundFileInput::SoundFileInput(std::string name, base::FileDescriptor file)
    : ConvertingInput(std::move(name)),
      file_(std::move(file)),
      truncation_(FindTruncation(file_.get())),
      sound_file_(sf_open_fd(file_.get(), SFM_READ, &info_, SF_FALSE)) {
  if (sound_file_ == nullptr) {
    const std::string error = OneLine(sf_strerror(nullptr));
    throw AudioError(this->name() + (truncation_.empty() ? ": not a readable sound file: " + error
                                                         : ": no audio: " + truncation_));
  }
  SetFormat(info_.samplerate, info_.channels);
  if (info_.frames == 0) {
    throw AudioError(this->name() +
                     ": no audio: " + (truncation_.empty() ? "0 frames" : truncation_));
  }
}

std::string SoundFileInput::Description() const {
  return DescriptionOf("", (info_.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16);
}

uint64_t SoundFileInput::ExpectedSamples() const {
  return LengthKnown() ? ConvertedCount(static_cast<uint64_t>(info_.frames)) : 0;
}

size_t SoundFileInput::Decode(float* frames, size_t max_frames) {
  const sf_count_t got =
      sf_readf_float(sound_file_.get(), frames, static_cast<sf_count_t>(max_frames));
  return static_cast<size_t>(std::max<sf_count_t>(got, 0));
}

void SoundFileInput::CheckEnd() const {
  if (sf_error(sound_file_.get()) != SF_ERR_NO_ERROR) {
    throw AudioError(Location() + "corrupt: " + OneLine(sf_strerror(sound_file_.get())));
  }
  // The length of an MPEG stream is an estimate.
  const bool exact = LengthKnown() && (info_.format & SF_FORMAT_TYPEMASK) != SF_FORMAT_MPEG;
  if (frames_decoded() == 0 || (exact && frames_decoded() < static_cast<uint64_t>(info_.frames))) {
    throw AudioError(Location() +
                     "truncated or corrupt: the audio ends here, the header promises " +
                     std::to_string(info_.frames) + " frames");
  }
  if (!truncation_.empty()) throw AudioError(Location() + truncation_);
}

}  // namespace qz::audio
