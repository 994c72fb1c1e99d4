// The kernels before and after the FFT: window, peak, left shift, power, filterbank, square root,
// noise subtraction, logarithm. A 99 behind an output is a guard.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "random.h"
#include "signal_kernels.h"
#include "signal_tables.h"

namespace {

using testing::ElementsAre;
using Samples = std::vector<int16_t>;
using Words = std::vector<uint32_t>;

TEST(Window, WeighsEveryRowRoundsDownAndSaturates) {
  const Samples weights = {4096, 4096, 8192, 8192, -4096, 1, 4095};
  const Samples input = {32767, -32768, 32767, -32768, -32768, -1, -3, 1, -1, 3, -3, 5, 4095, 3};
  Samples output(15, 99);
  orra_s16_window_shift12_ukernel__neon_x32(2, 14, input.data(), weights.data(), output.data(), 3);
  EXPECT_THAT(output, ElementsAre(32767, -32768, 32767, -32768, 32767, -1, -3,  //
                                  1, -1, 6, -6, -5, 0, 2, 99));
}

TEST(Peak, IsTheLargestMagnitude) {
  for (int16_t extreme : {-32768, -101, 101, 0}) {
    Samples samples(19, static_cast<int16_t>(extreme / 2));
    samples[17] = extreme;
    uint16_t peak = 7;
    orra_s16_rmaxabs_ukernel__neon_x32(38, samples.data(), &peak);
    EXPECT_EQ(peak, std::abs(extreme));
  }
}

TEST(LeftShift, WrapsAndWorksInPlaceAndDownwards) {
  const Samples input = qz::test::Random(1).Fill<int16_t>(37, -32768, 32767);
  for (uint32_t shift : {0, 1, 15, 16, 40}) {
    for (size_t distance : {0, 1}) {
      Samples data = input, expected = input;
      for (size_t i = distance; i < 37; ++i) {
        expected[i - distance] = static_cast<int16_t>(shift < 16 ? input[i] * (1 << shift) : 0);
      }
      orra_i16_vlshift_ukernel__neon_x32(37 - distance, &data[distance], &data[0], shift);
      EXPECT_EQ(data, expected) << shift;
    }
  }
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

uint32_t Root(uint64_t v, uint32_t shift = 0) {
  uint32_t output[2] = {0, 99};
  orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1(8, &v, output, shift);
  EXPECT_EQ(output[1], 99u);
  return output[0];
}

TEST(SquareRoot, IsNearestAroundEveryBoundaryAndSaturates) {
  qz::test::Random random(1);
  for (int i = 0; i < 10000; ++i) {
    const uint64_t r = 1 + (random.Next() >> (32 + i % 32));
    if (r == 65535 || r == 65536 || r >= UINT32_MAX) continue;
    ASSERT_EQ(Root(r * r - r + 1), r);
    ASSERT_EQ(Root(r * r), r);
    ASSERT_EQ(Root(r * r + r), r);
    ASSERT_EQ(Root(r * r + r + 1), r + 1);
  }
  // From 4294901761 on the nearest integer would be 65536, from 2^64 - 2^32 + 1 on 2^32.
  for (uint64_t v : {4294901760u, 4294901761u, 4294967295u}) EXPECT_EQ(Root(v), 65535u) << v;
  EXPECT_EQ(Root(uint64_t{1} << 32), 65536u);
  for (uint64_t v : {UINT64_MAX - UINT32_MAX, UINT64_MAX - UINT32_MAX + 1, UINT64_MAX}) {
    EXPECT_EQ(Root(v), UINT32_MAX) << v;
  }
  EXPECT_EQ(Root(1000000, 3), 125u);
  EXPECT_EQ(Root(UINT64_MAX, 32), 0u);
  EXPECT_EQ(Root(0), 0u);
}

TEST(NoiseSubtraction, UpdatesTheEstimateFirst) {
  Words input = {16384, 0xFFFFFFFF, 1 << 30, 20}, noise = {0, 0, 1 << 30, 5000}, output(5, 99);
  orra_u32_filterbank_subtract_ukernel__scalar_x2(4, input.data(), 655, 4096, 15729, 12288, 819, 0,
                                                  14, noise.data(), output.data());
  // The last two are at and below their estimate: what remains is 0.05 of the input, rounded down.
  EXPECT_THAT(noise, ElementsAre(655, 0x3FFFFFFF, 1 << 30, 3755));
  EXPECT_THAT(output, ElementsAre(15729, 0xC0000000, 819 << 16, 0, 99));
  // A level of 16 times the input; what stays of it comes back to the unit of the input.
  orra_u32_filterbank_subtract_ukernel__scalar_x2(2, input.data(), 1, 1, 0, 0, 0, 4, 1,
                                                  noise.data(), output.data());
  EXPECT_THAT(noise, ElementsAre(131072, 0x7FFFFFF8, 1 << 30, 3755));
  EXPECT_THAT(output, ElementsAre(8192, 0x07FFFFFF, 819 << 16, 0, 99));
}

uint16_t Log(uint32_t x, uint32_t shift = 3, uint32_t scale = 16) {
  uint16_t output[2] = {7, 99};
  orra_u32_vlog_ukernel__scalar_x1(1, &x, shift, scale, output);
  EXPECT_EQ(output[1], 99);
  return output[0];
}

TEST(Logarithm, HasItsTellingValues) {
  EXPECT_EQ(Log(0), 0);
  EXPECT_EQ(Log(1), 33);
  EXPECT_EQ(Log(1u << 28), 344);
  EXPECT_EQ(Log(1, 32), 0);
  EXPECT_EQ(Log(1951), 155);  // not monotone
  EXPECT_EQ(Log(1952), 154);
  EXPECT_EQ(Log(UINT32_MAX, 0, 2000), 32767);
}

TEST(Logarithm, StaysCloseToTheRealOne) {
  uint64_t digest = 0xCBF29CE484222325u;
  for (uint32_t i = 1; i <= 20000; ++i) {
    // Half a unit of rounding, and what the table's steps of up to 224 / 65536 octaves add at
    // scale 16.
    ASSERT_NEAR(Log(i * i, 0), 16 * std::log(i * i), 0.54) << i;
    // At scale 1500 nearly every bit of the inner logarithm shows.
    digest = (digest ^ Log(i * i, 0, 1500)) * 0x100000001B3u;
  }
  // 64-bit FNV-1a; recorded from a separate computation of the same steps.
  EXPECT_EQ(digest, 0xF039C29BFB84CED2u);
}

TEST(Tables, HaveTheirTellingValues) {
  const auto& log = vrd_table_vlog;
  EXPECT_THAT((std::vector<int>{log[0], log[1], log[57], log[64], log[127], log[128]}),
              ElementsAre(0, 224, 5641, 5568, 142, 0));
  EXPECT_THAT(vrd_table_fft256_samples4_twiddle[0][1], ElementsAre(30273, -12539));
  EXPECT_THAT(vrd_table_fft256_samples4_twiddle[2][3], ElementsAre(-30273, 12539));
}

}  // namespace
