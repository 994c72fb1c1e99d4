// SPDX-License-Identifier: Apache-2.0
// The signal kernels under their own names: each calls the implementation for this processor.

#include "kernels/signal/signal_kernels.h"

#include "kernels/precondition.h"
#include "kernels/x86_64/choice.h"
#include "kernels/x86_64/implementations.h"

namespace {

using qz::SignalKernels;

extern const qz::Choice<SignalKernels> choice;

#define QZ_FIRST_CALL(source, title, neon, avx2, avx512vnni, kernel) \
  qz::FirstCall<choice, &SignalKernels::kernel>::Call,
constexpr SignalKernels kFirstCalls = {QZ_SIGNAL_KERNELS(QZ_FIRST_CALL)};
#undef QZ_FIRST_CALL

std::atomic<size_t> chosen;
constexpr qz::Choice<SignalKernels> choice = {
    {&kFirstCalls, &qz::kSignalReference, &qz::kSignalAvx2, &qz::kSignalAvx512Vnni}, chosen};

}  // namespace

void orra_s16_window_shift12_ukernel__neon_x32(size_t rows, size_t row_bytes, const int16_t* input,
                                               const int16_t* weights, int16_t* output,
                                               uint32_t shift) {
  qz::Require(rows > 0 && row_bytes > 0 && row_bytes % 2 == 0);
  choice.Get().orra_s16_window_shift12_ukernel__neon_x32(rows, row_bytes, input, weights, output,
                                                         shift);
}

void orra_s16_rmaxabs_ukernel__neon_x32(size_t bytes, const int16_t* input, uint16_t* output) {
  qz::Require(bytes > 0 && bytes % 2 == 0);
  choice.Get().orra_s16_rmaxabs_ukernel__neon_x32(bytes, input, output);
}

void orra_i16_vlshift_ukernel__neon_x32(size_t count, const int16_t* input, int16_t* output,
                                        uint32_t shift) {
  qz::Require(count > 0);
  choice.Get().orra_i16_vlshift_ukernel__neon_x32(count, input, output, shift);
}

void orra_cs16_digitreverse_ukernel__neon_x16(size_t count, const int16_t* input, int16_t* output) {
  qz::Require(count >= 192 && count <= 256 && count % 4 == 0);
  choice.Get().orra_cs16_digitreverse_ukernel__neon_x16(count, input, output);
}

void orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4(size_t butterflies, size_t quarter_bytes,
                                                           int16_t* data, const int16_t* twiddles,
                                                           size_t twiddle_stride) {
  qz::Require(butterflies > 0);
  choice.Get().orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4(
      butterflies, quarter_bytes, data, twiddles, twiddle_stride);
}

void orra_cs16_bfly4_samples4_ukernel__neon(size_t groups, size_t quarter_bytes, int16_t* data,
                                            const int16_t* twiddles, size_t twiddle_stride) {
  qz::Require(groups > 0 && quarter_bytes == 16);
  choice.Get().orra_cs16_bfly4_samples4_ukernel__neon(groups, quarter_bytes, data, twiddles,
                                                      twiddle_stride);
}

void orra_cs16_bfly4_ukernel__neon_x4(size_t groups, size_t quarter_bytes, int16_t* data,
                                      const int16_t* twiddles, size_t twiddle_stride) {
  qz::Require(groups > 0 && quarter_bytes > 0 && quarter_bytes % 16 == 0 &&
              twiddle_stride % 4 == 0);
  choice.Get().orra_cs16_bfly4_ukernel__neon_x4(groups, quarter_bytes, data, twiddles,
                                                twiddle_stride);
}

void orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(size_t count, int16_t* data,
                                                 const int16_t* twiddles) {
  qz::Require(count > 0 && count % 8 == 0);
  choice.Get().orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(count, data, twiddles);
}

void orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8(size_t bytes, const int16_t* input,
                                                      uint32_t* output) {
  qz::Require(bytes > 0 && bytes % 4 == 0);
  choice.Get().orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8(bytes, input, output);
}

void orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2(size_t rows, const uint32_t* input,
                                                                 const uint8_t* widths,
                                                                 const uint16_t* weights,
                                                                 uint64_t* output) {
  qz::Require(rows > 0);
  choice.Get().orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2(rows, input, widths,
                                                                           weights, output);
}

void orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1(size_t bytes,
                                                                      const uint64_t* input,
                                                                      uint32_t* output,
                                                                      uint32_t shift) {
  qz::Require(bytes > 0 && bytes % 8 == 0);
  choice.Get().orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1(bytes, input,
                                                                                output, shift);
}

void orra_u32_filterbank_subtract_ukernel__scalar_x2(size_t count, const uint32_t* input,
                                                     uint32_t smoothing_even,
                                                     uint32_t smoothing_odd, uint32_t retain_even,
                                                     uint32_t retain_odd, uint32_t floor_fraction,
                                                     uint32_t scale_bits, uint32_t fraction_bits,
                                                     uint32_t* noise, uint32_t* output) {
  qz::Require(count > 0 && count % 2 == 0 && scale_bits < 32 && fraction_bits < 64);
  choice.Get().orra_u32_filterbank_subtract_ukernel__scalar_x2(
      count, input, smoothing_even, smoothing_odd, retain_even, retain_odd, floor_fraction,
      scale_bits, fraction_bits, noise, output);
}

void orra_u32_vlog_ukernel__scalar_x1(size_t count, const uint32_t* input, uint32_t input_shift,
                                      uint32_t output_scale, uint16_t* output) {
  choice.Get().orra_u32_vlog_ukernel__scalar_x1(count, input, input_shift, output_scale, output);
}
