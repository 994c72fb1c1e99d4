// SPDX-License-Identifier: Apache-2.0
// Fixed-point building blocks of the audio front end. The reference implementations define the
// results: a variant for one processor equals them bit for bit.
//
// A kernel's name carries the element type, the operation, and a suffix for the processor variant
// and the elements per step that it was laid out for:
//   s16, i16  16-bit values, signed or of either sign
//   u32       unsigned 32-bit; u64_u32 is unsigned 64-bit in, unsigned 32-bit out
//   cs16      complex: two int16, real part first. A complex array is a plain int16 array of pairs.
//
// Common to all: no state, no allocation and no failure; sizes are checked
// (kernels/precondition.h), but not on the device. Arguments named *_bytes or `bytes` count bytes,
// all other sizes count elements; every count is at least 1 unless said otherwise. Arrays are
// aligned to their element type and do not overlap unless said otherwise.
// >> on signed values is an arithmetic (floor) shift; "wraps" means that the low bits are kept,
// two's complement.
#pragma once

#include <cstddef>
#include <cstdint>

extern "C" {

// Windowing. output = saturate16((input * weights[i]) >> 12) for sample i of each of `rows` rows of
// row_bytes/2 samples that lie one after another in input and in output; all rows share weights.
// Q format: weights Q12 (4096 = 1.0), output in the format of input, rounded downwards. Saturates.
// row_bytes is even. shift is not used: the shift is always 12.
void orra_s16_window_shift12_ukernel__neon_x32(size_t rows, size_t row_bytes, const int16_t* input,
                                               const int16_t* weights, int16_t* output,
                                               uint32_t shift);

// Peak. *output = the largest |x| over bytes/2 samples, in the format of input; |-32768| is 32768,
// so nothing saturates. bytes is even.
void orra_s16_rmaxabs_ukernel__neon_x32(size_t bytes, const int16_t* input, uint16_t* output);

// Left shift. output = input * 2^shift for `count` elements; wraps to 16 bits, so that a shift of
// 16 or more gives 0. output may equal input or lie before it: elements go in increasing order.
void orra_i16_vlshift_ukernel__neon_x32(size_t count, const int16_t* input, int16_t* output,
                                        uint32_t shift);

// Input order of a radix-4 FFT of 256 complex entries. Entry i of output receives value r of input,
// the four base-4 digits of i in reverse order, or 0 where r is `count` or more. count is a
// multiple of 4 from 192 to 256.
void orra_cs16_digitreverse_ukernel__neon_x16(size_t count, const int16_t* input, int16_t* output);

// Radix-4 butterflies of a forward decimation-in-time FFT, in place. Inputs x0 to x3 and twiddles
// w1 to w3 (Q15, 32767 = 1.0) become, with xm' = (xm * 8191 + 16384) >> 15 (about xm/4) on each
// part and am = xm' * wm, each part (... + 16384) >> 15,
//   y0 = x0' + a1 + a2 + a3            y2 = x0' - a1 + a2 - a3
//   y1 = x0' - a2 - j (a1 - a3)        y3 = x0' - a2 + j (a1 - a3)
// Q format: out = in, scaled by about 1/4. Nothing saturates: entries of magnitude up to 32700 stay
// in range, but with both parts near full scale they are larger and may make sums wrap to 16 bits.
//
// First stage: `butterflies` butterflies on four consecutive entries each, with all twiddles 1 and
// no twiddle product (am = xm'). quarter_bytes, twiddles and twiddle_stride are not used.
void orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4(size_t butterflies, size_t quarter_bytes,
                                                           int16_t* data, const int16_t* twiddles,
                                                           size_t twiddle_stride);

// Second stage: `groups` groups of four quarters of quarter_bytes each, quarter_bytes exactly 16 (4
// entries). Butterfly k takes entry k of each quarter; wm is row m - 1, column k of
// vrd_table_fft256_samples4_twiddle. twiddles and twiddle_stride are not used.
void orra_cs16_bfly4_samples4_ukernel__neon(size_t groups, size_t quarter_bytes, int16_t* data,
                                            const int16_t* twiddles, size_t twiddle_stride);

// Any later stage: as above with quarter_bytes a multiple of 16; wm of butterfly k stands m * k *
// twiddle_stride bytes into twiddles, the same for every group. twiddle_stride is a multiple of 4.
void orra_cs16_bfly4_ukernel__neon_x4(size_t groups, size_t quarter_bytes, int16_t* data,
                                      const int16_t* twiddles, size_t twiddle_stride);

// Split step of a real FFT of 2N samples, in place. data holds the N = count results Z of the
// complex FFT of (x[2n], x[2n + 1]) and has room for N + 1 entries; afterwards it holds bins 0 to N
// of the real spectrum. twiddles holds N/2 values in Q15: entry k - 1, w below, is
// -j e^(-j pi k / N). N is a multiple of 8. With z = (Z * 16383 + 16384) >> 15 on each part,
//   E = z[k] + conj z[N - k]        bin k = (E + O) >> 1
//   O = w (z[k] - conj z[N - k])    bin N - k = conj(E - O) >> 1
// for k = 1 to N/2; each part of O is (... + 16384) >> 15; bin N/2 is that of the second form. Bins
// 0 and N are Re z[0] + Im z[0] and Re z[0] - Im z[0].
// Q format: out = in, scaled by about 1/2. No result can leave 16 bits: parts of z are at most
// 16383 and those of a twiddle at most 1.
void orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(size_t count, int16_t* data,
                                                 const int16_t* twiddles);

// Power. output = re^2 + im^2 for bytes/4 complex values, exact: integers in, integers of the
// squared unit out, at most 2^31 (unsigned). bytes is a multiple of 4.
void orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8(size_t bytes, const int16_t* input,
                                                      uint32_t* output);

// Overlapping triangular filters. The bins of input fall into rows + 1 consecutive segments of
// widths[] bins (each at least 1); weights holds a pair (w0, w1) for every bin in order. output[r]
// is the sum of input * w1 over segment r plus the sum of input * w0 over segment r + 1: a triangle
// that rises over segment r and falls over segment r + 1. The w0 of the first and the w1 of the
// last segment go unused.
// Q format: weights Q12, output = Q12 of the unit of input. Exact as long as a sum stays below
// 2^64; beyond, it wraps.
void orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2(size_t rows, const uint32_t* input,
                                                                 const uint8_t* widths,
                                                                 const uint16_t* weights,
                                                                 uint64_t* output);

// Square root, then right shift. output = round(sqrt(v)) >> shift for bytes/8 values v; integers in
// and out. The root is the nearest integer (there is no tie), but saturates at 65535 for v below
// 2^32 and at 2^32 - 1 in all. A shift of 32 or more gives 0. bytes is a multiple of 8.
void orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1(size_t bytes,
                                                                      const uint64_t* input,
                                                                      uint32_t* output,
                                                                      uint32_t shift);

// Noise subtraction with a running estimate over count channels (even). With F = fraction_bits, S
// and K the smoothing and retain factors of the channel (one pair for even, one for odd channels),
// and the level s = input << scale_bits (wraps to 32 bits):
//   noise = (s * S + noise * K) >> F, wraps to 32 bits; updated first, then subtracted:
//   output = max(max(s - noise, 0) >> scale_bits, (input * floor_fraction) >> F)
// Q format: factors Q(F); noise in the unit of input times 2^scale_bits, output in the unit of
// input. scale_bits is below 32, F below 64; products and sums are 64-bit.
void orra_u32_filterbank_subtract_ukernel__scalar_x2(size_t count, const uint32_t* input,
                                                     uint32_t smoothing_even,
                                                     uint32_t smoothing_odd, uint32_t retain_even,
                                                     uint32_t retain_odd, uint32_t floor_fraction,
                                                     uint32_t scale_bits, uint32_t fraction_bits,
                                                     uint32_t* noise, uint32_t* output);

// Natural logarithm. output = output_scale * ln(y) rounded to an integer, or 0 for y = 0, where
// y = input << input_shift (wraps to 32 bits; a shift of 32 or more gives 0). count may be 0.
// Q format: integers in and out, Q16 inside. Saturates at 32767; for an output_scale above 2954
// the 32-bit product can wrap. log2 is table-driven, good to 0.0035, and steps down slightly at
// some ends of table segments: at output_scale 16 the result is within 0.54 of the real logarithm,
// but not monotone.
void orra_u32_vlog_ukernel__scalar_x1(size_t count, const uint32_t* input, uint32_t input_shift,
                                      uint32_t output_scale, uint16_t* output);

}  // extern "C"
