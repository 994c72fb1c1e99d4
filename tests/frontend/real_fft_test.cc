// SPDX-License-Identifier: Apache-2.0
// The real FFT against a DFT in double precision.

#include "frontend/real_fft.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "tests/support/random.h"

namespace qz::frontend {
namespace {

constexpr size_t kSamples = 400;
constexpr double kPi = 3.14159265358979323846;

// Of the frame padded to 512 samples, scaled as four stages by 8191/8192 and the split by
// 16383/16384 leave 1/512 of it.
std::complex<double> Bin(const std::vector<int16_t>& frame, size_t k) {
  std::complex<double> sum = 0;
  for (size_t n = 0; n < kSamples; ++n) {
    sum += std::polar<double>(frame[n], -2 * kPi * static_cast<double>(k * n % 512) / 512);
  }
  return sum / 512.0 * std::pow(8191.0 / 8192, 4) * (16383.0 / 16384);
}

double WorstError(const std::vector<int16_t>& frame) {
  std::vector<int16_t> spectrum(2 * (kFftEntries + 1));
  RealFft(frame.data(), spectrum.data());
  double worst = 0;
  for (size_t k = 0; k <= kFftEntries; ++k) {
    const std::complex<double> expected = Bin(frame, k);
    worst = std::max({worst, std::abs(spectrum[2 * k] - expected.real()),
                      std::abs(spectrum[2 * k + 1] - expected.imag())});
  }
  return worst;
}

// Each stage rounds, and its twiddles of 32767/32768 take off up to 2^-15 of what passes: most at
// the peak of a tone that fills bin 0 or 256.
TEST(RealFft, IsWithinFiveUnitsOfTheTransform) {
  test::Random random(1);
  for (int i = 0; i < 20; ++i) {
    EXPECT_LE(WorstError(random.Fill<int16_t>(kSamples, -23000, 23000)), 5) << "noise " << i;
  }
  for (const double bin : {0.0, 1.0, 40.5, 128.0, 200.25, 256.0}) {
    std::vector<int16_t> tone(kSamples);
    for (size_t n = 0; n < kSamples; ++n) {
      tone[n] =
          static_cast<int16_t>(23000 * std::cos(2 * kPi * bin * static_cast<double>(n) / 512));
    }
    EXPECT_LE(WorstError(tone), 5) << "tone at bin " << bin;
  }
}

}  // namespace
}  // namespace qz::frontend
