// SPDX-License-Identifier: Apache-2.0
// The 4-row, 8-column tile of the two matrix kernels with float scales.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "kernels/quantised/indirection.h"
#include "kernels/quantised/requantisation.h"

namespace qz {

constexpr size_t kTileRows = 4;
constexpr size_t kTileColumns = 8;
constexpr size_t kBiasBytes = kTileColumns * sizeof(int32_t);
constexpr size_t kScaleBytes = kTileColumns * sizeof(float);

// Sums modulo 2^32, row by row: one flat array, whose requantisation fills whole vectors.
constexpr size_t kTileSize = kTileRows * kTileColumns;
using Tile = uint32_t[kTileSize];

static inline void StartTile(const uint8_t* biases, Tile& sums) {
  for (size_t r = 0; r < kTileRows; ++r) {
    std::memcpy(sums + r * kTileColumns, biases, kBiasBytes);
  }
}

// sums[8 * r + j] += sum over i < k of rows[r][i] * weights[8 * i + j].
static inline void AddProducts(const int8_t* const (&rows)[kTileRows], const uint8_t* weights,
                               size_t k, Tile& sums) {
  for (size_t i = 0; i < k; ++i) {
    for (size_t r = 0; r < kTileRows; ++r) {
      for (size_t j = 0; j < kTileColumns; ++j) {
        const int32_t product = rows[r][i] * static_cast<int8_t>(weights[kTileColumns * i + j]);
        sums[r * kTileColumns + j] += static_cast<uint32_t>(product);
      }
    }
  }
}

// Requantises the whole tile and stores its first m rows and `columns` columns.
static inline void StoreTile(const Tile& sums, const uint8_t* scales, OutputRange range, size_t m,
                             size_t columns, int8_t* c, size_t c_stride) {
  float tile_scales[kTileSize];
  int8_t tile[kTileSize];
  for (size_t r = 0; r < kTileRows; ++r) {
    std::memcpy(tile_scales + r * kTileColumns, scales, kScaleBytes);
  }
  RequantiseFp32(sums, tile_scales, range, tile);
  for (size_t r = 0; r < m; ++r) std::memcpy(c + r * c_stride, tile + r * kTileColumns, columns);
}

// The row that a tap meets for a row of the output, by lists of [taps][4] rows, one a tile.
static inline const int8_t* TileRow(const int8_t* const* lists, size_t taps, size_t tap, size_t row,
                                    size_t offset, const int8_t* zero) {
  const size_t tap_rows = (row / kTileRows * taps + tap) * kTileRows;
  return ListedRow(lists, tap_rows + row % kTileRows, offset, zero);
}

// All rows, tile by tile, from row_at(tap, row), the row of the input that a tap meets for a row of
// the output. In a last tile of fewer rows the last one is repeated for the missing ones: a tile
// is computed whole, and only those of its rows that exist are stored.
template <typename RowAt>
static inline void MultiplyTiles(size_t m, size_t n, size_t k, size_t taps, RowAt row_at,
                                 const void* w, int8_t* c, size_t c_stride, size_t c_block_stride,
                                 OutputRange range) {
  for (size_t first = 0; first < m; first += kTileRows, c += kTileRows * c_stride) {
    const size_t tile_rows = std::min(m - first, kTileRows);
    const uint8_t* biases = static_cast<const uint8_t*>(w);
    for (size_t column = 0; column < n; column += kTileColumns) {
      const uint8_t* weights = biases + kBiasBytes;
      Tile sums;
      StartTile(biases, sums);
      for (size_t tap = 0; tap < taps; ++tap, weights += k * kTileColumns) {
        const int8_t* rows[kTileRows];
        for (size_t r = 0; r < kTileRows; ++r) {
          rows[r] = row_at(tap, first + std::min(r, tile_rows - 1));
        }
        AddProducts(rows, weights, k, sums);
      }
      StoreTile(sums, weights, range, tile_rows, std::min(n - column, kTileColumns),
                c + column / kTileColumns * c_block_stride, c_stride);
      biases = weights + kScaleBytes;
    }
  }
}

}  // namespace qz
