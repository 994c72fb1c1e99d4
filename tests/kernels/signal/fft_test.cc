// The FFT's steps against recorded results on data that wraps, and the whole 512-point real FFT
// against a double-precision DFT.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "random.h"
#include "signal_kernels.h"

namespace {

using Samples = std::vector<int16_t>;

constexpr double kPi = 3.14159265358979323846;

using Step = void(size_t units, size_t quarter_bytes, int16_t* data, const int16_t* twiddles,
                  size_t twiddle_stride);

void Split(size_t units, size_t, int16_t* data, const int16_t* twiddles, size_t) {
  orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(units, data, twiddles);
}

// 64-bit FNV-1a of a step's result on random values, most of them at an extreme, and of what lies
// behind.
uint64_t DigestOf(Step* step, uint64_t seed, size_t units, size_t quarter_bytes) {
  qz::test::Random random(seed);
  Samples data = random.Fill<int16_t>(2 * (260 + 256), -32768, 32767);
  for (int16_t& x : data) {
    if (random.Next() % 8) x = random.Next() % 2 ? 32767 : -32768;
  }
  step(units, quarter_bytes, &data[0], &data[2 * 260], 12);
  uint64_t digest = 0xCBF29CE484222325u;
  for (int16_t x : data) digest = (digest ^ static_cast<uint16_t>(x)) * 0x100000001B3u;
  return digest;
}

// Sums of the twiddled butterflies wrap here; those of the others cannot leave 16 bits. Recorded
// from a separate computation of the formulas.
TEST(FftSteps, KeepEveryBit) {
  EXPECT_EQ(DigestOf(orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4, 1, 64, 0),
            0x01B5848D9640B760u);
  EXPECT_EQ(DigestOf(orra_cs16_bfly4_samples4_ukernel__neon, 2, 16, 16), 0x39FB3250E7417A53u);
  EXPECT_EQ(DigestOf(orra_cs16_bfly4_ukernel__neon_x4, 3, 4, 64), 0xF387B9D3825BDC80u);
  EXPECT_EQ(DigestOf(Split, 4, 256, 0), 0x62FB39AB15DE65B8u);
}

int16_t ToQ15(double x) { return static_cast<int16_t>(std::lround(32767 * x)); }

Samples RealFft(const Samples& x) {
  Samples twiddles, split, data(2 * 257);
  for (int k = 0; k < 256; ++k) {
    const double angle = 2 * kPi * k / 256, half = kPi * (k + 1) / 256;
    twiddles.insert(twiddles.end(), {ToQ15(std::cos(angle)), ToQ15(-std::sin(angle))});
    split.insert(split.end(), {ToQ15(-std::sin(half)), ToQ15(-std::cos(half))});
    const size_t reversed = k % 4 * 64 + k / 4 % 4 * 16 + k / 16 % 4 * 4 + k / 64;
    std::copy_n(&x[2 * reversed], 2, &data[2 * k]);
  }
  orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4(64, 0, data.data(), nullptr, 0);
  orra_cs16_bfly4_samples4_ukernel__neon(16, 16, data.data(), nullptr, 0);
  orra_cs16_bfly4_ukernel__neon_x4(4, 64, data.data(), twiddles.data(), 16);
  orra_cs16_bfly4_ukernel__neon_x4(1, 256, data.data(), twiddles.data(), 4);
  orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(256, data.data(), split.data());
  return data;
}

TEST(RealFft, StaysCloseToTheDft) {
  // Just under 1/4 four times, just under 1/2 once.
  const double scale = std::pow(8191.0 / 32768, 4) * (16383.0 / 32768);
  qz::test::Random random(3);
  std::vector<Samples> frames = {random.Fill<int16_t>(512, -32768, 32767),
                                 random.Fill<int16_t>(512, -200, 200),
                                 Samples(512, 20000),
                                 Samples(512),
                                 {}};
  frames[3][77] = -32768;
  for (int n = 0; n < 512; ++n) frames[4].push_back(ToQ15(0.7 * std::cos(2.3 * n + 1)));
  for (const Samples& x : frames) {
    const Samples spectrum = RealFft(x);
    for (size_t k = 0; k <= 256; ++k) {
      std::complex<double> exact;
      for (size_t n = 0; n < 512; ++n) {
        exact += std::polar(scale * x[n], -2 * kPi * static_cast<double>(k * n % 512) / 512);
      }
      const std::complex<double> bin(spectrum[2 * k], spectrum[2 * k + 1]);
      // A few units of rounding, which the last stages add, and what adds up in one direction where
      // one bin holds everything: equal roundings of equal parts, and 32767 in place of 32768.
      ASSERT_LT(std::abs(bin - exact), 4 + std::abs(exact) / 4096) << &x - &frames[0] << ' ' << k;
    }
  }
}

}  // namespace
