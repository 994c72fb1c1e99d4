// SPDX-License-Identifier: Apache-2.0
// The quantised kernels under their own names: each calls the implementation for this processor.

#include "kernels/quantised/quantised_kernels.h"

#include "kernels/precondition.h"
#include "kernels/x86_64/choice.h"
#include "kernels/x86_64/implementations.h"

namespace {

using qz::QuantisedKernels;

extern const qz::Choice<QuantisedKernels> choice;

#define QZ_FIRST_CALL(source, title, neon, avx2, avx512vnni, kernel) \
  qz::FirstCall<choice, &QuantisedKernels::kernel>::Call,
constexpr QuantisedKernels kFirstCalls = {QZ_QUANTISED_KERNELS(QZ_FIRST_CALL)};
#undef QZ_FIRST_CALL

std::atomic<size_t> chosen;
constexpr qz::Choice<QuantisedKernels> choice = {
    {&kFirstCalls, &qz::kQuantisedReference, &qz::kQuantisedAvx2, &qz::kQuantisedAvx512Vnni},
    chosen};

}  // namespace

void orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
    size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w, int8_t* c,
    size_t c_stride, size_t c_block_stride, const orra_fp32_requant_params* params) {
  qz::Require(m > 0 && n > 0 && k > 0);
  choice.Get().orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      m, n, k, a, a_stride, w, c, c_stride, c_block_stride, params);
}

void orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon(size_t m, size_t n, size_t k,
                                                         const int8_t* a, size_t a_stride,
                                                         const void* w, int8_t* c, size_t c_stride,
                                                         size_t c_block_stride,
                                                         const orra_fp32_requant_params* params) {
  qz::Require(m > 0 && n > 0 && k > 0);
  choice.Get().orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon(
      m, n, k, a, a_stride, w, c, c_stride, c_block_stride, params);
}

void orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
    size_t m, size_t n, size_t k, size_t tap_bytes, const int8_t* const* a_ptrs, const void* w,
    int8_t* c, size_t c_stride, size_t c_block_stride, size_t a_offset, const int8_t* zero,
    const orra_fp32_requant_params* params) {
  qz::Require(m > 0 && n > 0 && k > 0 && tap_bytes > 0 && tap_bytes % (4 * sizeof *a_ptrs) == 0);
  choice.Get().orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      m, n, k, tap_bytes, a_ptrs, w, c, c_stride, c_block_stride, a_offset, zero, params);
}

void orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
    size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w, int8_t* c,
    size_t c_stride, size_t c_block_stride, const orra_rndnu_requant_params* params) {
  qz::Require(n > 0 && k > 0 && params->post_shift < 0);
  choice.Get().orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
      m, n, k, a, a_stride, w, c, c_stride, c_block_stride, params);
}

void orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
    size_t channels, size_t width, const int8_t* const* in_ptrs, const void* w, int8_t* out,
    size_t in_ptrs_step, size_t out_gap, size_t in_offset, const int8_t* zero,
    const orra_fp32_requant_params* params) {
  qz::Require(channels > 0 && width > 0);
  choice.Get().orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
      channels, width, in_ptrs, w, out, in_ptrs_step, out_gap, in_offset, zero, params);
}

void orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(size_t positions, size_t pool_size,
                                                   size_t channels, const int8_t* const* in_ptrs,
                                                   size_t in_offset, int8_t* out,
                                                   size_t in_ptrs_gap, size_t out_gap,
                                                   const orra_s8_clamp_params* params) {
  qz::Require(positions > 0 && pool_size > 0 && channels > 0);
  choice.Get().orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
      positions, pool_size, channels, in_ptrs, in_offset, out, in_ptrs_gap, out_gap, params);
}

void orra_qs8_f32_vcvt_ukernel__neon_x32(size_t count, const int8_t* input, float* output,
                                         const orra_dequant_params* params) {
  qz::Require(count > 0);
  choice.Get().orra_qs8_f32_vcvt_ukernel__neon_x32(count, input, output, params);
}

void orra_x8_lut_ukernel__scalar_x2(size_t count, const uint8_t* input, uint8_t* output,
                                    const uint8_t* table) {
  qz::Require(count > 0);
  choice.Get().orra_x8_lut_ukernel__scalar_x2(count, input, output, table);
}
