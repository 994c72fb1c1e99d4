// SPDX-License-Identifier: Apache-2.0
#include "audio/sample_converter.h"

#include <algorithm>
#include <stdexcept>
#include <string>

#include "audio/audio_input.h"

namespace qz::audio {
namespace {

constexpr size_t kResampledBlock = 8192;

// Far beyond what saturates, near enough that no sum of the resampler overflows.
constexpr double kMaxMono = 1e6;

// Floats of this size have no bits below 1: adding it rounds what is below 2^22 to the nearest
// number, ties to even.
constexpr float kRounder = 3 << 22;

// Appends to `*samples`; the values are lost.
void Quantise(float* values, size_t count, std::vector<int16_t>* samples) {
  const size_t held = samples->size();
  samples->resize(held + count);
  int16_t* quantised = samples->data() + held;
  // In two loops, which compilers turn into vector instructions; in one, g++ makes branches.
  for (size_t i = 0; i < count; ++i) {
    values[i] = std::clamp(values[i] * 32768.0f, -32768.0f, 32767.0f);
  }
  for (size_t i = 0; i < count; ++i) {
    quantised[i] = static_cast<int16_t>((values[i] + kRounder) - kRounder);
  }
}

void CheckResampler(soxr_error_t error) {
  if (error != nullptr) throw std::runtime_error(std::string("the resampler failed: ") + error);
}

}  // namespace

SampleConverter::SampleConverter(int rate_hz, int channels)
    : channels_(static_cast<size_t>(channels)) {
  if (rate_hz == static_cast<int>(kSampleRateHz)) return;
  const soxr_io_spec_t io = soxr_io_spec(SOXR_FLOAT32_I, SOXR_FLOAT32_I);
  const soxr_quality_spec_t quality = soxr_quality_spec(SOXR_HQ, 0);
  const soxr_runtime_spec_t runtime = soxr_runtime_spec(1);
  soxr_error_t error = nullptr;
  resampler_.reset(soxr_create(rate_hz, kSampleRateHz, 1, &error, &io, &quality, &runtime));
  CheckResampler(error);
  resampled_.resize(kResampledBlock);
}

void SampleConverter::Convert(const float* frames, size_t count, std::vector<int16_t>* samples) {
  mono_.resize(count);
  for (size_t i = 0; i < count; ++i) {
    double sum = 0;
    for (size_t channel = 0; channel < channels_; ++channel) sum += frames[i * channels_ + channel];
    mono_[i] =
        static_cast<float>(std::clamp(sum / static_cast<double>(channels_), -kMaxMono, kMaxMono));
  }
  if (resampler_ == nullptr) {
    Quantise(mono_.data(), count, samples);
  } else if (count > 0) {
    Resample(mono_.data(), count, samples);
  }
}

void SampleConverter::Flush(std::vector<int16_t>* samples) {
  if (resampler_ != nullptr) Resample(nullptr, 0, samples);
}

void SampleConverter::Resample(const float* mono, size_t count, std::vector<int16_t>* samples) {
  size_t taken = 0;
  size_t given = 0;
  do {
    size_t used = 0;
    CheckResampler(soxr_process(resampler_.get(), mono == nullptr ? nullptr : mono + taken,
                                count - taken, &used, resampled_.data(), resampled_.size(),
                                &given));
    taken += used;
    Quantise(resampled_.data(), given, samples);
  } while (taken < count || given == resampled_.size());
}

}  // namespace qz::audio
