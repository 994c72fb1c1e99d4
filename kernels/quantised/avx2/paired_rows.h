// SPDX-License-Identifier: Apache-2.0
// Convolution of 3 taps, by which each tap meets the row after that of the tap before: two
// neighbouring rows of the output from 4 sums of products instead of 6. This is Winograd's minimal
// filtering F(2,3) (S. Winograd, Arithmetic Complexity of Computations, 1980). With rows x0 to x3
// and weights g0 to g2:
//   2 (x0 g0 + x1 g1 + x2 g2) = A + B + (x0 - x2) 2 g0    A = (x1 + x2) (g0 + g1 + g2)
//   2 (x1 g0 + x2 g1 + x3 g2) = A - B - (x1 - x3) 2 g2    B = (x2 - x1) (g0 - g1 + g2)
// Of the two rows, the even one adds up A and then its last product, the odd one B and its last;
// in between, A and B become their sum and their difference. All is exact: rows of up to 9 bits and
// weights of up to 10 fit int16, twice the sums of kMaxChannels int32, and the halves are whole
// numbers.
#pragma once

#include "kernels/quantised/avx2/word_products.h"

namespace qz {
namespace {

struct PairedRows {
  static constexpr size_t kColumns = kPanelColumns;
  static constexpr size_t kTaps = 3;
  static constexpr size_t kMaxChannels = INT32_MAX / (2 * kTaps * 128 * 127);

  // The biases, and two parts with two sets of weights.
  static inline size_t PanelBytes(size_t /*taps*/, size_t k) {
    return kStartBytes + 4 * PanelPartBytes(StepsOf(k));
  }
  static inline size_t RowBytes(size_t /*taps*/, size_t k) {
    return SecondPartAt(k) + RowPartBytes(StepsOf(k));
  }

  static inline void UnpackBlock(const uint8_t* block, size_t /*taps*/, size_t k, uint8_t* to) {
    const uint8_t* weights = block + kBiasBytes;
    const size_t tap_bytes = k * kTileColumns;
    StoreInts(LoadInts(block), to);
    uint8_t* const parts[] = {to + kStartBytes, to + kStartBytes + 2 * PanelPartBytes(StepsOf(k))};
    const StepPairs none{_mm256_setzero_si256(), _mm256_setzero_si256()};
    __m256i starts[2][2] = {};
    uint8_t *step0 = parts[0] + 2 * kStartBytes, *step1 = parts[1] + 2 * kStartBytes;
    for (size_t i = 0; i < k; i += kStepChannels, weights += kStepChannels * kTileColumns) {
      const StepPairs g0 = LoadStep(weights);
      const StepPairs g1 = LoadStep(weights + tap_bytes);
      const StepPairs g2 = LoadStep(weights + 2 * tap_bytes);
      const StepPairs outer = Sum(g0, g2);
      StoreStep(Sum(outer, g1), step0, starts[0][0]);
      StoreStep(Difference(outer, g1), step0 + kPanelStep, starts[0][1]);
      StoreStep(Sum(g0, g0), step1, starts[1][0]);
      StoreStep(Difference(Difference(none, g2), g2), step1 + kPanelStep, starts[1][1]);
      step0 += 2 * kPanelStep;
      step1 += 2 * kPanelStep;
    }
    for (size_t part = 0; part < 2; ++part) {
      StoreInts(starts[part][0], parts[part]);
      StoreInts(starts[part][1], parts[part] + kStartBytes);
    }
  }

  // The taps of an odd row meet x1 to x3.
  template <typename RowOf>
  static inline void UnpackRow(RowOf row_of, bool odd, size_t /*taps*/, size_t k, uint8_t* to) {
    const int8_t* const rows[] = {row_of(0), row_of(1), row_of(2)};
    uint8_t* const second = to + SecondPartAt(k);
    __m256i off0 = _mm256_setzero_si256(), off1 = off0;
    for (size_t i = 0; i < k; i += 16) {
      const __m256i x0 = LoadChannels(rows[0] + i, k - i);
      const __m256i x1 = LoadChannels(rows[1] + i, k - i);
      const __m256i x2 = LoadChannels(rows[2] + i, k - i);
      const size_t at = sizeof(int32_t) + i * sizeof(int16_t);
      const __m256i first = odd ? _mm256_sub_epi16(x1, x0) : _mm256_add_epi16(x1, x2);
      StoreChannels(first, to + at, off0);
      StoreChannels(_mm256_sub_epi16(x0, x2), second + at, off1);
    }
    StoreOff(off0, to);
    StoreOff(off1, second);
  }

  // Not inlined, so that its registers are its own.
  __attribute__((noinline)) static void AddUp(const uint8_t* rows, size_t m, const uint8_t* panel,
                                              size_t taps, size_t k, int32_t* sums) {
    const size_t row_bytes = RowBytes(taps, k), steps = StepsOf(k);
    const uint8_t* part0 = panel + kStartBytes;
    const uint8_t* part1 = part0 + 2 * PanelPartBytes(steps);
    for (size_t r = 0; r < m; r += kTileRows, rows += kTileRows * row_bytes) {
      TileSums tile = NoSums();
      AddPart<2>(rows, row_bytes, part0, steps, tile);
      Cross(tile.row0, tile.row1);
      Cross(tile.row2, tile.row3);
      AddPart<2>(rows + SecondPartAt(k), row_bytes, part1, steps, tile);
      Halve(panel, tile.row0);
      Halve(panel, tile.row1);
      Halve(panel, tile.row2);
      Halve(panel, tile.row3);
      StoreSums(tile, sums + r * kColumns);
    }
  }

 private:
  // In a row, with space for the last 16 channels of the first part.
  static inline size_t SecondPartAt(size_t k) { return RowPartBytes(StepsOf(k)) + 32; }

  static inline StepPairs Sum(const StepPairs& a, const StepPairs& b) {
    return {_mm256_add_epi16(a.odd, b.odd), _mm256_add_epi16(a.even, b.even)};
  }
  static inline StepPairs Difference(const StepPairs& a, const StepPairs& b) {
    return {_mm256_sub_epi16(a.odd, b.odd), _mm256_sub_epi16(a.even, b.even)};
  }

  // The sums of two rows become their sum and their difference.
  static inline void Cross(RowSums& even, RowSums& odd) {
    const RowSums a = even, b = odd;
    even = {_mm256_add_epi32(a.low, b.low), _mm256_add_epi32(a.high, b.high)};
    odd = {_mm256_sub_epi32(a.low, b.low), _mm256_sub_epi32(a.high, b.high)};
  }

  static inline void Halve(const uint8_t* biases, RowSums& sums) {
    sums.low = _mm256_add_epi32(_mm256_srai_epi32(sums.low, 1), LoadInts(biases));
    sums.high = _mm256_add_epi32(_mm256_srai_epi32(sums.high, 1), LoadInts(biases + 32));
  }
};

// Whether rows 0 and 1, 2 and 3 and so on of the output are all such neighbours.
template <typename RowAt>
inline bool ArePairs(size_t m, size_t taps, size_t k, RowAt row_at) {
  if (m % 2 != 0 || taps != PairedRows::kTaps || k > PairedRows::kMaxChannels) return false;
  for (size_t r = 0; r < m; r += 2) {
    if (row_at(0, r + 1) != row_at(1, r) || row_at(1, r + 1) != row_at(2, r)) return false;
  }
  return true;
}

}  // namespace
}  // namespace qz
