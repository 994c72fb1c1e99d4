// SPDX-License-Identifier: Apache-2.0
// The eight kernels of the int8 network. Every kernel is a pure function of its arguments and of
// the memory they point to; none allocates or fails. Results are exact to the byte: the reference
// implementations define them, and a variant for one processor has to equal them.
//
// Quantisation. Activations are int8 with real value = scale * (q - zero point). Weights are
// symmetric int8, -127 to 127, never -128. No kernel subtracts an input zero point: a packed bias
// is the layer's bias in accumulator units minus input zero point * (sum of the column's weights).
// Accumulators are int32 and wrap around (two's complement); requantisation saturates.
//
// Packed weights are little-endian and need no alignment. What is beyond the last real column of
// the last block (or channel of the last group) is zero.
//   GEMM block, 8 columns:      int32 bias[8]; int8 weight[k][8]; float scale[8]   64 + 8k bytes
//   indirect GEMM block:        int32 bias[8]; int8 weight[taps][k][8]; float scale[8]
//   GEMM block without scales:  int32 bias[8]; int8 weight[k][8]                   32 + 8k bytes
//   depthwise group, 16 ch.:    int32 bias[16]; int8 weight[3][16]; float scale[16]    176 bytes
// A scale is input scale * weight scale of the column / output scale, non-negative and finite.
//
// Preconditions of all: counts of at least 1, records aligned as the compiler does it, outputs
// apart from inputs (lookup excepted). Rows may be read by a variant up to 7 bytes past their last
// channel or element (max pool: 15): the caller keeps those bytes readable. No byte outside the
// stated outputs is written. Sums have up to 65,536 products: variants for PCs keep some columns'
// weights on the stack. Preconditions that can be checked are (preconditions.h), but not on the
// device.
#pragma once

#include <cstddef>
#include <cstdint>

extern "C" {

// Requantisation by a float scale per column: round(float(acc) * scale), ties to even, then + zero
// point, saturated to int8 and clamped: min(max(q, output_min), output_max), so that output_max
// results where it is the smaller. Both float steps are single precision, so a large accumulator is
// rounded to 24 bits first.
struct orra_fp32_requant_params {
  int16_t output_zero_point;
  int8_t output_min;
  int8_t output_max;
};

// Requantisation by one fixed-point factor, multiplier / 2^(31 - pre_shift - post_shift):
//   pre_shift >= 0: acc * 2^pre_shift, saturated to int32; below 0: floor(acc / 2^-pre_shift);
//   then floor(acc * multiplier / 2^31), saturated to int32;
//   then floor(acc / 2^-post_shift + 1/2): halves go upwards. post_shift is negative.
// Zero point, saturation and clamp follow as for the float scale.
struct orra_rndnu_requant_params {
  int32_t pre_shift;
  int32_t multiplier;
  int32_t post_shift;
  int16_t output_zero_point;
  int8_t output_min;
  int8_t output_max;
};

struct orra_s8_clamp_params {
  int8_t output_min;
  int8_t output_max;
};

// Both halves hold the negated zero point, for variants that read them as one word.
struct orra_dequant_params {
  int16_t negated_zero_point[2];
  float scale;
};

static_assert(sizeof(orra_fp32_requant_params) == 4 && sizeof(orra_rndnu_requant_params) == 16 &&
                  sizeof(orra_s8_clamp_params) == 2 && sizeof(orra_dequant_params) == 8,
              "records have no gaps");

// Matrix product: for r < m and j < n,
//   c[r][j] = requantise_j(bias[j] + sum over i < k of a[r][i] * weight[i][j]).
// a: [m][k] int8, rows a_stride bytes apart; w: GEMM blocks; c: [m][n] int8, rows c_stride bytes
// apart, each block of 8 columns c_block_stride bytes after the one before (8: dense). Any m.
void orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
    size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w, int8_t* c,
    size_t c_stride, size_t c_block_stride, const orra_fp32_requant_params* params);

