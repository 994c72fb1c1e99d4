// SPDX-License-Identifier: Apache-2.0
#include "audio/converting_input.h"

#include <algorithm>
#include <cmath>

namespace qz::audio {
void ConvertingInput::SetFormat(int rate_hz, int channels) {
  if (rate_hz < kMinRateHz || rate_hz > kMaxRateHz) {
    throw AudioError(name_ + ": the sample rate is " + std::to_string(rate_hz) + " Hz, expected " +
                     std::to_string(kMinRateHz) + " to " + std::to_string(kMaxRateHz));
  }
  if (channels < 1 || channels > kMaxChannels) {
    throw AudioError(name_ + ": " + std::to_string(channels) + " channels, expected 1 to " +
                     std::to_string(kMaxChannels));
  }
  rate_hz_ = rate_hz;
  channels_ = channels;
  converter_ = std::make_unique<SampleConverter>(rate_hz, channels);
  block_.resize(kBlockFrames * static_cast<size_t>(channels));
}

size_t ConvertingInput::Read(int16_t* samples, size_t count) {
  while (converted_read_ == converted_.size()) {
    if (at_end_) return 0;
    ConvertBlock();
  }
  const size_t given = std::min(count, converted_.size() - converted_read_);
  std::copy_n(converted_.data() + converted_read_, given, samples);
  converted_read_ += given;
  return given;
}

void ConvertingInput::ConvertBlock() {
  converted_.clear();
  converted_read_ = 0;
  if (decoded_all_) {
    at_end_ = true;
    CheckEnd();
    return;
  }
  const size_t got = Decode(block_.data(), kBlockFrames);
  if (got == 0) {
    decoded_all_ = true;
    converter_->Flush(&converted_);
    return;
  }
  CheckFinite(got);
  converter_->Convert(block_.data(), got, &converted_);
  frames_decoded_ += got;
}

void ConvertingInput::CheckFinite(size_t frames) const {
  const auto channels = static_cast<size_t>(channels_);
  // Counted before any is looked for: a loop that runs to its end takes vector instructions.
  uint32_t not_finite = 0;
  for (size_t i = 0; i < frames * channels; ++i) not_finite += std::isfinite(block_[i]) ? 0 : 1;
  if (not_finite == 0) return;
  size_t i = 0;
  while (std::isfinite(block_[i])) ++i;
  throw AudioError(name_ + ": frame " + std::to_string(frames_decoded_ + i / channels) +
                   ", channel " + std::to_string(i % channels) + ": the sample is " +
                   (std::isnan(block_[i]) ? "not a number" : "infinite"));
}

std::string ConvertingInput::DescriptionOf(const std::string& kind, bool exact) const {
  const bool mix = channels_ > 1;
  const bool resample = rate_hz_ != static_cast<int>(kSampleRateHz);
  std::string text = name_ + ": " + kind + std::to_string(rate_hz_) + " Hz, " +
                     std::to_string(channels_) + (mix ? " channels, " : " channel, ");
  if (mix) text += resample ? "mixed down and " : "mixed down to mono";
  if (resample) text += "resampled to 16000 Hz mono";
  if (!mix && !resample) text += exact ? "16 bits, taken as it is" : "rounded to 16 bits";
  return text;
}

uint64_t ConvertingInput::ConvertedCount(uint64_t frames) const {
  return static_cast<uint64_t>(
      std::ceil(static_cast<double>(frames) * kSampleRateHz / static_cast<double>(rate_hz_)));
}

std::string ConvertingInput::Location() const {
  return name_ + ": frame " + std::to_string(frames_decoded_) + ": ";
}

}  // namespace qz::audio
