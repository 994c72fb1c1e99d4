// SPDX-License-Identifier: Apache-2.0
// The requantisation by float scales on 256-bit vectors, in the steps by which it is defined:
// multiply, round, saturate to int16, add the zero point, saturate to int8, clamp.
#pragma once

#include <immintrin.h>

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "kernels/quantised/quantised_kernels.h"

namespace qz {

struct OutputRange256 {
  __m256i zero_point;  // int16 lanes
  __m256i low, high;   // int8 lanes
};

static inline OutputRange256 Range256Of(const orra_fp32_requant_params& params) {
  return {_mm256_set1_epi16(params.output_zero_point), _mm256_set1_epi8(params.output_min),
          _mm256_set1_epi8(params.output_max)};
}

// The conversion gives its minimum for all that int32 can't hold, which is wrong for what is too
// large: cut off where int16 ends.
static inline __m256i Round(__m256i sums, __m256 scales) {
  const __m256 values = _mm256_mul_ps(_mm256_cvtepi32_ps(sums), scales);
  return _mm256_cvtps_epi32(_mm256_min_ps(values, _mm256_set1_ps(INT16_MAX)));
}

// 8 sums each of a and b as int16, by quarters a b a b, the zero point added.
static inline __m256i Words(__m256i a, __m256i b, __m256 a_scales, __m256 b_scales,
                            const OutputRange256& range) {
  const __m256i words = _mm256_packs_epi32(Round(a, a_scales), Round(b, b_scales));
  return _mm256_adds_epi16(words, range.zero_point);
}

// 16 words each of a and b as int8, by quarters a b a b.
static inline __m256i Bytes(__m256i a, __m256i b, const OutputRange256& range) {
  const __m256i bytes = _mm256_packs_epi16(a, b);
  return _mm256_min_epi8(_mm256_max_epi8(bytes, range.low), range.high);
}

// Packed data need no alignment.
static inline __m256i LoadInts(const void* from) {
  return _mm256_loadu_si256(static_cast<const __m256i*>(from));
}
static inline __m256 LoadFloats(const void* from) { return _mm256_castsi256_ps(LoadInts(from)); }

// Of the last 1 to 15 bytes of a row, no more than 7 too many are read.
static inline __m128i LoadLast(const int8_t* row, size_t count) {
  const __m128i* from = reinterpret_cast<const __m128i*>(row);
  return count > 8 ? _mm_loadu_si128(from) : _mm_loadl_epi64(from);
}

// Stores the first `count` of 8 bytes, 8 if there are more.
static inline void StoreFirst8(__m128i values, size_t count, int8_t* out) {
  uint64_t bytes = static_cast<uint64_t>(_mm_cvtsi128_si64(values));
  if (count >= 8) {
    std::memcpy(out, &bytes, 8);
    return;
  }
  for (size_t part = 4; part > 0; part /= 2) {
    if ((count & part) == 0) continue;
    std::memcpy(out, &bytes, part);
    out += part;
    bytes >>= 8 * part;
  }
}

// Stores the first `count` of 16 bytes, 16 if there are more, the second 8 of them at `high`.
static inline void StoreFirst16(__m128i values, size_t count, int8_t* out, int8_t* high) {
  if (count >= 16 && high == out + 8) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out), values);
    return;
  }
  StoreFirst8(values, count, out);
  if (count > 8) StoreFirst8(_mm_unpackhi_epi64(values, values), count - 8, high);
}

}  // namespace qz