// Matrix product and max pool of neighbouring rows in one: for r < m and j < n,
//   c[r][j] = requantise_j(max over p < 2 of (bias[j] + sum over i < k of
//             a[2r + p][i] * weight[i][j])).
// The maximum is taken of the sums, which gives the pool of the requantised rows: requantisation
// never decreases, as scales are not negative. a: [2m][k]; all else as above.
void orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon(size_t m, size_t n, size_t k,
                                                         const int8_t* a, size_t a_stride,
                                                         const void* w, int8_t* c, size_t c_stride,
                                                         size_t c_block_stride,
                                                         const orra_fp32_requant_params* params);

// The matrix product over listed rows, summed over taps: convolution without copying rows together.
//   c[r][j] = requantise_j(bias[j] + sum over t and i < k of row(t, r)[i] * weight[t][i][j])
// a_ptrs: [(m + 3) / 4][taps][4] row addresses, a list for each tile of 4 rows. The last one is
// full too (the rows that it names in excess readable, their results not written); tap_bytes: size
// of one list, taps * 4 * sizeof(pointer). An entry equal to `zero` is used as it is (k bytes
// of the input zero point); a_offset bytes are added to every other. w: indirect GEMM blocks; c,
// c_stride, c_block_stride, m: as above.
void orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
    size_t m, size_t n, size_t k, size_t tap_bytes, const int8_t* const* a_ptrs, const void* w,
    int8_t* c, size_t c_stride, size_t c_block_stride, size_t a_offset, const int8_t* zero,
    const orra_fp32_requant_params* params);

// Matrix product of one row with fixed-point requantisation; w: GEMM blocks without scales.
//   c[j] = requantise(bias[j] + sum over i < k of a[i] * weight[i][j])
// m, a_stride and c_stride are accepted and ignored.
void orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
    size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w, int8_t* c,
    size_t c_stride, size_t c_block_stride, const orra_rndnu_requant_params* params);

// Depthwise convolution of 3 taps: for output position p < width and channel c < channels,
//   out[p][c] = requantise_c(bias[c] + sum over t < 3 of row(p, t)[c] * weight[t][c]).
// row(p, t) is entry t of the list after p advances of in_ptrs_step bytes, with in_offset bytes
// added unless the entry equals `zero`. out_gap bytes follow the `channels` bytes of each position.
// Clamped in the other order, max(min(q, output_max), output_min): output_min results where it is
// the larger. w: depthwise groups; weights of -128 would overflow the 16-bit sums of variants.
void orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
    size_t channels, size_t width, const int8_t* const* in_ptrs, const void* w, int8_t* out,
    size_t in_ptrs_step, size_t out_gap, size_t in_offset, const int8_t* zero,
    const orra_fp32_requant_params* params);

// Maximum over listed rows: for output position p < positions and channel c < channels,
//   out[p][c] = clamp(max over e < pool_size of row(p, e)[c], output_min, output_max).
// in_offset bytes are added to every entry, so that entries may be offsets from a base passed
// there. After each position the list advances by pool_size entries rounded up to an even count,
// plus in_ptrs_gap bytes. out_gap bytes follow the `channels` bytes of each position.
void orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(size_t positions, size_t pool_size,
                                                   size_t channels, const int8_t* const* in_ptrs,
                                                   size_t in_offset, int8_t* out,
                                                   size_t in_ptrs_gap, size_t out_gap,
                                                   const orra_s8_clamp_params* params);

// output[i] = float(input[i] + negated zero point) * scale, i < count: one rounding, of the
// product.
void orra_qs8_f32_vcvt_ukernel__neon_x32(size_t count, const int8_t* input, float* output,
                                         const orra_dequant_params* params);

// output[i] = table[input[i]], i < count; table: 256 bytes. input and output may be the same.
void orra_x8_lut_ukernel__scalar_x2(size_t count, const uint8_t* input, uint8_t* output,
                                    const uint8_t* table);

}  // extern "C"
