// SPDX-License-Identifier: Apache-2.0
// The two matrix kernels with float scales, for any number of rows. Weights and rows are unpacked
// once: weights in panels of columns, as many as fit, for all rows; rows in chunks, as many as fit,
// for all panels. Then each chunk meets each panel, and the sums are requantised. Takes 52 to
// 56 KiB of the stack.
//
// How products are added up is the business of a method:
//   kColumns                 columns of a panel, a multiple of 16
//   PanelBytes(taps, k)      of a panel
//   RowBytes(taps, k)        of an unpacked row
//   UnpackBlock(block, taps, k, to)      8 packed columns; `to` is 32 bytes further for each block
//   UnpackRow(row_of, odd, taps, k, to)  row_of(tap) is the row; `odd` rows of the output are odd;
//                                        up to 64 bytes more may be written
//   AddUp(rows, m, panel, taps, k, sums) sums: [m][kColumns]; of all rows of m's last tile
#pragma once

#include "kernels/quantised/avx2/requantise.h"
#include "kernels/quantised/gemm_tile.h"

namespace qz {
namespace {

// Little enough to stay in the nearest cache. More only where a panel or a tile of rows is larger:
// from sums of a thousand products on, at the earliest.
constexpr size_t kPanelsBytes = 32768;
constexpr size_t kChunkBytes = 16384;
constexpr size_t kChunkRows = 64;

inline size_t Smaller(size_t a, size_t b) { return a < b ? a : b; }
inline size_t Larger(size_t a, size_t b) { return a > b ? a : b; }

struct Product {
  size_t m, n, k, taps;
  const uint8_t* w;
  int8_t* c;
  size_t c_stride, c_block_stride;
  const orra_fp32_requant_params* params;

  size_t ScalesAt() const { return kBiasBytes + taps * k * kTileColumns; }
  size_t BlockBytes() const { return ScalesAt() + kScaleBytes; }
  const uint8_t* Block(size_t block) const { return w + block * BlockBytes(); }
};

// Blocks from `first` to before `end`, of which the last one may be alone in its pair.
struct Blocks {
  size_t first, end;
};

// Requantises and stores 16 columns of m rows: those of a block and the next, if that is before
// `end`. A row's sums are `stride` values after those of the row before.
__attribute__((noinline)) void StoreColumns(const int32_t* sums, size_t stride, size_t m,
                                            const Product& product, Blocks blocks, int8_t* c) {
  const OutputRange256 range = Range256Of(*product.params);
  const uint8_t* scales = product.Block(blocks.first) + product.ScalesAt();
  const __m256 low = LoadFloats(scales);
  const bool both = blocks.first + 1 < blocks.end;
  const __m256 high = LoadFloats(both ? scales + product.BlockBytes() : scales);
  const size_t columns = product.n - blocks.first * kTileColumns;
  const __m256i in_order = _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7);
  for (size_t r = 0; r < m; r += 2, sums += 2 * stride, c += 2 * product.c_stride) {
    const __m256i even = Words(LoadInts(sums), LoadInts(sums + 8), low, high, range);
    const __m256i odd =
        Words(LoadInts(sums + stride), LoadInts(sums + stride + 8), low, high, range);
    const __m256i rows = _mm256_permutevar8x32_epi32(Bytes(even, odd, range), in_order);
    StoreFirst16(_mm256_castsi256_si128(rows), columns, c, c + product.c_block_stride);
    if (r + 1 == m) return;
    int8_t* next = c + product.c_stride;
    StoreFirst16(_mm256_extracti128_si256(rows, 1), columns, next, next + product.c_block_stride);
  }
}

template <typename Method, typename RowAt>
class PanelProduct {
 public:
  PanelProduct(const Product& product, RowAt row_at)
      : product_(product),
        row_at_(row_at),
        panel_bytes_(Method::PanelBytes(product.taps, product.k)),
        row_bytes_(Method::RowBytes(product.taps, product.k)) {}

