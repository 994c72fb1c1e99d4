// SPDX-License-Identifier: Apache-2.0
// Sums of products in tiles of 4 rows and 16 columns. One multiplication makes two products, by
// Winograd's inner product (S. Winograd, A New Algorithm for Inner Product, 1968):
//   x0 y0 + x1 y1 = (x0 + y1) (x1 + y0) - x0 x1 - y0 y1
// What has to come off depends on the row alone and on the column alone, so that it is counted
// while these are unpacked. All is exact modulo 2^32: sums of two bytes fit int16, of which an
// instruction multiplies pairs and adds the two products. Processors multiply in half of the units
// in which they add: 8 multiplications and 24 additions of vectors take 8.5 cycles of a Zen 4, the
// 16 and 16 that would give the same sums 10.
#pragma once

#include "kernels/quantised/avx2/panels.h"

namespace qz {
namespace {

constexpr size_t kPanelColumns = 2 * kTileColumns;
constexpr size_t kStepChannels = 4;  // input channels that a step takes

// A part of an unpacked row: what comes off its sums, then each step's channels 0, 2, 1 and 3 as
// int16.
constexpr size_t kRowStep = kStepChannels * sizeof(int16_t);
inline size_t RowPartBytes(size_t steps) { return sizeof(int32_t) + steps * kRowStep; }

// A part of a panel: what its columns' sums start with, then each step's weights of channels 1 and
// 3, as pairs of int16, and those of channels 0 and 2. With two sets of weights: twice each of the
// two.
constexpr size_t kStartBytes = kPanelColumns * sizeof(int32_t);
constexpr size_t kPairsBytes = kPanelColumns * 2 * sizeof(int16_t);
constexpr size_t kPanelStep = 2 * kPairsBytes;
inline size_t PanelPartBytes(size_t steps) { return kStartBytes + steps * kPanelStep; }

inline size_t StepsOf(size_t k) { return (k + kStepChannels - 1) / kStepChannels; }

inline void StoreInts(__m256i values, void* to) {
  _mm256_storeu_si256(static_cast<__m256i*>(to), values);
}

// 8 columns' weights of a step, as pairs of channels.
struct StepPairs {
  __m256i odd, even;
};

inline __m256i PairsOf(__m128i first, __m128i second) {
  return _mm256_cvtepi8_epi16(_mm_unpacklo_epi8(first, second));
}

// Where channels are missing, the bytes behind the weights are read instead: rows are 0 there, and
// what the columns start with makes up for the rest. These bytes are of the same block, which ends
// in scales.
inline StepPairs LoadStep(const uint8_t* weights) {
  const auto load = [=](size_t channel) {
    const uint8_t* from = weights + channel * kTileColumns;
    return _mm_loadl_epi64(reinterpret_cast<const __m128i*>(from));
  };
  return {PairsOf(load(1), load(3)), PairsOf(load(0), load(2))};
}

// Stores a step's weights, and takes their products off what the columns start with.
inline void StoreStep(const StepPairs& pairs, uint8_t* to, __m256i& start) {
  StoreInts(pairs.odd, to);
  StoreInts(pairs.even, to + kPairsBytes);
  start = _mm256_sub_epi32(start, _mm256_madd_epi16(pairs.odd, pairs.even));
}

// 16 channels of a row as int16, in the order of the steps; 0 from channel `count` on.
inline __m256i LoadChannels(const int8_t* row, size_t count) {
  __m128i bytes = LoadLast(row, count);
  if (count < 16) {
    const __m128i locations = _mm_setr_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
    const __m128i number = _mm_set1_epi8(static_cast<char>(count));
    bytes = _mm_and_si128(bytes, _mm_cmpgt_epi8(number, locations));
  }
  const __m128i order = _mm_setr_epi8(0, 2, 1, 3, 4, 6, 5, 7, 8, 10, 9, 11, 12, 14, 13, 15);
  return _mm256_cvtepi8_epi16(_mm_shuffle_epi8(bytes, order));
}

// Stores them, and adds x0 x1 + x2 x3 of each step to `off`, twice.
inline void StoreChannels(__m256i words, uint8_t* to, __m256i& off) {
  StoreInts(words, to);
  off = _mm256_add_epi32(off, _mm256_madd_epi16(words, _mm256_shuffle_epi32(words, 0xB1)));
}

inline void StoreOff(__m256i off, uint8_t* to) {
  const __m128i halves =
      _mm_add_epi32(_mm256_castsi256_si128(off), _mm256_extracti128_si256(off, 1));
  const __m128i sums = _mm_add_epi32(halves, _mm_unpackhi_epi64(halves, halves));
  const int32_t sum = _mm_cvtsi128_si32(sums);
  std::memcpy(to, &sum, sizeof sum);
}

struct RowSums {
  __m256i low, high;  // of columns 0 to 7, and 8 to 15
};
struct TileSums {
  RowSums row0, row1, row2, row3;
};

inline __m256i Broadcast(const uint8_t* from) {
  int32_t value;
  std::memcpy(&value, from, sizeof value);
  return _mm256_set1_epi32(value);
}

inline void AddStart(const uint8_t* row, const uint8_t* panel, RowSums& sums) {
  const __m256i off = Broadcast(row);
  sums.low = _mm256_add_epi32(sums.low, _mm256_sub_epi32(LoadInts(panel), off));
  sums.high = _mm256_add_epi32(sums.high, _mm256_sub_epi32(LoadInts(panel + 32), off));
}

struct StepWeights {
  __m256i odd_low, odd_high, even_low, even_high;
};

inline StepWeights LoadWeights(const uint8_t* panel) {
  return {LoadInts(panel), LoadInts(panel + 32), LoadInts(panel + kPairsBytes),
          LoadInts(panel + kPairsBytes + 32)};
}

// In one piece and in this order: the compiler would move loads and additions about until 16
// registers don't suffice any more.
inline void AddStep(const uint8_t* row, const StepWeights& y, RowSums& sums) {
  __m256i x02 = Broadcast(row), x13 = Broadcast(row + 4), a, b;
  asm volatile(
      "vpaddw %[odd_low], %[x02], %[a]\n\t"
      "vpaddw %[even_low], %[x13], %[b]\n\t"
      "vpaddw %[odd_high], %[x02], %[x02]\n\t"
      "vpaddw %[even_high], %[x13], %[x13]\n\t"
      "vpmaddwd %[b], %[a], %[a]\n\t"
      "vpaddd %[a], %[low], %[low]\n\t"
      "vpmaddwd %[x13], %[x02], %[x02]\n\t"
      "vpaddd %[x02], %[high], %[high]"
      : [low] "+x"(sums.low), [high] "+x"(sums.high), [x02] "+&x"(x02), [x13] "+&x"(x13),
        [a] "=&x"(a), [b] "=&x"(b)
      : [odd_low] "x"(y.odd_low), [odd_high] "x"(y.odd_high), [even_low] "x"(y.even_low),
        [even_high] "x"(y.even_high));
}

// Adds what a part gives. Of two sets of weights, odd rows meet the second.
template <size_t kSets>
inline void AddPart(const uint8_t* row, size_t row_bytes, const uint8_t* panel, size_t steps,
                    TileSums& sums) {
  const uint8_t* second = panel + (kSets - 1) * kStartBytes;
  AddStart(row, panel, sums.row0);
  AddStart(row + row_bytes, second, sums.row1);
  AddStart(row + 2 * row_bytes, panel, sums.row2);
  AddStart(row + 3 * row_bytes, second, sums.row3);
  panel += kSets * kStartBytes;
  row += sizeof(int32_t);
  const uint8_t* const end = row + steps * kRowStep;
  do {
    const StepWeights even_rows = LoadWeights(panel);
    AddStep(row, even_rows, sums.row0);
    AddStep(row + 2 * row_bytes, even_rows, sums.row2);
    const StepWeights odd_rows = LoadWeights(panel + (kSets - 1) * kPanelStep);
    AddStep(row + row_bytes, odd_rows, sums.row1);
    AddStep(row + 3 * row_bytes, odd_rows, sums.row3);
    row += kRowStep;
    panel += kSets * kPanelStep;
  } while (row != end);
}

inline void StoreSums(const RowSums& sums, int32_t* to) {
  StoreInts(sums.low, to);
  StoreInts(sums.high, to + 8);
}

inline void StoreSums(const TileSums& sums, int32_t* to) {
  StoreSums(sums.row0, to);
  StoreSums(sums.row1, to + kPanelColumns);
  StoreSums(sums.row2, to + 2 * kPanelColumns);
  StoreSums(sums.row3, to + 3 * kPanelColumns);
}

inline TileSums NoSums() {
  const RowSums none{_mm256_setzero_si256(), _mm256_setzero_si256()};
  return {none, none, none, none};
}

// The method for any rows: all taps in one part, one after another.
struct WordProducts {
  static constexpr size_t kColumns = kPanelColumns;

