// SPDX-License-Identifier: Apache-2.0
// Four complex values side by side, and the arithmetic of signal_arithmetic.h on all of them.
#pragma once

#include <arm_neon.h>

#include <cstdint>

namespace qz::signal {

struct ComplexLanes {
  int16x4_t re;
  int16x4_t im;
};

inline ComplexLanes operator+(ComplexLanes a, ComplexLanes b) {
  return {vadd_s16(a.re, b.re), vadd_s16(a.im, b.im)};
}

inline ComplexLanes operator-(ComplexLanes a, ComplexLanes b) {
  return {vsub_s16(a.re, b.re), vsub_s16(a.im, b.im)};
}

inline ComplexLanes Load(const int16_t* four) {
  const int16x4x2_t parts = vld2_s16(four);
  return {parts.val[0], parts.val[1]};
}

inline void Store(int16_t* four, ComplexLanes a) {
  const int16x4x2_t parts = {{a.re, a.im}};
  vst2_s16(four, parts);
}

inline ComplexLanes Reversed(ComplexLanes a) { return {vrev64_s16(a.re), vrev64_s16(a.im)}; }

// The instruction doubles the product, adds 2^15 and keeps the upper 16 bits: RoundQ15 of the
// product. It could saturate for a factor of -32768 only.
inline ComplexLanes Scaled(ComplexLanes a, int16_t q15_factor) {
  const int16x8_t both = vqrdmulhq_s16(vcombine_s16(a.re, a.im), vdupq_n_s16(q15_factor));
  return {vget_low_s16(both), vget_high_s16(both)};
}

// The 32-bit parts of products with twiddles, not yet brought back from Q15.
struct WideComplexLanes {
  int32x4_t re;
  int32x4_t im;
};

inline WideComplexLanes Product(ComplexLanes a, ComplexLanes twiddle) {
  return {vmlsl_s16(vmull_s16(a.re, twiddle.re), a.im, twiddle.im),
          vmlal_s16(vmull_s16(a.re, twiddle.im), a.im, twiddle.re)};
}

// Kept to the low 16 bits.
inline ComplexLanes Rotated(ComplexLanes a, ComplexLanes twiddle) {
  const WideComplexLanes product = Product(a, twiddle);
  return {vrshrn_n_s32(product.re, 15), vrshrn_n_s32(product.im, 15)};
}

}  // namespace qz::signal
