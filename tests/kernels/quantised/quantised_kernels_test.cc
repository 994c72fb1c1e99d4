// SPDX-License-Identifier: Apache-2.0
// The kernels on random layers, rows and lists against textbook sums, roundings, maxima and
// lookups, over all tails, with gaps and guards.

#include "kernels/quantised/quantised_kernels.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "tests/support/random_layer.h"

namespace qz::test {
namespace {

int64_t Saturate(int64_t value, int bits) {
  const int64_t limit = int64_t{1} << (bits - 1);
  return std::clamp(value, -limit, limit - 1);
}

enum ClampOrder { kMinFirst, kMaxFirst };  // which bound is applied first

template <typename Params>
int8_t AddZeroPointAndClamp(int64_t value, const Params& params, ClampOrder order) {
  const int64_t min = params.output_min, max = params.output_max;
  value = Saturate(Saturate(Saturate(value, 16) + params.output_zero_point, 16), 8);
  value = order == kMinFirst ? std::min(std::max(value, min), max)
                             : std::max(std::min(value, max), min);
  return static_cast<int8_t>(value);
}

// In doubles: a product of two floats is exact there, and is rounded once, to a float.
int8_t Requantise(int32_t sum, float scale, const orra_fp32_requant_params& params,
                  ClampOrder order = kMinFirst) {
  const float product = static_cast<float>(double{static_cast<float>(sum)} * double{scale});
  const double rounded = std::nearbyint(std::clamp(double{product}, -0x1p31, 0x1p31 - 1));
  return AddZeroPointAndClamp(static_cast<int64_t>(rounded), params, order);
}

int8_t Requantise(int32_t sum, const orra_rndnu_requant_params& params) {
  // Further shifts change nothing any more.
  const int32_t shift = std::clamp(params.pre_shift, -32, 32);
  const int64_t shifted = shift < 0 ? int64_t{sum} >> -shift : sum * (int64_t{1} << shift);
  const int64_t product = Saturate((Saturate(shifted, 32) * params.multiplier) >> 31, 32);
  // One bit more than is kept, whose half goes upwards.
  return AddZeroPointAndClamp(((product >> (std::min(-params.post_shift, 60) - 1)) + 1) >> 1,
                              params, kMinFirst);
}

int32_t Sum(const Layer& layer, size_t column, const int8_t* x) {
  int64_t sum = layer.biases[column];
  for (size_t i = 0; i < layer.inputs; ++i) sum += x[i] * layer.weights[i * layer.columns + column];
  return static_cast<int32_t>(sum);
}

// What versions for some processors may read, and none may use, behind a row.
constexpr size_t kReadAhead = 16;
constexpr int8_t kGuard = 0x5A;

// Rows that hold all taps of a position one after the other give the direct kernels what the listed
// rows of the taps give the indirect one.
void CheckMatrixKernels(Random& random, size_t m, size_t n, size_t k) {
  const size_t taps = random.Pick(1, 4), inputs = taps * k, a_stride = inputs + random.Pick(0, 9);
  const auto a = random.Fill<int8_t>(m * a_stride + kReadAhead, -128, 127);
  const Layer layer(random, inputs, n, 8);
  const std::vector<uint8_t> packed = layer.Packed();
  const orra_fp32_requant_params params = RandomParams(random);
  const orra_rndnu_requant_params fixed_params = RandomFixedParams(random);

  const size_t offset = 40000 * random.Pick(0, 1);
  const int8_t* const zero = &a[random.Pick(0, taps - 1) * k];
  std::vector<const int8_t*> list;
  for (size_t first = 0; first < m; first += 4) {
    for (size_t i = 0; i < 4 * taps; ++i) {
      const size_t row = std::min(first + i % 4, m - 1);
      list.push_back(ListEntry(&a[row * a_stride + i / 4 * k], zero, offset));
    }
  }

  const size_t block = 8 + random.Pick(0, 3), stride = (n + 7) / 8 * block + random.Pick(0, 5);
  std::vector<int8_t> expected(m * stride + 16, kGuard);
  std::vector<int8_t> direct = expected, indirect = expected, fixed = expected;
  std::vector<int8_t> expected_fixed = expected;
  for (size_t j = 0; j < n; ++j) {
    const size_t location = j / 8 * block + j % 8;
    expected_fixed[location] = Requantise(Sum(layer, j, a.data()), fixed_params);
    for (size_t r = 0; r < m; ++r) {
      const int32_t sum = Sum(layer, j, &a[r * a_stride]);
      expected[r * stride + location] = Requantise(sum, layer.scales[j], params);
    }
  }
  orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      m, n, inputs, a.data(), a_stride, packed.data(), direct.data(), stride, block, &params);
  orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      m, n, k, 4 * taps * sizeof list[0], list.data(), packed.data(), indirect.data(), stride,
      block, offset, zero, &params);
  orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
      1, n, inputs, a.data(), a_stride, layer.Packed(false).data(), fixed.data(), stride, block,
      &fixed_params);
  EXPECT_EQ(direct, expected);

  // Of two rows the larger, after requantisation as before.
  std::vector<int8_t> pooled(m / 2 * stride + 16, kGuard), expected_pooled = pooled;
  for (size_t i = 0; i < m / 2 * stride; ++i) {
    const size_t first = i / stride * 2 * stride + i % stride;
    expected_pooled[i] = std::max(expected[first], expected[first + stride]);
  }
  if (m > 1) {
    orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon(
        m / 2, n, inputs, a.data(), a_stride, packed.data(), pooled.data(), stride, block, &params);
  }
  EXPECT_EQ(pooled, expected_pooled);
  EXPECT_EQ(indirect, expected);
  EXPECT_EQ(fixed, expected_fixed);
}

