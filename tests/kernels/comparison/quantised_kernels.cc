#include "quantised_kernels.h"

#include <algorithm>
#include <array>
#include <cmath>

#include "comparison.h"

extern "C" {
decltype(orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35)
    orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35__plain;
decltype(orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35)
    orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35__plain;
decltype(orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7)
    orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7__plain;
decltype(orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35)
    orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35__plain;
decltype(orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16)
    orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16__plain;
decltype(orra_qs8_f32_vcvt_ukernel__neon_x32) orra_qs8_f32_vcvt_ukernel__neon_x32__plain;
decltype(orra_x8_lut_ukernel__scalar_x2) orra_x8_lut_ukernel__scalar_x2__plain;
}

namespace qz::test {
namespace {

constexpr size_t kReadAhead = 7;
constexpr size_t kPoolReadAhead = 15;

size_t Pick(Random& random, size_t low, size_t high) {
  return static_cast<size_t>(random.Between(static_cast<int64_t>(low), static_cast<int64_t>(high)));
}

// Zero points of int8, and now and then beyond; the clamp often the whole range.
orra_fp32_requant_params RandomParams(Random& random) {
  const bool far = random.Next() % 4 == 0;
  const int64_t zero_point = far ? random.Between(INT16_MIN, INT16_MAX) : random.Between(-128, 127);
  const bool open = random.Next() % 2 == 0;
  const int64_t low = open ? -128 : random.Between(-128, 127);
  const int64_t high = open ? 127 : random.Between(low, 127);
  return {static_cast<int16_t>(zero_point), static_cast<int8_t>(low), static_cast<int8_t>(high)};
}

// Shift counts beyond the width of every lane too, and the factor whose square overflows.
orra_rndnu_requant_params RandomFixedParams(Random& random) {
  const bool far = random.Next() % 8 == 0;
  const int64_t pre_shift = far ? random.Between(-300, 300) : random.Between(-4, 4);
  const int64_t post_shift = far ? random.Between(-300, -1) : random.Between(-12, -1);
  const int64_t factor = random.Next() % 8 == 0 ? INT32_MIN : random.Between(INT32_MIN, INT32_MAX);
  const auto [zero_point, low, high] = RandomParams(random);
  return {static_cast<int32_t>(random.Next() % 2 ? pre_shift : 0),
          static_cast<int32_t>(factor),
          static_cast<int32_t>(post_shift),
          zero_point,
          low,
          high};
}

// A scale with which sums of `bits` bits reach int8 and somewhat beyond; a power of two makes ties.
// Some are 0, not a normal number, or take every sum out of range.
float RandomScale(Random& random, int bits) {
  const uint64_t kind = random.Next() % 16;
  if (kind == 0) return 0.0f;
  if (kind == 1) return 1e30f;
  if (kind == 2) return 1e-40f;
  const auto mantissa = static_cast<float>(kind < 8 ? 256 : random.Between(128, 1023));
  return std::ldexp(mantissa, static_cast<int>(random.Between(-3, 1)) - bits);
}

// Blocks of `width` columns with weights for `inputs` inputs. Columns fill up whole blocks, with
// no zeros, so that a use of those beyond the asked ones would show.
std::vector<uint8_t> RandomBlocks(Random& random, size_t columns, size_t width, size_t inputs,
                                  bool with_scales) {
  const int bits = static_cast<int>(random.Between(1, 31));
  std::vector<uint8_t> packed;
  const auto append = [&packed](const auto& values) {
    const auto* bytes = reinterpret_cast<const uint8_t*>(values.data());
    packed.insert(packed.end(), bytes, bytes + values.size() * sizeof values[0]);
  };
  for (size_t first = 0; first < columns; first += width) {
    const int64_t limit = (int64_t{1} << bits) - 1;
    append(ShapedFill<int32_t>(random, width, -limit - 1, limit));
    // Weights of 0 leave the bias alone, whose ties then show.
    append(ShapedFill<int8_t>(random, width * inputs, random.Next() % 4 == 0 ? 0 : -127,
                              random.Next() % 4 == 0 ? 0 : 127));
    std::vector<float> scales;
    for (size_t i = 0; i < width; ++i) {
      scales.push_back(RandomScale(random, std::max(bits, bits < 8 ? 0 : 14)));
    }
    if (with_scales) append(scales);
  }
  return packed;
}

// Nothing behind packed data may be read; of any alignment.
Input<uint8_t> PlacePacked(Random& random, const std::vector<uint8_t>& packed) {
  return {random, packed, Pick(random, 0, 1)};
}

struct MatrixShape {
  explicit MatrixShape(Random& random)
      : m(Pick(random, 1, 4)),
        n(Pick(random, 1, 25)),
        k(Pick(random, 1, 40)),
        a_stride(k + Pick(random, 0, 9)),
        c_block_stride(8 + Pick(random, 0, 3)),
        c_stride((n + 7) / 8 * c_block_stride + Pick(random, 0, 5)) {}
  std::string With(std::string difference) const {
    return WithArguments(std::move(difference), {{"m", m},
                                                 {"n", n},
                                                 {"k", k},
                                                 {"a_stride", a_stride},
                                                 {"c_stride", c_stride},
                                                 {"c_block_stride", c_block_stride}});
  }
  size_t m, n, k, a_stride, c_block_stride, c_stride;
};

std::string CompareGemm(Random& random) {
  const MatrixShape s(random);
  const auto values = ShapedFill<int8_t>(random, (s.m - 1) * s.a_stride + s.k);
  const Input<int8_t> a(random, values, kReadAhead);
  const auto w = PlacePacked(random, RandomBlocks(random, s.n, 8, s.k, true));
  const orra_fp32_requant_params params = RandomParams(random);
  Outputs<int8_t> c(random, s.m * s.c_stride);
  orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      s.m, s.n, s.k, a.data(), s.a_stride, w.data(), c.running(), s.c_stride, s.c_block_stride,
      &params);
  orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35__plain(
      s.m, s.n, s.k, a.data(), s.a_stride, w.data(), c.plain(), s.c_stride, s.c_block_stride,
      &params);
  return s.With(c.Difference());
}

// Lists of rows of one input; some are the zero row, and `offset` lies between entries and the
// others.
struct RowList {
  RowList(Random& random, size_t entries, size_t row_bytes, size_t read_ahead)
      : rows(random, ShapedFill<int8_t>(random, kRows * row_bytes), read_ahead),
        zero(rows.data() + random.Next() % kRows * row_bytes),
        offset(random.Next() % 2 ? 40000 : 0) {
    for (size_t i = 0; i < entries; ++i) {
      const int8_t* row = rows.data() + random.Next() % kRows * row_bytes;
      const uintptr_t distance = row == zero ? 0 : offset;
      list.push_back(reinterpret_cast<const int8_t*>(reinterpret_cast<uintptr_t>(row) - distance));
    }
  }
  static constexpr size_t kRows = 9;
  Input<int8_t> rows;
  const int8_t* zero;
  size_t offset;
  std::vector<const int8_t*> list;
};

std::string CompareIndirectGemm(Random& random) {
  const MatrixShape s(random);
  const size_t taps = Pick(random, 1, 4), tap_bytes = 4 * taps * sizeof(const int8_t*);
  const RowList in(random, 4 * taps, s.k, kReadAhead);
  const auto w = PlacePacked(random, RandomBlocks(random, s.n, 8, taps * s.k, true));
  const orra_fp32_requant_params params = RandomParams(random);
  Outputs<int8_t> c(random, s.m * s.c_stride);
  orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      s.m, s.n, s.k, tap_bytes, in.list.data(), w.data(), c.running(), s.c_stride, s.c_block_stride,
      in.offset, in.zero, &params);
  orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35__plain(
      s.m, s.n, s.k, tap_bytes, in.list.data(), w.data(), c.plain(), s.c_stride, s.c_block_stride,
      in.offset, in.zero, &params);
  return WithArguments(s.With(c.Difference()), {{"taps", taps}});
}

