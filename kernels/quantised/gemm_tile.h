// The 4-row, 8-column tile of the two matrix kernels with float scales.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "requantisation.h"

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
// Weights come input channel by input channel. They are turned round first, into one run of 16-bit
// values a column beside one a row: products of such runs are what processors multiply and add in
// pairs, and turning them is paid for by four rows. Runs are filled up with zeros to whole eights.
static inline void AddProducts(const int8_t* const (&rows)[kTileRows], const uint8_t* weights,
                               size_t k, Tile& sums) {
  constexpr size_t kRun = 64;
  alignas(16) int16_t row_run[kTileRows][kRun];
  alignas(16) int16_t column_run[kTileColumns][kRun];
  for (size_t start = 0; start < k; start += kRun) {
    const size_t count = std::min(k - start, kRun);
    const size_t eights = (count + 7) / 8;
    for (size_t i = 8 * eights - 8; i < 8 * eights; ++i) {
      for (auto& run : row_run) run[i] = 0;
      for (auto& run : column_run) run[i] = 0;
    }
    for (size_t r = 0; r < kTileRows; ++r) {
      for (size_t i = 0; i < count; ++i) row_run[r][i] = rows[r][start + i];
    }
    const uint8_t* block = weights + kTileColumns * start;
    for (size_t i = 0; i < count; ++i) {
      for (size_t j = 0; j < kTileColumns; ++j) {
        column_run[j][i] = static_cast<int8_t>(block[kTileColumns * i + j]);
      }
    }
    for (size_t r = 0; r < kTileRows; ++r) {
      for (size_t j = 0; j < kTileColumns; ++j) {
        int32_t sum = 0;  // at most 64 * 2^14: cannot overflow
        for (size_t i = 0; i < 8 * eights; ++i) sum += row_run[r][i] * column_run[j][i];
        sums[r * kTileColumns + j] += static_cast<uint32_t>(sum);
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

}  // namespace qz
