// SPDX-License-Identifier: Apache-2.0
// Sums of products in tiles of 4 rows and 32 columns. An instruction multiplies four unsigned bytes
// with four signed ones and adds the products to a sum, all exactly. Rows are made unsigned by
// adding 128, and 128 times the sum of a column's weights comes off the column's bias.
#pragma once

#include "kernels/quantised/avx2/panels.h"

namespace qz {
namespace {

struct ByteProducts {
  static constexpr size_t kColumns = 4 * kTileColumns;
  static constexpr size_t kStepChannels = 4;
  // What the columns' sums start with; then in each step the column's four weights side by side.
  static constexpr size_t kPanelStart = kColumns * sizeof(int32_t);
  static constexpr size_t kPanelStep = kColumns * kStepChannels;

  static inline size_t Steps(size_t k) { return (k + kStepChannels - 1) / kStepChannels; }
  static inline size_t PanelBytes(size_t taps, size_t k) {
    return kPanelStart + taps * Steps(k) * kPanelStep;
  }
  static inline size_t RowBytes(size_t taps, size_t k) { return taps * Steps(k) * kStepChannels; }

  static inline void UnpackBlock(const uint8_t* block, size_t taps, size_t k, uint8_t* to) {
    const uint8_t* weights = block + kBiasBytes;
    __m256i added = _mm256_setzero_si256();  // 128 times the columns' weights
    uint8_t* step = to + kPanelStart;
    for (size_t t = 0; t < taps; ++t, weights += k * kTileColumns) {
      for (size_t i = 0; i < k; i += kStepChannels, step += kPanelStep) {
        // Where channels are missing, the bytes behind the weights are read instead, in the same
        // block, which ends in scales: rows are 128 there, and that is subtracted.
        const __m256i y = ByColumn(LoadInts(weights + i * kTileColumns));
        const __m256i none = _mm256_setzero_si256();
        added = _mm256_add_epi32(added, _mm256_dpbusd_epi32(none, _mm256_set1_epi8(INT8_MIN), y));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(step), y);
      }
    }
    const __m256i start = _mm256_sub_epi32(LoadInts(block), added);
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(to), start);
  }

  template <typename RowOf>
  static inline void UnpackRow(RowOf row_of, bool /*odd*/, size_t taps, size_t k, uint8_t* to) {
    for (size_t t = 0; t < taps; ++t, to += RowBytes(1, k)) {
      const int8_t* row = row_of(t);
      for (size_t i = 0; i < k; i += 64) {
        const __mmask64 exist = k - i < 64 ? (__mmask64{1} << (k - i)) - 1 : ~__mmask64{0};
        const __m512i bytes = _mm512_maskz_loadu_epi8(exist, row + i);
        _mm512_storeu_si512(to + i, _mm512_xor_si512(bytes, _mm512_set1_epi8(INT8_MIN)));
      }
    }
  }

  // Not inlined, so that its registers are its own.
  __attribute__((noinline)) static void AddUp(const uint8_t* rows, size_t m, const uint8_t* panel,
                                              size_t taps, size_t k, int32_t* sums) {
    const size_t row_bytes = RowBytes(taps, k);
    for (size_t r = 0; r < m; r += kTileRows, rows += kTileRows * row_bytes) {
      AddUpTile(rows, row_bytes, panel, sums + r * kColumns);
    }
  }

 private:
  struct RowSums {
    __m512i low, high;  // columns 0 to 15, and 16 to 31
  };

  // Bytes [channel][column] of 4 channels and 8 columns as [column][channel].
  static inline __m256i ByColumn(__m256i bytes) {
    const __m256i halves =
        _mm256_permutevar8x32_epi32(bytes, _mm256_setr_epi32(0, 2, 4, 6, 1, 3, 5, 7));
    const __m128i transposed = _mm_setr_epi8(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15);
    return _mm256_shuffle_epi8(halves, _mm256_broadcastsi128_si256(transposed));
  }

  static inline __m512i Load(const void* from) { return _mm512_loadu_si512(from); }

  static inline void AddStep(const uint8_t* row, __m512i low, __m512i high, RowSums& sums) {
    int32_t channels;
    std::memcpy(&channels, row, sizeof channels);
    const __m512i x = _mm512_set1_epi32(channels);
    sums.low = _mm512_dpbusd_epi32(sums.low, x, low);
    sums.high = _mm512_dpbusd_epi32(sums.high, x, high);
  }

  static inline void StoreSums(const RowSums& sums, int32_t* to) {
    _mm512_storeu_si512(to, sums.low);
    _mm512_storeu_si512(to + 16, sums.high);
  }

  static inline void AddUpTile(const uint8_t* row, size_t row_bytes, const uint8_t* panel,
                               int32_t* sums) {
    const RowSums start{Load(panel), Load(panel + 64)};
    RowSums sums0 = start, sums1 = start, sums2 = start, sums3 = start;
    panel += kPanelStart;
    const uint8_t* const end = row + row_bytes;
    do {
      const __m512i low = Load(panel), high = Load(panel + 64);
      AddStep(row, low, high, sums0);
      AddStep(row + row_bytes, low, high, sums1);
      AddStep(row + 2 * row_bytes, low, high, sums2);
      AddStep(row + 3 * row_bytes, low, high, sums3);
      row += kStepChannels;
      panel += kPanelStep;
    } while (row != end);
    StoreSums(sums0, sums);
    StoreSums(sums1, sums + kColumns);
    StoreSums(sums2, sums + 2 * kColumns);
    StoreSums(sums3, sums + 3 * kColumns);
  }
};

}  // namespace
}  // namespace qz