std::string CompareFixedPointGemm(Random& random) {
  const MatrixShape s(random);
  const Input<int8_t> a(random, ShapedFill<int8_t>(random, s.k), kReadAhead);
  const auto w = PlacePacked(random, RandomBlocks(random, s.n, 8, s.k, false));
  const orra_rndnu_requant_params params = RandomFixedParams(random);
  Outputs<int8_t> c(random, s.c_stride);
  orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
      s.m, s.n, s.k, a.data(), s.a_stride, w.data(), c.running(), s.c_stride, s.c_block_stride,
      &params);
  orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7__plain(
      s.m, s.n, s.k, a.data(), s.a_stride, w.data(), c.plain(), s.c_stride, s.c_block_stride,
      &params);
  return WithArguments(s.With(c.Difference()), {{"pre_shift", params.pre_shift},
                                                {"multiplier", params.multiplier},
                                                {"post_shift", params.post_shift}});
}

std::string CompareDepthwise(Random& random) {
  const size_t channels = Pick(random, 1, 50), width = Pick(random, 1, 5);
  const size_t step = Pick(random, 1, 4), gap = Pick(random, 0, 5);
  const RowList in(random, (width - 1) * step + 3, channels, kReadAhead);
  const auto w = PlacePacked(random, RandomBlocks(random, channels, 16, 3, true));
  const orra_fp32_requant_params params = RandomParams(random);
  Outputs<int8_t> out(random, width * (channels + gap));
  orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
      channels, width, in.list.data(), w.data(), out.running(), step * sizeof in.list[0], gap,
      in.offset, in.zero, &params);
  orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35__plain(
      channels, width, in.list.data(), w.data(), out.plain(), step * sizeof in.list[0], gap,
      in.offset, in.zero, &params);
  return WithArguments(out.Difference(),
                       {{"channels", channels}, {"width", width}, {"step", step}, {"gap", gap}});
}