TEST(MatrixKernels, EqualSums) {
  Random random(1);
  for (size_t i = 0; i < 800 && !HasFailure(); ++i) {
    const size_t m = 1 + i % 9, n = 1 + i / 9 % 20, k = random.Pick(1, 132);
    SCOPED_TRACE(testing::Message() << "m " << m << " n " << n << " k " << k);
    CheckMatrixKernels(random, m, n, k);
  }
}

TEST(Depthwise, EqualsSums) {
  Random random(4);
  for (size_t i = 0; i < 300; ++i) {
    const size_t channels = 1 + i % 60, stride = channels + random.Pick(0, 5);
    const size_t width = random.Pick(1, 4), step = random.Pick(1, 4);
    const Layer layer(random, 3, channels, 16);
    const orra_fp32_requant_params params = RandomParams(random);
    const auto in = random.Fill<int8_t>(10 * channels + kReadAhead, -128, 127);
    const size_t offset = 40000 * random.Pick(0, 1);
    std::vector<const int8_t*> rows, list;
    while (rows.size() < width * step + 3) {
      rows.push_back(&in[channels * random.Pick(0, 9)]);
      list.push_back(ListEntry(rows.back(), in.data(), offset));
    }
    std::vector<int8_t> out(width * stride + 16, kGuard), expected = out;
    for (size_t p = 0; p < width; ++p) {
      for (size_t c = 0, first = p * step; c < channels; ++c) {
        const std::vector<int8_t> x = {rows[first][c], rows[first + 1][c], rows[first + 2][c]};
        expected[p * stride + c] =
            Requantise(Sum(layer, c, x.data()), layer.scales[c], params, kMaxFirst);
      }
    }
    orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
        channels, width, list.data(), layer.Packed().data(), out.data(), step * sizeof list[0],
        stride - channels, offset, in.data(), &params);
    ASSERT_EQ(out, expected) << channels << " channels";
  }
}

// Entries are offsets from a base. The entry that an odd pool skips and those of the gap would
// fault.
TEST(MaxPool, EqualsMaximum) {
  Random random(7);
  for (size_t i = 0; i < 4 * 40; ++i) {
    const size_t pool_size = 1 + i % 4, channels = 1 + i / 4, positions = random.Pick(1, 3);
    const size_t gap = random.Pick(0, 2), stride = channels + random.Pick(0, 5);
    const auto [unused, low, high] = RandomParams(random);
    const orra_s8_clamp_params params{low, high};
    const auto in = random.Fill<int8_t>(20 * channels + kReadAhead, -128, 127);
    std::vector<uintptr_t> entries;
    std::vector<int8_t> out(positions * stride + 16, kGuard), expected = out;
    for (size_t p = 0; p < positions; ++p) {
      std::fill_n(&expected[p * stride], channels, INT8_MIN);
      for (size_t e = 0; e < pool_size; ++e) {
        entries.push_back(channels * random.Pick(0, 19));
        for (size_t c = 0; c < channels; ++c) {
          int8_t& max = expected[p * stride + c];
          max = std::max(in[entries.back() + c], max);
        }
      }
      for (size_t c = 0; c < channels; ++c) {
        int8_t& max = expected[p * stride + c];
        max = std::min(std::max(max, params.output_min), params.output_max);
      }
      entries.insert(entries.end(), pool_size % 2 + gap, UINTPTR_MAX / 2);
    }
    orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
        positions, pool_size, channels, reinterpret_cast<const int8_t* const*>(entries.data()),
        reinterpret_cast<uintptr_t>(in.data()), out.data(), gap * sizeof entries[0],
        stride - channels, &params);
    ASSERT_EQ(out, expected) << channels << " channels, pools of " << pool_size;
  }
}

// Lookup in place; both leave what is beyond their count.
TEST(ConversionAndLookup, AreExact) {
  Random random(8);
  const orra_dequant_params params{{128, 128}, 1.0f / 256};
  const auto table = random.Fill<uint8_t>(256, 0, 255);
  for (size_t count = 1; count <= 70; ++count) {
    auto bytes = random.Fill<uint8_t>(count + kReadAhead, 0, 255), looked_up = bytes;
    std::vector<float> floats(count + 4, -1.0f), converted = floats;
    for (size_t i = 0; i < count; ++i) {
      looked_up[i] = table[bytes[i]];
      converted[i] = static_cast<float>(static_cast<int8_t>(bytes[i]) + 128) / 256;
    }
    orra_qs8_f32_vcvt_ukernel__neon_x32(count, reinterpret_cast<const int8_t*>(bytes.data()),
                                        floats.data(), &params);
    orra_x8_lut_ukernel__scalar_x2(count, bytes.data(), bytes.data(), table.data());
    ASSERT_EQ(floats, converted);
    ASSERT_EQ(bytes, looked_up);
  }
}

}  // namespace
}  // namespace qz::test
