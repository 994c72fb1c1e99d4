// SPDX-License-Identifier: Apache-2.0
// Every kernel, and which of its implementations runs on which processor.
//
//   reference       SOURCE.cc in the component's folder: plain C++, which defines the results
//   reference_avx2  the same source compiled for AVX2: g++ does it about as well as by hand
//   neon, avx2, avx512vnni   a variant, SOURCE.cc in the folder of that name
//
// The columns: AArch32 with NEON (its build has no other processor to think of); a PC with AVX2; a
// PC with AVX2, AVX512-VNNI, AVX512BW and AVX512VL. Everything else runs the references.
#pragma once

// clang-format off
#define QZ_SIGNAL_KERNELS(ROW) \
/*  SOURCE             WHAT IT DOES               NEON       AVX2            AVX512-VNNI     KERNEL */ \
ROW(window,            "windowing",               neon,      avx2,           avx2,           orra_s16_window_shift12_ukernel__neon_x32) \
ROW(peak,              "peak of magnitudes",      reference, reference_avx2, reference_avx2, orra_s16_rmaxabs_ukernel__neon_x32) \
ROW(left_shift,        "left shift",              reference, reference_avx2, reference_avx2, orra_i16_vlshift_ukernel__neon_x32) \
ROW(fft_load,          "FFT, input order",       neon,      avx2,           avx2,           orra_cs16_digitreverse_ukernel__neon_x16) \
ROW(fft_butterflies,   "FFT, first stage",        neon,      avx2,           avx2,           orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4) \
ROW(fft_butterflies,   "FFT, second stage",       neon,      avx2,           avx2,           orra_cs16_bfly4_samples4_ukernel__neon) \
ROW(fft_butterflies,   "FFT, later stages",       neon,      avx2,           avx2,           orra_cs16_bfly4_ukernel__neon_x4) \
ROW(fft_real_split,    "FFT, real split",         neon,      avx2,           avx2,           orra_cs16_fftr_ukernel__asm_aarch32_neon_x4) \
ROW(power_spectrum,    "power spectrum",          reference, avx2,           avx2,           orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8) \
ROW(filterbank,        "filterbank",              neon,      avx2,           avx2,           orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2) \
ROW(square_root,       "square root",             reference, avx2,           avx2,           orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1) \
ROW(noise_subtraction, "noise subtraction",       neon,      avx2,           avx2,           orra_u32_filterbank_subtract_ukernel__scalar_x2) \
ROW(logarithm,         "logarithm",               neon,      avx2,           avx2,           orra_u32_vlog_ukernel__scalar_x1)

#define QZ_QUANTISED_KERNELS(ROW) \
/*  SOURCE             WHAT IT DOES               NEON       AVX2            AVX512-VNNI     KERNEL */ \
ROW(gemm,              "matrix product",          neon,      avx2,           avx512vnni,     orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35) \
ROW(gemm_max_pool,     "product, then pooling",   neon,      reference_avx2, reference_avx2, orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon) \
ROW(indirect_gemm,     "convolution",             neon,      avx2,           avx512vnni,     orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35) \
ROW(fixed_point_gemm,  "fully connected layer",   neon,      avx2,           avx2,           orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7) \
ROW(depthwise,         "depthwise convolution",   neon,      avx2,           avx512vnni,     orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35) \
ROW(max_pool,          "max pooling",             neon,      avx2,           avx2,           orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16) \
ROW(conversion,        "conversion to float",     reference, reference_avx2, reference_avx2, orra_qs8_f32_vcvt_ukernel__neon_x32) \
ROW(lookup,            "table lookup",            reference, reference_avx2, reference_avx2, orra_x8_lut_ukernel__scalar_x2)
// clang-format on

namespace qz {

struct KernelRow {
  const char* source;
  const char* title;
  const char* kernel;
  // The implementation by processor.
  const char* neon;
  const char* avx2;
  const char* avx512vnni;
};

#define QZ_KERNEL_ROW(source, title, neon, avx2, avx512vnni, kernel) \
  {#source, title, #kernel, #neon, #avx2, #avx512vnni},
constexpr KernelRow kKernelTable[] = {QZ_SIGNAL_KERNELS(QZ_KERNEL_ROW)
                                          QZ_QUANTISED_KERNELS(QZ_KERNEL_ROW)};
#undef QZ_KERNEL_ROW

}  // namespace qz
