// SPDX-License-Identifier: Apache-2.0
#include "kernels/quantised/quantised_kernels.h"

#include <array>

#include "config/network.h"
#include "tests/kernels/comparison/comparison.h"
#include "tests/support/random_layer.h"

namespace qz::test {
namespace {

QZ_IMPLEMENTATIONS(kGemm, Quantised,
                   orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35);
QZ_IMPLEMENTATIONS(kGemmMaxPool, Quantised, orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon);
QZ_IMPLEMENTATIONS(kIndirectGemm, Quantised,
                   orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35);
QZ_IMPLEMENTATIONS(kFixedPointGemm, Quantised,
                   orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7);
QZ_IMPLEMENTATIONS(kDepthwise, Quantised,
                   orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35);
QZ_IMPLEMENTATIONS(kMaxPool, Quantised, orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16);

constexpr size_t kReadAhead = 7;
constexpr size_t kPoolReadAhead = 15;

// Nothing behind packed data may be read; of any alignment.
const uint8_t* OffsetLayer(Random& random, size_t inputs, size_t columns, size_t block,
                           bool with_scales = true) {
  const Layer layer(random, inputs, columns, block);
  return Location(random, layer.Packed(with_scales), random.Next() % 2);
}

// Now and then more rows, columns or products in a sum than an implementation that unpacks them
// has space for at a time.
struct MatrixShape {
  explicit MatrixShape(CaseRandom& random, size_t taps = 1)
      : large(random.Next() % 16),
        m(random.Pick("m", 1, large == 0 ? 150 : 13)),
        n(random.Pick("n", 1, large == 1 ? 70 : 25)),
        k(random.Pick("k", 1,
                      (large == 1   ? 700
                       : large == 2 ? 2600
                                    : 100) /
                          taps)),
        a_stride(k + random.Pick("a gap", 0, 9)),
        c_block_stride(8 + random.Pick("c block gap", 0, 3)),
        c_stride((n + 7) / 8 * c_block_stride + random.Pick("c gap", 0, 5)) {}
  uint64_t large;
  size_t m, n, k, a_stride, c_block_stride, c_stride;
};

std::string CompareGemm(CaseRandom& random) {
  const MatrixShape s(random);
  const auto values = ShapedFill<int8_t>(random, (s.m - 1) * s.a_stride + s.k);
  const int8_t* a = Location(random, values, kReadAhead);
  const uint8_t* w = OffsetLayer(random, s.k, s.n, 8);
  const orra_fp32_requant_params params = RandomParams(random);
  const auto c_contents = RandomValues<int8_t>(random, s.m * s.c_stride);
  return Difference(random, kGemm, c_contents, [&](auto gemm, int8_t* c) {
    gemm(s.m, s.n, s.k, a, s.a_stride, w, c, s.c_stride, s.c_block_stride, &params);
  });
}

std::string CompareGemmMaxPool(CaseRandom& random) {
  const MatrixShape s(random);
  const auto values = ShapedFill<int8_t>(random, (2 * s.m - 1) * s.a_stride + s.k);
  const int8_t* a = Location(random, values, kReadAhead);
  const uint8_t* w = OffsetLayer(random, s.k, s.n, 8);
  const orra_fp32_requant_params params = RandomParams(random);
  const auto c_contents = RandomValues<int8_t>(random, s.m * s.c_stride);
  return Difference(random, kGemmMaxPool, c_contents, [&](auto gemm, int8_t* c) {
    gemm(s.m, s.n, s.k, a, s.a_stride, w, c, s.c_stride, s.c_block_stride, &params);
  });
}

// Lists of rows of one input, entry i of which names row_of(i); one is the zero row, and `offset`
// lies between entries and the others.
struct RowList {
  template <typename RowOf>
  RowList(Random& random, size_t entries, size_t rows, size_t row_bytes, RowOf row_of)
      : offset(random.Next() % 2 ? 40000 : 0) {
    const int8_t* first =
        Location(random, ShapedFill<int8_t>(random, rows * row_bytes), kReadAhead);
    zero = first + random.Next() % rows * row_bytes;
    for (size_t i = 0; i < entries; ++i) {
      list.push_back(ListEntry(first + row_of(i) * row_bytes, zero, offset));
    }
  }
  size_t offset;
  const int8_t* zero;
  std::vector<const int8_t*> list;
};

// Any rows, or those of a convolution, where each tap's rows are the ones after those of the tap
// before: implementations may make use of that. A last tile names rows that are not asked for.
std::string CompareIndirectGemm(CaseRandom& random) {
  const size_t taps = random.Pick("taps", 1, 4), tap_bytes = 4 * taps * sizeof(const int8_t*);
  const MatrixShape s(random, taps);
  const bool convolution = random.Pick("convolution", 0, 1) != 0;
  const size_t listed = (s.m + 3) / 4 * 4;
  const size_t last = random.Pick("last row", s.m - 1, listed - 1);
  const size_t rows = convolution ? last + taps : 9;
  const auto row_of = [&](size_t i) {
    if (!convolution) return static_cast<size_t>(random.Next() % rows);
    return std::min(i / (4 * taps) * 4 + i % 4, last) + i / 4 % taps;
  };
  const RowList in(random, listed * taps, rows, s.k, row_of);
  const uint8_t* w = OffsetLayer(random, taps * s.k, s.n, 8);
  const orra_fp32_requant_params params = RandomParams(random);
  const auto c_contents = RandomValues<int8_t>(random, s.m * s.c_stride);
  return Difference(random, kIndirectGemm, c_contents, [&](auto gemm, int8_t* c) {
    gemm(s.m, s.n, s.k, tap_bytes, in.list.data(), w, c, s.c_stride, s.c_block_stride, in.offset,
         in.zero, &params);
  });
}

std::string CompareFixedPointGemm(CaseRandom& random) {
  const MatrixShape s(random);
  const int8_t* a = Location(random, ShapedFill<int8_t>(random, s.k), kReadAhead);
  const uint8_t* w = OffsetLayer(random, s.k, s.n, 8, /*with_scales=*/false);
  const orra_rndnu_requant_params params = RandomFixedParams(random);
  const auto c_contents = RandomValues<int8_t>(random, s.c_stride);
  return Difference(random, kFixedPointGemm, c_contents, [&](auto gemm, int8_t* c) {
    gemm(s.m, s.n, s.k, a, s.a_stride, w, c, s.c_stride, s.c_block_stride, &params);
  });
}

std::string CompareDepthwise(CaseRandom& random) {
  const size_t channels = random.Pick("channels", 1, 70), width = random.Pick("width", 1, 5);
  const size_t step = random.Pick("step", 1, 4), gap = random.Pick("gap", 0, 5);
  const RowList in(random, (width - 1) * step + 3, 9, channels,
                   [&](size_t) { return random.Next() % 9; });
  const uint8_t* w = OffsetLayer(random, 3, channels, 16);
  const orra_fp32_requant_params params = RandomParams(random);
  const auto contents = RandomValues<int8_t>(random, width * (channels + gap));
  return Difference(random, kDepthwise, contents, [&](auto depthwise, int8_t* out) {
    depthwise(channels, width, in.list.data(), w, out, step * sizeof in.list[0], gap, in.offset,
              in.zero, &params);
  });
}

// The entry that an odd pool skips and those of the gap name nothing that can be read.
std::string CompareMaxPool(CaseRandom& random) {
  const size_t channels = random.Pick("channels", 1, 50);
  const size_t positions = random.Pick("positions", 1, 5);
  const size_t pool_size = random.Pick("pool size", 1, 6);
  const size_t list_gap = random.Pick("list gap", 0, 2), gap = random.Pick("gap", 0, 5);
  const int8_t* rows = Location(random, ShapedFill<int8_t>(random, 20 * channels), kPoolReadAhead);
  const auto [zero_point, low, high] = RandomParams(random);
  const orra_s8_clamp_params params{low, high};
  std::vector<uintptr_t> list;
  for (size_t p = 0; p < positions; ++p) {
    for (size_t e = 0; e < pool_size; ++e) list.push_back(random.Next() % 20 * channels);
    list.insert(list.end(), pool_size % 2 + list_gap, UINTPTR_MAX / 2);
  }
  const auto* entries = reinterpret_cast<const int8_t* const*>(list.data());
  const auto contents = RandomValues<int8_t>(random, positions * (channels + gap));
  return Difference(random, kMaxPool, contents, [&](auto max_pool, int8_t* out) {
    max_pool(positions, pool_size, channels, entries, reinterpret_cast<uintptr_t>(rows), out,
             list_gap * sizeof list[0], gap, &params);
  });
}

// The shapes of the network. What the bytes hold changes no instruction count.
constexpr size_t kChannels = 60;
constexpr size_t kGemmRows = config::kOperators[1].output.rows;
constexpr size_t kIndirectGemmRows = config::kOperators[6].output.rows;
constexpr size_t kMaxRows = config::kWindowFrames;
constexpr orra_fp32_requant_params kParams{-128, -128, 127};
constexpr orra_rndnu_requant_params kFixedParams{0, 1 << 30, -5, -128, -128, 127};
constexpr orra_s8_clamp_params kClamp{-128, 127};
uint8_t weights[12032];
int8_t in_rows[kMaxRows * kChannels];
int8_t out_rows[kMaxRows * kChannels];
constexpr auto kRowList = [] {
  std::array<const int8_t*, kMaxRows> list = {};
  for (const int8_t*& row : list) row = in_rows;
  return list;
}();

}  // namespace

std::vector<Kernel> QuantisedKernels() {
  return {
      {kGemm.name, CompareGemm,
       [](Side side) {
         kGemm.of[side](kGemmRows, kChannels, 48, in_rows, 48, weights, out_rows, kChannels, 8,
                        &kParams);
       }},
      {kGemmMaxPool.name, CompareGemmMaxPool,
       [](Side side) {
         kGemmMaxPool.of[side](2, kChannels, 48, in_rows, 48, weights, out_rows, kChannels, 8,
                               &kParams);
       }},
      {kIndirectGemm.name, CompareIndirectGemm,
       [](Side side) {
         kIndirectGemm.of[side](kIndirectGemmRows, kChannels, kChannels, 12 * sizeof kRowList[0],
                                kRowList.data(), weights, out_rows, kChannels, 8, 0, nullptr,
                                &kParams);
       }},
      {kFixedPointGemm.name, CompareFixedPointGemm,
       [](Side side) {
         kFixedPointGemm.of[side](1, 64, kChannels, in_rows, kChannels, weights, out_rows, 64, 8,
                                  &kFixedParams);
       }},
      {kDepthwise.name, CompareDepthwise,
       [](Side side) {
         kDepthwise.of[side](48, kGemmRows, kRowList.data(), weights, out_rows, sizeof kRowList[0],
                             0, 0, nullptr, &kParams);
       }},
      {kMaxPool.name, CompareMaxPool,
       [](Side side) {
         kMaxPool.of[side](190, 2, kChannels, kRowList.data(), 0, out_rows, 0, 0, &kClamp);
       }},
      {"orra_qs8_f32_vcvt_ukernel__neon_x32"},
      {"orra_x8_lut_ukernel__scalar_x2"},
  };
}

}  // namespace qz::test
