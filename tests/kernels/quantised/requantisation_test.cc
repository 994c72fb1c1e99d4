// What requantisation does at its ties and limits, seen through every kernel that has it.

#include <gtest/gtest.h>

#include "layers.h"

namespace qz::test {
namespace {

constexpr int8_t kNoRow[1 + kReadAhead] = {};
constexpr int8_t kOneRow[1 + kReadAhead] = {1};

// One column whose accumulator starts at `bias` and meets the products of `weight` with 1 and 0.
Layer Column(size_t taps, int32_t bias, int8_t weight, float scale) {
  Random random(0);
  Layer layer(random, taps, 1, 1);
  layer.biases = {bias};
  layer.weights.assign(taps, weight);
  layer.scales = {scale};
  return layer;
}

TEST(Requantisation, ByFloatScale) {
  const struct {
    int32_t bias;
    int8_t weight;
    float scale;
    orra_fp32_requant_params params;
    int8_t expected;
  } kCases[] = {
      {1, 0, 0.5f, {0, -128, 127}, 0},  // ties to even
      {3, 0, 0.5f, {0, -128, 127}, 2},
      {5, 0, 0.5f, {0, -128, 127}, 2},
      {-3, 0, 0.5f, {0, -128, 127}, -2},
      {1, 0, 0.5f, {1, -128, 127}, 1},                  // the zero point comes after rounding
      {(1 << 24) + 1, 0, 0x1p-25f, {0, -128, 127}, 0},  // single precision loses the odd 1
      {-300, 0, 1, {82, -128, 127}, -128},
      {100, 0, 1, {82, -128, 127}, 127},
      {INT32_MAX, 0, 1e30f, {0, -100, 99}, 99},
      {INT32_MIN, 0, 1e30f, {0, -100, 99}, -100},
      {-40000, 0, 1, {32767, -128, 127}, -1},   // saturates to int16 before the zero point
      {INT32_MAX, 1, 1, {0, -128, 127}, -128},  // accumulators wrap
      {INT32_MIN, -1, 1, {0, -128, 127}, 127},
  };
  const int8_t* const rows[4] = {kOneRow, kNoRow, kNoRow, kNoRow};
  for (const auto& [bias, weight, scale, params, expected] : kCases) {
    SCOPED_TRACE(testing::Message() << bias << " + " << int{weight} << ", times " << scale);
    const auto block = Column(1, bias, weight, scale).Pack(8, true);
    const auto group = Column(3, bias, weight, scale).Pack(16, true);
    int8_t out[3] = {};
    orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
        1, 1, 1, kOneRow, 1, block.data(), &out[0], 1, 8, &params);
    orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
        1, 1, 1, sizeof rows, rows, block.data(), &out[1], 1, 8, 0, nullptr, &params);
    orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
        1, 1, rows, group.data(), &out[2], 0, 0, 0, nullptr, &params);
    for (int8_t byte : out) EXPECT_EQ(byte, expected);
  }
}

TEST(Requantisation, ByFixedPointFactor) {
  const struct {
    int32_t bias;
    int8_t weight;
    orra_rndnu_requant_params params;
    int8_t expected;
  } kCases[] = {
      {16, 0, {1, 1 << 30, -5, 0, -128, 127}, 1},  // a factor of 1/32; halves go upwards
      {-16, 0, {1, 1 << 30, -5, 0, -128, 127}, 0},
      {-17, 0, {1, 1 << 30, -5, 0, -128, 127}, -1},
      {-3, 0, {-1, INT32_MIN, -1, 0, -128, 127}, 1},  // floor(-1.5), times -1, halved
      // 2^62 / 2^31 saturates to 2^31 - 1; the half added to it must not overflow.
      {INT32_MIN, 0, {0, INT32_MIN, -25, 0, -128, 127}, 64},
      {1, 0, {31, INT32_MAX, -24, -2, -128, 127}, 126},       // the pre-shift saturates
      {INT32_MAX, 1, {0, INT32_MAX, -1, 0, -100, 99}, -100},  // accumulators wrap
  };
  for (const auto& [bias, weight, params, expected] : kCases) {
    int8_t out = 0;
    orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
        1, 1, 1, kOneRow, 1, Column(1, bias, weight, 1).Pack(8, false).data(), &out, 1, 8, &params);
    EXPECT_EQ(out, expected) << bias << " by " << params.multiplier << ", " << params.post_shift;
  }
}

}  // namespace
}  // namespace qz::test