// The entry that an odd pool skips and those of the gap name nothing that can be read.
std::string CompareMaxPool(Random& random) {
  const size_t channels = Pick(random, 1, 50), positions = Pick(random, 1, 5);
  const size_t pool_size = Pick(random, 1, 6), list_gap = Pick(random, 0, 2);
  const size_t gap = Pick(random, 0, 5);
  const auto values = ShapedFill<int8_t>(random, 20 * channels);
  const Input<int8_t> rows(random, values, kPoolReadAhead);
  const auto [zero_point, low, high] = RandomParams(random);
  const orra_s8_clamp_params params{low, high};
  std::vector<uintptr_t> list;
  for (size_t p = 0; p < positions; ++p) {
    for (size_t e = 0; e < pool_size; ++e) list.push_back(random.Next() % 20 * channels);
    list.insert(list.end(), pool_size % 2 + list_gap, UINTPTR_MAX / 2);
  }
  Outputs<int8_t> out(random, positions * (channels + gap));
  const auto* entries = reinterpret_cast<const int8_t* const*>(list.data());
  const auto base = reinterpret_cast<uintptr_t>(rows.data());
  orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(positions, pool_size, channels, entries, base,
                                                out.running(), list_gap * sizeof list[0], gap,
                                                &params);
  orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16__plain(positions, pool_size, channels, entries,
                                                       base, out.plain(), list_gap * sizeof list[0],
                                                       gap, &params);
  return WithArguments(out.Difference(), {{"channels", channels},
                                          {"positions", positions},
                                          {"pool_size", pool_size},
                                          {"list_gap", list_gap},
                                          {"gap", gap}});
}

std::string CompareConversion(Random& random) {
  const size_t count = Pick(random, 1, 80);
  const Input<int8_t> in(random, ShapedFill<int8_t>(random, count), kReadAhead);
  const auto negated = static_cast<int16_t>(random.Between(INT16_MIN, INT16_MAX));
  const auto mantissa = static_cast<float>(random.Between(-(1 << 24), 1 << 24));
  const float scale = std::ldexp(mantissa, static_cast<int>(random.Between(-120, 80)));
  const orra_dequant_params params{{negated, negated}, scale};
  Outputs<float> out(random, count);
  orra_qs8_f32_vcvt_ukernel__neon_x32(count, in.data(), out.running(), &params);
  orra_qs8_f32_vcvt_ukernel__neon_x32__plain(count, in.data(), out.plain(), &params);
  return WithArguments(out.Difference(), {{"count", count}, {"negated_zero_point", negated}});
}

