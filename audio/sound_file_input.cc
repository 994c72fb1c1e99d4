#include "audio/sound_file_input.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "audio/truncation.h"

namespace qz::audio {
namespace {

constexpr int kMinRateHz = 1000;
constexpr int kMaxRateHz = 768000;
constexpr int kMaxChannels = 64;
constexpr size_t kBlockFrames = 4096;

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
    : name_(std::move(name)), file_(std::move(file)) {
  truncation_ = FindTruncation(file_.get());
  sound_file_.reset(sf_open_fd(file_.get(), SFM_READ, &info_, SF_FALSE));
  if (sound_file_ == nullptr) {
    if (!truncation_.empty()) throw AudioError(name_ + ": no audio: " + truncation_);
    throw AudioError(name_ + ": not a readable sound file: " + OneLine(sf_strerror(nullptr)));
  }
  CheckHeader();
  converter_ = std::make_unique<SampleConverter>(info_.samplerate, info_.channels);
  block_.resize(kBlockFrames * static_cast<size_t>(info_.channels));
}

void SoundFileInput::CheckHeader() const {
  if (info_.samplerate < kMinRateHz || info_.samplerate > kMaxRateHz) {
    throw AudioError(name_ + ": the sample rate is " + std::to_string(info_.samplerate) +
                     " Hz, should be " + std::to_string(kMinRateHz) + " to " +
                     std::to_string(kMaxRateHz));
  }
  if (info_.channels < 1 || info_.channels > kMaxChannels) {
    throw AudioError(name_ + ": " + std::to_string(info_.channels) + " channels, should be 1 to " +
                     std::to_string(kMaxChannels));
  }
  if (info_.frames == 0) {
    throw AudioError(name_ + ": no audio: " + (truncation_.empty() ? "0 frames" : truncation_));
  }
}

std::string SoundFileInput::Description() const {
  const bool mix = info_.channels > 1;
  const bool resample = info_.samplerate != static_cast<int>(kSampleRateHz);
  std::string text = name_ + ": " + std::to_string(info_.samplerate) + " Hz, " +
                     std::to_string(info_.channels) + (mix ? " channels, " : " channel, ");
  if (mix) text += resample ? "mixed down and " : "mixed down to mono";
  if (resample) text += "resampled to 16000 Hz mono";
  if (!mix && !resample) {
    text += TakenAsItIs() ? "16 bits, taken as it is" : "rounded to 16 bits";
  }
  return text;
}

uint64_t SoundFileInput::ExpectedSamples() const {
  if (!LengthKnown()) return 0;
  return static_cast<uint64_t>(
      std::ceil(static_cast<double>(info_.frames) * kSampleRateHz / info_.samplerate));
}

bool SoundFileInput::TakenAsItIs() const {
  return info_.samplerate == static_cast<int>(kSampleRateHz) && info_.channels == 1 &&
         (info_.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16;
}

size_t SoundFileInput::Read(int16_t* samples, size_t count) {
  while (converted_read_ == converted_.size()) {
    if (at_end_) return 0;
    ConvertBlock();
  }
  const size_t given = std::min(count, converted_.size() - converted_read_);
  std::copy_n(converted_.data() + converted_read_, given, samples);
  converted_read_ += given;
  return given;
}

void SoundFileInput::ConvertBlock() {
  converted_.clear();
  converted_read_ = 0;
  const sf_count_t got = TakenAsItIs() ? ReadBlock() : ReadAndConvertBlock();
  if (got > 0) {
    frames_decoded_ += got;
  } else {
    CheckEnd();
    converter_->Flush(&converted_);
    at_end_ = true;
  }
}

sf_count_t SoundFileInput::ReadBlock() {
  converted_.resize(kBlockFrames);
  const sf_count_t got = sf_readf_short(sound_file_.get(), converted_.data(), kBlockFrames);
  converted_.resize(static_cast<size_t>(std::max<sf_count_t>(got, 0)));
  return got;
}

sf_count_t SoundFileInput::ReadAndConvertBlock() {
  const sf_count_t got = sf_readf_float(sound_file_.get(), block_.data(), kBlockFrames);
  if (got > 0) {
    CheckFinite(static_cast<size_t>(got));
    converter_->Convert(block_.data(), static_cast<size_t>(got), &converted_);
  }
  return got;
}

void SoundFileInput::CheckFinite(size_t frames) const {
  const auto channels = static_cast<size_t>(info_.channels);
  // Counted before any is looked for: a loop that runs to its end takes vector instructions.
  uint32_t wrong = 0;
  for (size_t i = 0; i < frames * channels; ++i) wrong += std::isfinite(block_[i]) ? 0 : 1;
  if (wrong == 0) return;
  size_t i = 0;
  while (std::isfinite(block_[i])) ++i;
  throw AudioError(name_ + ": frame " +
                   std::to_string(static_cast<size_t>(frames_decoded_) + i / channels) +
                   ", channel " + std::to_string(i % channels) + ": the sample is " +
                   (std::isnan(block_[i]) ? "not a number" : "infinite"));
}

void SoundFileInput::CheckEnd() const {
  const std::string location = name_ + ": frame " + std::to_string(frames_decoded_) + ": ";
  if (sf_error(sound_file_.get()) != SF_ERR_NO_ERROR) {
    throw AudioError(location + "corrupt: " + OneLine(sf_strerror(sound_file_.get())));
  }
  // The length of an MPEG stream is an estimate.
  const bool exact = LengthKnown() && (info_.format & SF_FORMAT_TYPEMASK) != SF_FORMAT_MPEG;
  if (frames_decoded_ == 0 || (exact && frames_decoded_ < info_.frames)) {
    throw AudioError(location + "truncated or corrupt: the audio ends here, the header promises " +
                     std::to_string(info_.frames) + " frames");
  }
  if (!truncation_.empty()) throw AudioError(location + truncation_);
}

}  // namespace qz::audio