  static inline size_t PanelBytes(size_t taps, size_t k) {
    return PanelPartBytes(taps * StepsOf(k));
  }
  static inline size_t RowBytes(size_t taps, size_t k) { return RowPartBytes(taps * StepsOf(k)); }

  static inline void UnpackBlock(const uint8_t* block, size_t taps, size_t k, uint8_t* to) {
    const uint8_t* weights = block + kBiasBytes;
    __m256i start = LoadInts(block);
    uint8_t* step = to + kStartBytes;
    for (size_t t = 0; t < taps; ++t, weights += k * kTileColumns) {
      for (size_t i = 0; i < k; i += kStepChannels, step += kPanelStep) {
        StoreStep(LoadStep(weights + i * kTileColumns), step, start);
      }
    }
    StoreInts(start, to);
  }

  template <typename RowOf>
  static inline void UnpackRow(RowOf row_of, bool /*odd*/, size_t taps, size_t k, uint8_t* to) {
    uint8_t* steps = to + sizeof(int32_t);
    __m256i off = _mm256_setzero_si256();
    for (size_t t = 0; t < taps; ++t, steps += StepsOf(k) * kRowStep) {
      const int8_t* row = row_of(t);
      for (size_t i = 0; i < k; i += 16) {
        StoreChannels(LoadChannels(row + i, k - i), steps + i * sizeof(int16_t), off);
      }
    }
    StoreOff(off, to);
  }

  // Not inlined, so that its registers are its own.
  __attribute__((noinline)) static void AddUp(const uint8_t* rows, size_t m, const uint8_t* panel,
                                              size_t taps, size_t k, int32_t* sums) {
    const size_t row_bytes = RowBytes(taps, k);
    for (size_t r = 0; r < m; r += kTileRows, rows += kTileRows * row_bytes) {
      TileSums tile = NoSums();
      AddPart<1>(rows, row_bytes, panel, taps * StepsOf(k), tile);
      StoreSums(tile, sums + r * kColumns);
    }
  }
};

}  // namespace
}  // namespace qz