  size_t PanelsBytes() const { return Larger(kPanelsBytes, panel_bytes_); }
  size_t RowsBytes() const { return Larger(kChunkBytes, kTileRows * row_bytes_); }
  static constexpr size_t kRowsSlack = 64;

  // On PanelsBytes() of memory, and RowsBytes() with kRowsSlack behind them.
  void Run(uint8_t* panels, uint8_t* rows) {
    panels_ = panels;
    rows_ = rows;
    const size_t blocks = (product_.n + kTileColumns - 1) / kTileColumns;
    const size_t group = PanelsBytes() / panel_bytes_ * kPanelBlocks;
    const size_t chunk = Smaller(kChunkRows, RowsBytes() / row_bytes_ / kTileRows * kTileRows);
    for (size_t first = 0; first < blocks; first += group) {
      const Blocks columns{first, Smaller(first + group, blocks)};
      UnpackPanels(columns);
      for (size_t row = 0; row < product_.m; row += chunk) {
        const size_t m = Smaller(product_.m - row, chunk);
        UnpackRows(row, m);
        MultiplyChunk(row, m, columns);
      }
    }
  }

 private:
  static constexpr size_t kPanelBlocks = Method::kColumns / kTileColumns;
  static constexpr size_t kBlockOffset = kTileColumns * sizeof(int32_t);

  // The last block fills up its panel.
  __attribute__((noinline)) void UnpackPanels(Blocks blocks) {
    uint8_t* panel = panels_;
    for (size_t b = blocks.first; b < blocks.end; b += kPanelBlocks, panel += panel_bytes_) {
      for (size_t i = 0; i < kPanelBlocks; ++i) {
        const size_t block = Smaller(b + i, blocks.end - 1);
        Method::UnpackBlock(product_.Block(block), product_.taps, product_.k,
                            panel + i * kBlockOffset);
      }
    }
  }

  // The last row fills up its tile.
  __attribute__((noinline)) void UnpackRows(size_t first, size_t m) {
    uint8_t* to = rows_;
    for (size_t r = 0; r < m || r % kTileRows != 0; ++r, to += row_bytes_) {
      const size_t row = first + Smaller(r, m - 1);
      const auto row_of = [&](size_t tap) { return row_at_(tap, row); };
      Method::UnpackRow(row_of, r % 2 != 0, product_.taps, product_.k, to);
    }
  }

  __attribute__((noinline)) void MultiplyChunk(size_t row, size_t m, Blocks blocks) {
    const uint8_t* panel = panels_;
    int8_t* c = product_.c + row * product_.c_stride;
    for (size_t b = blocks.first; b < blocks.end; b += kPanelBlocks, panel += panel_bytes_) {
      Method::AddUp(rows_, m, panel, product_.taps, product_.k, sums_);
      for (size_t i = 0; i < kPanelBlocks && b + i < blocks.end; i += 2) {
        StoreColumns(sums_ + i * kTileColumns, Method::kColumns, m, product_, {b + i, blocks.end},
                     c + (b + i) * product_.c_block_stride);
      }
    }
  }

  const Product product_;
  const RowAt row_at_;
  const size_t panel_bytes_, row_bytes_;
  uint8_t* panels_;
  uint8_t* rows_;
  alignas(64) int32_t sums_[kChunkRows * Method::kColumns];
};

// row_at(tap, row) is the row of the input that a tap meets for a row of the output.
template <typename Method, typename RowAt>
inline void Multiply(const Product& product, RowAt row_at) {
  constexpr size_t kAlignment = 512;  // bits
  PanelProduct<Method, RowAt> panels(product, row_at);
  const size_t rows_bytes = panels.RowsBytes() + panels.kRowsSlack;
  panels.Run(static_cast<uint8_t*>(__builtin_alloca_with_align(panels.PanelsBytes(), kAlignment)),
             static_cast<uint8_t*>(__builtin_alloca_with_align(rows_bytes, kAlignment)));
}

}  // namespace
}  // namespace qz
