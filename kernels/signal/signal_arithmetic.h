// SPDX-License-Identifier: Apache-2.0
// Fixed-point steps that several signal kernels share.
#pragma once

#include <cstdint>

namespace qz::signal {

// One complex value in working precision: 16-bit values and their sums, not yet wrapped.
struct Complex {
  int32_t re;
  int32_t im;
};

// A product with a Q15 factor brought back to the scale of the other factor; halves go upwards.
inline int32_t RoundQ15(int32_t product) { return (product + 16384) >> 15; }

inline Complex Scaled(const int16_t* value, int32_t q15_factor) {
  return {RoundQ15(value[0] * q15_factor), RoundQ15(value[1] * q15_factor)};
}

// Twiddle in Q15. |a.re| and |a.im| up to 32766 keep every sum inside 32 bits.
inline Complex Rotated(Complex a, const int16_t* twiddle) {
  return {RoundQ15(a.re * twiddle[0] - a.im * twiddle[1]),
          RoundQ15(a.re * twiddle[1] + a.im * twiddle[0])};
}

// Keeps the low 16 bits of both parts (two's complement wrap-around, no saturation).
inline void StoreWrapped(int16_t* value, int32_t re, int32_t im) {
  value[0] = static_cast<int16_t>(re);
  value[1] = static_cast<int16_t>(im);
}

}  // namespace qz::signal
