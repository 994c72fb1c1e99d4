// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <soxr.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace qz::audio {

// Turns frames of any rate and channel count into 16-bit mono samples at 16 kHz: channels are
// averaged, other rates resampled (band-limited, linear phase, no delay), values rounded to the
// nearest (ties to even) and saturated. A frame at 16 kHz, mono, with n / 32768 gives exactly n.
class SampleConverter {
 public:
  // Both within the limits of pcm_format.h.
  SampleConverter(int rate_hz, int channels);

  // Appends to `*samples` what `count` interleaved frames (finite, full scale ±1) give so far.
  void Convert(const float* frames, size_t count, std::vector<int16_t>* samples);
  // Appends what the resampler still holds. Nothing may be converted afterwards.
  void Flush(std::vector<int16_t>* samples);

 private:
  struct DeleteResampler {
    void operator()(soxr_t resampler) const { soxr_delete(resampler); }
  };

  void Resample(const float* mono, size_t count, std::vector<int16_t>* samples);

  size_t channels_;
  std::unique_ptr<soxr, DeleteResampler> resampler_;  // null at 16 kHz
  std::vector<float> mono_;
  std::vector<float> resampled_;
};

}  // namespace qz::audio
