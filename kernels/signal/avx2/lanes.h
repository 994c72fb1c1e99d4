// SPDX-License-Identifier: Apache-2.0
// Vectors of eight 32-bit lanes, and those at an array's end of which only the first are in use.
#pragma once

#include <immintrin.h>

#include <cstddef>

namespace qz::signal {

// All bits of the first `count` lanes.
static inline __m256i FirstLanes(size_t count) {
  return _mm256_cmpgt_epi32(_mm256_set1_epi32(static_cast<int>(count)),
                            _mm256_setr_epi32(0, 1, 2, 3, 4, 5, 6, 7));
}

// Results of even lanes, in the lower halves of 64-bit lanes, together with those of odd ones.
static inline __m256i EvenAndOdd(__m256i even, __m256i odd) {
  return _mm256_blend_epi32(even, _mm256_slli_epi64(odd, 32), 0xAA);
}

}  // namespace qz::signal
