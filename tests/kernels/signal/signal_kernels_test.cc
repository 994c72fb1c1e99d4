// SPDX-License-Identifier: Apache-2.0
// The kernels in the order of the front end. A 99 behind an output is a guard.

#include "kernels/signal/signal_kernels.h"

#include <gmock/gmock.h>

#include <cmath>
#include <numeric>
#include <vector>

#include "tests/support/random.h"

namespace {

using testing::ElementsAre;
using Samples = std::vector<int16_t>;
using Words = std::vector<uint32_t>;

// 64-bit FNV-1a. Expected digests were recorded from a separate computation of the formulas.
constexpr uint64_t kNoDigest = 0xCBF29CE484222325u;
uint64_t Digest(uint64_t before, int value) {
  return (before ^ static_cast<uint16_t>(value)) * 0x100000001B3u;
}

TEST(Window, WeighsEveryRowRoundsDownAndSaturates) {
  const Samples weights = {4096, 8192, 8192, -4096, 1, 4095};
  const Samples input = {32767, 32767, -32768, -32768, -1, -3, 1, 3, -3, 5, 4095, 3};
  Samples output(13, 99);
  orra_s16_window_shift12_ukernel__neon_x32(2, 12, input.data(), weights.data(), output.data(), 3);
  EXPECT_THAT(output, ElementsAre(32767, 32767, -32768, 32767, -1, -3, 1, 6, -6, -5, 0, 2, 99));
}

TEST(Peak, IsTheLargestMagnitudeUpToTheLastSample) {
  for (int16_t extreme : {-32768, -101, 101, 0}) {
    const Samples samples = {0, static_cast<int16_t>(extreme / 2), extreme};
    uint16_t peak = 7;
    orra_s16_rmaxabs_ukernel__neon_x32(6, samples.data(), &peak);
    EXPECT_EQ(peak, std::abs(extreme));
  }
}

TEST(LeftShift, WrapsAndWorksDownwardsInItsOwnInput) {
  const Samples input = qz::test::Random(1).Fill<int16_t>(37, -32768, 32767);
  for (uint32_t shift : {0, 1, 15, 16, 40}) {
    Samples data = input, expected = input;
    for (size_t i = 0; i < 36; ++i) {
      expected[i] = static_cast<int16_t>(shift < 16 ? input[i + 1] * (1 << shift) : 0);
    }
    orra_i16_vlshift_ukernel__neon_x32(36, &data[1], &data[0], shift);
    EXPECT_EQ(data, expected) << shift;
  }
}

TEST(FftLoad, ReversesTheDigitsOfTheIndexAndPadsWithZeros) {
  Samples input(2 * 200), output(2 * 256 + 1, 99);
  std::iota(input.begin(), input.end(), int16_t{1});
  orra_cs16_digitreverse_ukernel__neon_x16(200, input.data(), output.data());
  for (int i = 0; i < 256; ++i) {
    const int r = i % 4 * 64 + i / 4 % 4 * 16 + i / 16 % 4 * 4 + i / 64;
    EXPECT_EQ(output[2 * i], r < 200 ? 2 * r + 1 : 0) << i;
    EXPECT_EQ(output[2 * i + 1], r < 200 ? 2 * r + 2 : 0) << i;
  }
  EXPECT_EQ(output[512], 99);
}

using Step = decltype(orra_cs16_bfly4_ukernel__neon_x4);

void Split(size_t units, size_t, int16_t* data, const int16_t* twiddles, size_t) {
  orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(units, data, twiddles);
}

// Of a step's result on random values, most of them at an extreme, and of what lies behind.
uint64_t DigestOf(Step* step, uint64_t seed, size_t units, size_t quarter_bytes) {
  qz::test::Random random(seed);
  Samples data = random.Fill<int16_t>(2 * (260 + 256), -32768, 32767);
  for (int16_t& x : data) {
    if (random.Next() % 8) x = random.Next() % 2 ? 32767 : -32768;
  }
  step(units, quarter_bytes, &data[0], &data[2 * 260], 12);
  return std::accumulate(data.begin(), data.end(), kNoDigest, Digest);
}

// Sums of the twiddled butterflies wrap here; those of the others cannot leave 16 bits.
TEST(FftSteps, KeepEveryBit) {
  EXPECT_EQ(DigestOf(orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4, 1, 64, 0),
            0x01B5848D9640B760u);
  EXPECT_EQ(DigestOf(orra_cs16_bfly4_samples4_ukernel__neon, 2, 16, 16), 0x39FB3250E7417A53u);
  EXPECT_EQ(DigestOf(orra_cs16_bfly4_ukernel__neon_x4, 3, 4, 64), 0xF387B9D3825BDC80u);
  EXPECT_EQ(DigestOf(Split, 4, 256, 0), 0x62FB39AB15DE65B8u);
}

TEST(Power, IsExactUpToItsLargestValue) {
  const Samples input = {-32768, -32768, 32767, -32768, 0, 0, -1, 2, 300, -400};
  Words output(6, 99);
  orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8(20, input.data(), output.data());
  EXPECT_THAT(output, ElementsAre(2147483648u, 2147418113u, 0, 5, 250000, 99));
}

TEST(Filterbank, AddsOverlappingTriangles) {
  const Words input = {10, 20, 4294967295u, 7};
  const uint8_t widths[] = {1, 1, 2};
  const uint16_t weights[] = {9, 4096, 4096, 1, 65535, 9, 2, 9};
  std::vector<uint64_t> output(3, 99);
  orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2(2, input.data(), widths, weights,
                                                              output.data());
  EXPECT_THAT(output, ElementsAre(30 * 4096, 20 + 4294967295u * uint64_t{65535} + 14, 99));
}

Words Roots(const std::vector<uint64_t>& values, uint32_t shift = 0) {
  Words output(values.size() + 1, 99);
  orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1(8 * values.size(), values.data(),
                                                                   output.data(), shift);
  return output;
}

TEST(SquareRoot, IsNearestAroundEveryBoundaryAndSaturates) {
  qz::test::Random random(1);
  for (int i = 0; i < 10000; ++i) {
    const uint64_t r = 1 + (random.Next() >> (32 + i % 32));
    if (r == 65535 || r == 65536 || r >= UINT32_MAX) continue;
    const auto root = static_cast<uint32_t>(r);
    ASSERT_EQ(Roots({r * r - r + 1, r * r, r * r + r, r * r + r + 1}),
              (Words{root, root, root, root + 1, 99}));
  }
  // From 4294901761 on the nearest integer would be 65536, from 2^64 - 2^32 + 1 on 2^32.
  EXPECT_THAT(Roots({0, 4294901760, 4294901761, UINT32_MAX, uint64_t{1} << 32}),
              ElementsAre(0, 65535, 65535, 65535, 65536, 99));
  EXPECT_THAT(Roots({UINT64_MAX - UINT32_MAX, UINT64_MAX - UINT32_MAX + 1, UINT64_MAX}),
              ElementsAre(UINT32_MAX, UINT32_MAX, UINT32_MAX, 99));
  EXPECT_THAT(Roots({1000000}, 3), ElementsAre(125, 99));
  EXPECT_THAT(Roots({UINT64_MAX}, 32), ElementsAre(0, 99));
}

TEST(NoiseSubtraction, UpdatesTheEstimateFirst) {
  Words input = {16384, 0xFFFFFFFF, 1 << 30, 20}, noise = {0, 0, 1 << 30, 5000}, output(5, 99);
  orra_u32_filterbank_subtract_ukernel__scalar_x2(4, input.data(), 655, 4096, 15729, 12288, 819, 0,
                                                  14, noise.data(), output.data());
  // The last two are at and below their estimate: what remains is 0.05 of the input, rounded down.
  EXPECT_THAT(noise, ElementsAre(655, 0x3FFFFFFF, 1 << 30, 3755));
  EXPECT_THAT(output, ElementsAre(15729, 0xC0000000, 819 << 16, 0, 99));
  // A level of 16 times the input; what stays of it comes back to the unit of the input.
  orra_u32_filterbank_subtract_ukernel__scalar_x2(2, input.data(), 1, 1, 0, 0, 1, 4, 1,
                                                  noise.data(), output.data());
  EXPECT_THAT(noise, ElementsAre(131072, 0x7FFFFFF8, 1 << 30, 3755));
  EXPECT_THAT(output, ElementsAre(8192, 0x7FFFFFFF, 819 << 16, 0, 99));
}

uint16_t Log(uint32_t x, uint32_t shift, uint32_t scale) {
  uint16_t output[2] = {7, 99};
  orra_u32_vlog_ukernel__scalar_x1(1, &x, shift, scale, output);
  EXPECT_EQ(output[1], 99);
  return output[0];
}

TEST(Logarithm, StaysCloseToTheRealOneAndKeepsEveryBit) {
  uint64_t digest = kNoDigest;
  for (uint32_t i = 1; i <= 20000; ++i) {
    // Half a unit of rounding, and what the table's steps of up to 224 / 65536 octaves add.
    ASSERT_NEAR(Log(i * i, 0, 16), 16 * std::log(i * i), 0.54) << i;
    digest = Digest(digest, Log(i * i, 0, 1500));  // a scale at which nearly every inner bit shows
  }
  EXPECT_EQ(digest, 0xF039C29BFB84CED2u);
  EXPECT_EQ(Log(1, 3, 16), 33);
  EXPECT_EQ(Log(0, 3, 16), 0);
  EXPECT_EQ(Log(5, 32, 16), 0);
  EXPECT_EQ(Log(UINT32_MAX, 0, 2000), 32767);
}

}  // namespace
