// SPDX-License-Identifier: Apache-2.0
// The three radix-4 butterfly stages of the complex FFT, eight entries a vector.
//
// Faster than g++ 12's -O3 -mavx2 code of the reference, in the front end's
// calls (Zen 4): 9.2 times in the first stage, 6.3 in the second, 17 in the later ones.

#include "kernels/signal/avx2/complex_vector.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/signal/signal_tables.h"
#include "kernels/variant.h"

namespace {

using qz::signal::Conjugate;
using qz::signal::Load;
using qz::signal::LoadFour;
using qz::signal::ProductIm;
using qz::signal::ProductRe;
using qz::signal::Scaled;
using qz::signal::Store;
using qz::signal::StoreFour;
using qz::signal::Swapped;

constexpr int16_t kPrescale = 8191;  // Q15, just under 1/4

struct Twiddles {
  __m256i w1, w2, w3;
};

// Parts of a prescaled entry are at most 8191, so that 16 bits hold those of a product in Q14. The
// last step, a product with 1/2, rounds like all others.
inline __m256i Rotated(__m256i a, __m256i twiddle) {
  const __m256i re = _mm256_srli_epi32(ProductRe(a, twiddle), 14);
  const __m256i im = _mm256_slli_epi32(ProductIm(a, twiddle), 2);
  return Scaled(_mm256_blend_epi16(re, im, 0xAA), 16384);
}

// Eight butterflies; load(at) and store(at, entries) reach the entries that lie `at` int16 behind
// their first.
template <typename LoadEntries, typename StoreEntries>
inline void Butterflies(size_t quarter, const Twiddles& w, LoadEntries load, StoreEntries store) {
  const __m256i a0 = Scaled(load(0), kPrescale);
  const __m256i a1 = Rotated(Scaled(load(quarter), kPrescale), w.w1);
  const __m256i a2 = Rotated(Scaled(load(2 * quarter), kPrescale), w.w2);
  const __m256i a3 = Rotated(Scaled(load(3 * quarter), kPrescale), w.w3);
  const __m256i s0 = _mm256_add_epi16(a0, a2);
  const __m256i s1 = _mm256_sub_epi16(a0, a2);
  const __m256i s2 = _mm256_add_epi16(a1, a3);
  const __m256i minus_j_s3 = Conjugate(Swapped(_mm256_sub_epi16(a1, a3)));
  store(0, _mm256_add_epi16(s0, s2));
  store(quarter, _mm256_add_epi16(s1, minus_j_s3));
  store(2 * quarter, _mm256_sub_epi16(s0, s2));
  store(3 * quarter, _mm256_sub_epi16(s1, minus_j_s3));
}

// Butterflies 0 to 3 of every group, two groups at a time. The last of an odd number goes with
// itself.
inline void FourOfEveryGroup(size_t groups, size_t quarter, int16_t* data, const Twiddles& w) {
  for (size_t group = 0; group < groups; group += 2) {
    int16_t* const one = data + 4 * quarter * group;
    int16_t* const other = group + 1 < groups ? one + 4 * quarter : one;
    Butterflies(
        quarter, w,
        [=](size_t at) { return _mm256_set_m128i(LoadFour(other + at), LoadFour(one + at)); },
        [=](size_t at, __m256i entries) {
          StoreFour(one + at, _mm256_castsi256_si128(entries));
          StoreFour(other + at, _mm256_extracti128_si256(entries, 1));
        });
  }
}

// Two butterflies without twiddles, on the four entries of each half.
inline __m256i FirstStageButterflies(__m256i x) {
  const __m256i a = Scaled(x, kPrescale);
  // s0, s2, s1, s3
  const __m256i s = _mm256_add_epi16(
      _mm256_shuffle_epi32(a, 0x4E),
      _mm256_sign_epi16(
          a, _mm256_setr_epi32(0x00010001, 0x00010001, -1, -1, 0x00010001, 0x00010001, -1, -1)));
  const __m256i s0_s1 = _mm256_shuffle_epi32(s, 0x88);
  // s2 and s3, the latter's parts swapped
  const __m128i order = _mm_setr_epi8(4, 5, 6, 7, 14, 15, 12, 13, 4, 5, 6, 7, 14, 15, 12, 13);
  const __m256i s2_s3 = _mm256_shuffle_epi8(s, _mm256_broadcastsi128_si256(order));
  const __m128i signs = _mm_setr_epi16(1, 1, 1, -1, -1, -1, -1, 1);
  return _mm256_add_epi16(s0_s1, _mm256_sign_epi16(s2_s3, _mm256_broadcastsi128_si256(signs)));
}

// Four twiddles that lie `stride` int16 apart.
inline __m128i GatherFour(const int16_t* twiddle, size_t stride) {
  return _mm_setr_epi32(_mm_cvtsi128_si32(_mm_loadu_si32(twiddle)),
                        _mm_cvtsi128_si32(_mm_loadu_si32(twiddle + stride)),
                        _mm_cvtsi128_si32(_mm_loadu_si32(twiddle + 2 * stride)),
                        _mm_cvtsi128_si32(_mm_loadu_si32(twiddle + 3 * stride)));
}

inline __m256i Gather(const int16_t* twiddle, size_t stride) {
  return _mm256_set_m128i(GatherFour(twiddle + 4 * stride, stride), GatherFour(twiddle, stride));
}

// Entries 0, 2, ... 14 of 16.
inline __m256i EverySecond(const int16_t* twiddles) {
  const __m256 front = _mm256_castsi256_ps(Load(twiddles));
  const __m256 back = _mm256_castsi256_ps(Load(twiddles + 16));
  // 0, 2, 8, 10, 4, 6, 12, 14
  const __m256 even = _mm256_shuffle_ps(front, back, 0x88);
  return _mm256_permute4x64_epi64(_mm256_castps_si256(even), 0xD8);
}

// Entries 0, 3, ... 21 of 22. Those after the last may lie behind the end and are not read.
inline __m256i EveryThird(const int16_t* twiddles) {
  const __m256i last_two = _mm256_maskload_epi32(reinterpret_cast<const int*>(twiddles + 32),
                                                 _mm256_setr_epi32(0, 0, -1, 0, 0, -1, 0, 0));
  // 0, 9, 18, 3, 12, 21, 6, 15
  __m256i third = _mm256_blend_epi32(Load(twiddles), Load(twiddles + 16), 0x92);
  third = _mm256_blend_epi32(third, last_two, 0x24);
  return _mm256_permutevar8x32_epi32(third, _mm256_setr_epi32(0, 3, 6, 1, 4, 7, 2, 5));
}

// As many butterflies of every group as go into whole vectors; twiddles_of(k) are those of
// butterflies k to k + 7.
template <typename TwiddlesOf>
inline void EightsOfEveryGroup(size_t groups, size_t quarter, int16_t* data,
                               TwiddlesOf twiddles_of) {
  for (size_t k = 0; k + 8 <= quarter / 2; k += 8) {
    const Twiddles w = twiddles_of(k);
    int16_t* x0 = data + 2 * k;
    for (size_t group = 0; group < groups; ++group) {
      Butterflies(
          quarter, w, [=](size_t at) { return Load(x0 + at); },
          [=](size_t at, __m256i entries) { Store(x0 + at, entries); });
      x0 += 4 * quarter;
    }
  }
}

}  // namespace

