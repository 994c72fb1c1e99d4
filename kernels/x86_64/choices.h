// Which text of each kernel runs on a PC. One row a kernel, in the order of the rooms' headers:
//
//   avx2        a text of its own, kernels/*/avx2/, where the processor has AVX2
//   avx2_plain  the plain text, compiled for AVX2, likewise: g++ does it about as well
//   avx512vnni  a text of its own, kernels/*/avx512vnni/, where the processor has AVX512-VNNI and
//               AVX512VL; else as avx2
//
// On any other processor the plain text runs as compiled for every x86-64. The loader chooses, once
// (choose.h).
#pragma once

namespace qz {

enum ChoiceRow { avx2, avx2_plain, avx512vnni };

struct Choice {
  const char* kernel;
  ChoiceRow row;
};

}  // namespace qz

// clang-format off
#define QZ_SIGNAL_CHOICES(ROW)                                                  \
  ROW(orra_s16_window_shift12_ukernel__neon_x32, avx2)                      \
  ROW(orra_s16_rmaxabs_ukernel__neon_x32, avx2_plain)                             \
  ROW(orra_i16_vlshift_ukernel__neon_x32, avx2_plain)                             \
  ROW(orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4, avx2)          \
  ROW(orra_cs16_bfly4_samples4_ukernel__neon, avx2)                         \
  ROW(orra_cs16_bfly4_ukernel__neon_x4, avx2)                               \
  ROW(orra_cs16_fftr_ukernel__asm_aarch32_neon_x4, avx2)                    \
  ROW(orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8, avx2)               \
  ROW(orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2, avx2)    \
  ROW(orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1, avx2) \
  ROW(orra_u32_filterbank_subtract_ukernel__scalar_x2, avx2)                \
  ROW(orra_u32_vlog_ukernel__scalar_x1, avx2)

#define QZ_QUANTISED_CHOICES(ROW)                                                                 \
  ROW(orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35, avx512vnni)   \
  ROW(orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35, avx512vnni)  \
  ROW(orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7, avx2)     \
  ROW(orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35, avx512vnni)    \
  ROW(orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16, avx2)                                    \
  ROW(orra_qs8_f32_vcvt_ukernel__neon_x32, avx2_plain)                                              \
  ROW(orra_x8_lut_ukernel__scalar_x2, avx2_plain)
// clang-format on

namespace qz {

#define QZ_CHOICE_ROW(kernel, row) {#kernel, row},
constexpr Choice kChoices[] = {QZ_SIGNAL_CHOICES(QZ_CHOICE_ROW)
                                   QZ_QUANTISED_CHOICES(QZ_CHOICE_ROW)};
#undef QZ_CHOICE_ROW

}  // namespace qz