std::string CompareLookup(Random& random) {
  const size_t count = Pick(random, 1, 40);
  const auto bytes = ShapedFill<uint8_t>(random, count);
  const Input<uint8_t> table(random, ShapedFill<uint8_t>(random, 256), 0);
  Outputs<uint8_t> out(random, bytes);
  orra_x8_lut_ukernel__scalar_x2(count, out.running(), out.running(), table.data());
  orra_x8_lut_ukernel__scalar_x2__plain(count, out.plain(), out.plain(), table.data());
  return WithArguments(out.Difference(), {{"count", count}});
}

// The shapes of the network. What the bytes hold changes no instruction count.
constexpr size_t kChannels = 60;
constexpr orra_fp32_requant_params kParams{-128, -128, 127};
uint8_t weights[12032];
int8_t in_rows[382 * kChannels];
int8_t out_rows[382 * kChannels];
float out_floats[5];
constexpr auto kRowList = [] {
  std::array<const int8_t*, 382> list = {};
  for (const int8_t*& row : list) row = in_rows;
  return list;
}();

template <decltype(orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35)*
              kKernel>
void RunGemm() {
  kKernel(4, kChannels, 48, in_rows, 48, weights, out_rows, kChannels, 8, &kParams);
}

template <decltype(orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35)*
              kKernel>
void RunIndirectGemm() {
  kKernel(4, kChannels, kChannels, 12 * sizeof kRowList[0], kRowList.data(), weights, out_rows,
          kChannels, 8, 0, nullptr, &kParams);
}

template <
    decltype(orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7)* kKernel>
void RunFixedPointGemm() {
  constexpr orra_rndnu_requant_params kFixedParams{0, 1427340160, -5, -128, -128, 127};
  kKernel(1, 64, kChannels, in_rows, kChannels, weights, out_rows, 64, 8, &kFixedParams);
}

template <decltype(orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35)*
              kKernel>
void RunDepthwise() {
  kKernel(48, 380, kRowList.data(), weights, out_rows, sizeof kRowList[0], 0, 0, nullptr, &kParams);
}

template <decltype(orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16)* kKernel>
void RunMaxPool() {
  constexpr orra_s8_clamp_params kClamp{-128, 127};
  kKernel(190, 2, kChannels, kRowList.data(), 0, out_rows, 0, 0, &kClamp);
}

template <decltype(orra_qs8_f32_vcvt_ukernel__neon_x32)* kKernel>
void RunConversion() {
  constexpr orra_dequant_params kDequantParams{{128, 128}, 1.0f / 256};
  kKernel(5, in_rows, out_floats, &kDequantParams);
}

template <decltype(orra_x8_lut_ukernel__scalar_x2)* kKernel>
void RunLookup() {
  kKernel(5, weights, weights, weights + 256);
}

}  // namespace

std::vector<Kernel> QuantisedKernels() {
  return {
      QZ_KERNEL(orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35,
                "gemm", CompareGemm, RunGemm),
      QZ_KERNEL(orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35,
                "indirect_gemm", CompareIndirectGemm, RunIndirectGemm),
      QZ_KERNEL(orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7,
                "fixed_point_gemm", CompareFixedPointGemm, RunFixedPointGemm),
      QZ_KERNEL(orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35,
                "depthwise", CompareDepthwise, RunDepthwise),
      QZ_KERNEL(orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16, "max_pool", CompareMaxPool,
                RunMaxPool),
      QZ_KERNEL(orra_qs8_f32_vcvt_ukernel__neon_x32, "conversion", CompareConversion,
                RunConversion),
      QZ_KERNEL(orra_x8_lut_ukernel__scalar_x2, "lookup", CompareLookup, RunLookup),
  };
}

}  // namespace qz::test
