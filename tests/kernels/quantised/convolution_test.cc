// The matrix and depthwise kernels against textbook sums, over all tails, with gaps and guards.

#include <gtest/gtest.h>

#include "layers.h"

namespace qz::test {
namespace {

// Random rows one after the other, and a list of some. Entries lie `offset` bytes before the rows
// that they mean, but for those of the zero row, which are named as they are.
struct RowList {
  RowList(Random& random, size_t count, size_t row_bytes)
      : bytes(random.Fill<int8_t>((count + 1) * row_bytes + kReadAhead, -128, 127)),
        zero(bytes.data()),
        offset(Pick(random, 0, 1) * 40000) {
    for (size_t i = 0; i < count; ++i) {
      const size_t row = random.Next() % 4 == 0 ? 0 : Pick(random, 1, count);
      rows.push_back(&bytes[row * row_bytes]);
      entries.push_back(reinterpret_cast<const int8_t*>(reinterpret_cast<uintptr_t>(rows[i]) -
                                                        (row == 0 ? 0 : offset)));
    }
  }
  std::vector<int8_t> bytes;
  const int8_t* zero;
  size_t offset;
  std::vector<const int8_t*> rows, entries;
};

// An output of 4 rows with gaps between blocks and rows, before and after a kernel's call.
struct Output {
  Output(Random& random, size_t n)
      : block(8 + Pick(random, 0, 3)),
        stride((n + 7) / 8 * block + Pick(random, 0, 5)),
        actual(4 * stride + 16, kGuard),
        expected(actual) {}
  int8_t& Expected(size_t r, size_t j) { return expected[r * stride + j / 8 * block + j % 8]; }
  size_t block, stride;
  std::vector<int8_t> actual, expected;
};

void CheckMatrixKernels(Random& random, size_t m, size_t n, size_t k) {
  const size_t taps = Pick(random, 1, 4);
  const size_t a_stride = k + Pick(random, 0, 9);
  const RowList list(random, 4 * taps, a_stride);
  const int8_t* const a =
      list.zero + (4 * taps + 1 - m) * a_stride;  // nothing to read behind m rows
  const Layer one_tap(random, 1, k, n), layer(random, taps, k, n);
  const orra_fp32_requant_params params = RandomParams(random);
  const orra_rndnu_requant_params fixed{static_cast<int32_t>(random.Between(-8, 8)),
                                        static_cast<int32_t>(random.Next()),
                                        static_cast<int32_t>(random.Between(-31, -1)),
                                        params.output_zero_point,
                                        params.output_min,
                                        params.output_max};
  Output direct(random, n), indirect(random, n), fixed_point(random, n);
  for (size_t j = 0; j < n; ++j) {
    fixed_point.Expected(0, j) = Requantise(one_tap.Sum(j, {a}, false), fixed);
    for (size_t r = 0; r < m; ++r) {
      int32_t sum = one_tap.Sum(j, {a + r * a_stride}, false);
      direct.Expected(r, j) = Requantise(sum, one_tap.scales[j], params);
      std::vector<const int8_t*> tap_rows;
      for (size_t t = 0; t < taps; ++t) tap_rows.push_back(list.rows[4 * t + r]);
      sum = layer.Sum(j, tap_rows, false);
      indirect.Expected(r, j) = Requantise(sum, layer.scales[j], params);
    }
  }
  orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      m, n, k, a, a_stride, one_tap.Pack(8, true).data(), direct.actual.data(), direct.stride,
      direct.block, &params);
  orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      m, n, k, 4 * taps * sizeof(int8_t*), list.entries.data(), layer.Pack(8, true).data(),
      indirect.actual.data(), indirect.stride, indirect.block, list.offset, list.zero, &params);
  orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
      m, n, k, a, a_stride, one_tap.Pack(8, false).data(), fixed_point.actual.data(),
      fixed_point.stride, fixed_point.block, &fixed);
  EXPECT_EQ(direct.actual, direct.expected);
  EXPECT_EQ(indirect.actual, indirect.expected);
  EXPECT_EQ(fixed_point.actual, fixed_point.expected);
}

TEST(MatrixKernels, EqualPlainSums) {
  Random random(1);
  for (size_t m = 1; m <= 4; ++m) {
    for (size_t n = 1; n <= 20; ++n) {
      for (size_t k : {1, 7, 8, 12, 48, 60, 64, 65, 131}) {
        SCOPED_TRACE(testing::Message() << "m " << m << " n " << n << " k " << k);
        CheckMatrixKernels(random, m, n, k);
        if (HasFailure()) return;
      }
    }
  }
}

TEST(Depthwise, EqualsPlainSums) {
  Random random(4);
  for (size_t channels = 1; channels <= 60; channels += channels < 40 ? 1 : 4) {
    SCOPED_TRACE(testing::Message() << "channels " << channels);
    const Layer layer(random, 3, 1, channels);
    const orra_fp32_requant_params params = RandomParams(random);
    const size_t width = Pick(random, 1, 4), step = Pick(random, 1, 4);
    const size_t stride = channels + Pick(random, 0, 5);
    const RowList list(random, width * step + 3, channels);
    std::vector<int8_t> out(width * stride + 16, kGuard);
    std::vector<int8_t> expected = out;
    for (size_t p = 0; p < width; ++p) {
      const auto first = list.rows.begin() + static_cast<ptrdiff_t>(p * step);
      for (size_t c = 0; c < channels; ++c) {
        const int32_t sum = layer.Sum(c, {first, first + 3}, true);
        expected[p * stride + c] = Requantise(sum, layer.scales[c], params);
      }
    }
    orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
        channels, width, list.entries.data(), layer.Pack(16, true).data(), out.data(),
        step * sizeof(int8_t*), stride - channels, list.offset, list.zero, &params);
    ASSERT_EQ(out, expected);
  }
}

}  // namespace
}  // namespace qz::test
