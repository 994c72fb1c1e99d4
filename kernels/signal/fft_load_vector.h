// SPDX-License-Identifier: Apache-2.0
// The digit-reversed load with vectors of four complex values, in the compiler's own vector types:
// the variants for NEON and AVX2 are this code. Internal linkage: what is compiled for AVX2 must
// not be linked to others.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace qz::signal {

// Four complex values side by side, moved as they lie in memory.
using FourComplex = uint32_t __attribute__((vector_size(16)));

static inline FourComplex LoadFour(const int16_t* values) {
  FourComplex four;
  std::memcpy(&four, values, sizeof(four));
  return four;
}

static inline void StoreFour(int16_t* entries, FourComplex four) {
  std::memcpy(entries, &four, sizeof(four));
}

// The middle digits of an index select 16 values and 16 entries; the outer ones make a
// transposition of 4 x 4: r = 64 d + low + a goes to i = 64 a + middle + d.
static inline void LoadDigitReversed(size_t count, const int16_t* input, int16_t* output) {
  for (size_t low = 0; low < 64; low += 4) {
    const int16_t* from = input + 2 * low;
    const FourComplex d0 = LoadFour(from);
    const FourComplex d1 = LoadFour(from + 2 * 64);
    const FourComplex d2 = LoadFour(from + 2 * 128);
    const FourComplex d3 = 192 + low < count ? LoadFour(from + 2 * 192) : FourComplex{};
    const FourComplex even_a01 = __builtin_shufflevector(d0, d2, 0, 4, 1, 5);
    const FourComplex even_a23 = __builtin_shufflevector(d0, d2, 2, 6, 3, 7);
    const FourComplex odd_a01 = __builtin_shufflevector(d1, d3, 0, 4, 1, 5);
    const FourComplex odd_a23 = __builtin_shufflevector(d1, d3, 2, 6, 3, 7);
    const size_t middle = 16 * (low / 4 % 4) + 4 * (low / 16);
    int16_t* to = output + 2 * middle;
    StoreFour(to, __builtin_shufflevector(even_a01, odd_a01, 0, 4, 1, 5));
    StoreFour(to + 2 * 64, __builtin_shufflevector(even_a01, odd_a01, 2, 6, 3, 7));
    StoreFour(to + 2 * 128, __builtin_shufflevector(even_a23, odd_a23, 0, 4, 1, 5));
    StoreFour(to + 2 * 192, __builtin_shufflevector(even_a23, odd_a23, 2, 6, 3, 7));
  }
}

}  // namespace qz::signal
