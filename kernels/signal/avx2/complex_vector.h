// SPDX-License-Identifier: Apache-2.0
// Eight complex values in a vector, real part first, and the arithmetic of signal_arithmetic.h on
// all of them.
#pragma once

#include <immintrin.h>

#include <cstdint>

namespace qz::signal {

static inline __m256i Load(const int16_t* eight) {
  return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(eight));
}

static inline __m128i LoadFour(const int16_t* four) {
  return _mm_loadu_si128(reinterpret_cast<const __m128i*>(four));
}

static inline void Store(int16_t* eight, __m256i a) {
  _mm256_storeu_si256(reinterpret_cast<__m256i*>(eight), a);
}

static inline void StoreFour(int16_t* four, __m128i a) {
  _mm_storeu_si128(reinterpret_cast<__m128i*>(four), a);
}

// The instruction is RoundQ15 of the product; it would wrap for -32768 times itself only.
static inline __m256i Scaled(__m256i a, int16_t q15_factor) {
  return _mm256_mulhrs_epi16(a, _mm256_set1_epi16(q15_factor));
}

// No imaginary part may be -32768.
static inline __m256i Conjugate(__m256i a) {
  return _mm256_sign_epi16(a, _mm256_set1_epi32(static_cast<int>(0xFFFF0001)));
}

// Real and imaginary parts in each other's place.
static inline __m256i Swapped(__m256i a) {
  const __m128i order = _mm_setr_epi8(2, 3, 0, 1, 6, 7, 4, 5, 10, 11, 8, 9, 14, 15, 12, 13);
  return _mm256_shuffle_epi8(a, _mm256_broadcastsi128_si256(order));
}

// Real and imaginary parts of products with twiddles, in 32 bits. The factor is conjugated rather
// than the twiddle, whose parts may be -32768.
static inline __m256i ProductRe(__m256i a, __m256i twiddle) {
  return _mm256_madd_epi16(Conjugate(a), twiddle);
}

static inline __m256i ProductIm(__m256i a, __m256i twiddle) {
  return _mm256_madd_epi16(a, Swapped(twiddle));
}

}  // namespace qz::signal