QZ_KERNEL(orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4)
(size_t butterflies, size_t /*quarter_bytes*/, int16_t* data, const int16_t* /*twiddles*/,
 size_t /*twiddle_stride*/) {
  for (; butterflies >= 2; butterflies -= 2) {
    Store(data, FirstStageButterflies(Load(data)));
    data += 16;
  }
  if (butterflies > 0) {
    const __m256i last = FirstStageButterflies(_mm256_castsi128_si256(LoadFour(data)));
    StoreFour(data, _mm256_castsi256_si128(last));
  }
}

QZ_KERNEL(orra_cs16_bfly4_samples4_ukernel__neon)
(size_t groups, size_t /*quarter_bytes*/, int16_t* data, const int16_t* /*twiddles*/,
 size_t /*twiddle_stride*/) {
  const auto& rows = vrd_table_fft256_samples4_twiddle;
  constexpr size_t kQuarter = 8;  // the only length that the stage is for
  FourOfEveryGroup(groups, kQuarter, data,
                   {_mm256_broadcastsi128_si256(LoadFour(rows[0][0])),
                    _mm256_broadcastsi128_si256(LoadFour(rows[1][0])),
                    _mm256_broadcastsi128_si256(LoadFour(rows[2][0]))});
}

QZ_KERNEL(orra_cs16_bfly4_ukernel__neon_x4)
(size_t groups, size_t quarter_bytes, int16_t* data, const int16_t* twiddles,
 size_t twiddle_stride) {
  const size_t quarter = quarter_bytes / sizeof(int16_t);
  const size_t stride = twiddle_stride / sizeof(int16_t);
  if (stride == 2) {
    // The last stage, with as many twiddles as butterflies.
    EightsOfEveryGroup(groups, quarter, data, [=](size_t k) -> Twiddles {
      return {Load(twiddles + 2 * k), EverySecond(twiddles + 4 * k), EveryThird(twiddles + 6 * k)};
    });
  } else {
    EightsOfEveryGroup(groups, quarter, data, [=](size_t k) -> Twiddles {
      const int16_t* const w = twiddles + k * stride;
      return {Gather(w, stride), Gather(w + k * stride, 2 * stride),
              Gather(w + 2 * k * stride, 3 * stride)};
    });
  }
  const size_t k = quarter / 2 / 8 * 8;
  if (k < quarter / 2) {
    const int16_t* const w = twiddles + k * stride;
    FourOfEveryGroup(groups, quarter, data + 2 * k,
                     {_mm256_broadcastsi128_si256(GatherFour(w, stride)),
                      _mm256_broadcastsi128_si256(GatherFour(w + k * stride, 2 * stride)),
                      _mm256_broadcastsi128_si256(GatherFour(w + 2 * k * stride, 3 * stride))});
  }
}
