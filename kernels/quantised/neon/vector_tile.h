// SPDX-License-Identifier: Apache-2.0
// The tile of the matrix kernels with float scales: 8 columns and 4, 2 or 1 rows, held in 8 vector
// registers or fewer.
//
// Products are added up in pairs of input channels: 66 instructions for 8 channels. Multiplying
// 16-bit weights by one lane of 16-bit inputs takes 118 as compiled. llvm-mca, which knows neither
// the Cortex-A35 nor the A53 in AArch32, gives 42 and 64 cycles of a Cortex-A57.
#pragma once

#include <arm_neon.h>

#include "kernels/quantised/gemm_tile.h"
#include "kernels/quantised/neon/requantise.h"

namespace qz {

template <size_t kRows>
struct VectorTile {
  int32x4_t sums[kRows][2];  // columns 0 to 3, and 4 to 7
};

template <size_t kRows>
static inline VectorTile<kRows> StartVectorTile(const uint8_t* biases) {
  VectorTile<kRows> tile;
  for (auto& row : tile.sums) {
    row[0] = LoadInts(biases);
    row[1] = LoadInts(biases + 16);
  }
  return tile;
}

// Adds 4 input channels of a row. Lanes 2j and 2j + 1 of the products belong to column j: one sums
// channels 0 and 2, the other 1 and 3, at most 2 * 128 * 127 as no weight is -128.
static inline void AddChannels(int16x4_t in01, int16x4_t in23, const int8x8x2_t& weights01,
                               const int8x8x2_t& weights23, int32x4_t (&sums)[2]) {
  for (size_t half = 0; half < 2; ++half) {
    int16x8_t products = vmull_s8(vreinterpret_s8_s16(in01), weights01.val[half]);
    products = vmlal_s8(products, vreinterpret_s8_s16(in23), weights23.val[half]);
    sums[half] = vpadalq_s16(sums[half], products);
  }
}

// Reads the weights of the next two input channels, paired by column: of columns 0 to 3, of 4 to 7.
static inline int8x8x2_t ReadPairs(const int8_t*& weights, size_t channel_bytes) {
  const int8x8_t even = vld1_s8(weights);
  weights += channel_bytes;
  const int8x8_t odd = vld1_s8(weights);
  weights += channel_bytes;
  return vzip_s8(even, odd);
}

// Only for the loads that fill all lanes with one pair each; these need no alignment.
static inline const int16_t* PairsAt(const int8_t* row) {
  return reinterpret_cast<const int16_t*>(row);
}

// The last 1 to 3 input channels: what is read beyond them meets weights of 0.
template <size_t kRows>
static inline void AddLastProducts(const int8_t* const (&in)[kRows], const int8_t* weights,
                                   size_t k, VectorTile<kRows>& tile) {
  const int8x8_t none = vdup_n_s8(0);
  const int8x8_t channel1 = k > 1 ? vld1_s8(weights + 8) : none;
  const int8x8_t channel2 = k > 2 ? vld1_s8(weights + 16) : none;
  const int8x8x2_t weights01 = vzip_s8(vld1_s8(weights), channel1);
  const int8x8x2_t weights23 = vzip_s8(channel2, none);
  for (size_t r = 0; r < kRows; ++r) {
    const int16x4x2_t pairs = vld2_dup_s16(PairsAt(in[r]));
    AddChannels(pairs.val[0], pairs.val[1], weights01, weights23, tile.sums[r]);
  }
}

// tile.sums[r], column j, += sum over i < k of rows[r][i] * weights[8 * i + j].
template <size_t kRows>
static inline void AddProducts(const int8_t* const (&rows)[kRows], const uint8_t* weights, size_t k,
                               VectorTile<kRows>& tile) {
  // Hidden from the compiler, which then lets loads step their own address: with a known number the
  // loop has 8 additions more.
  size_t channel_bytes = kTileColumns;
  asm("" : "+r"(channel_bytes));
  const int8_t* in[kRows];
  std::copy_n(rows, kRows, in);
  const int8_t* w = reinterpret_cast<const int8_t*>(weights);
  for (size_t eights = k / 8; eights > 0; --eights) {
    const int8x8x2_t weights01 = ReadPairs(w, channel_bytes);
    const int8x8x2_t weights23 = ReadPairs(w, channel_bytes);
    const int8x8x2_t weights45 = ReadPairs(w, channel_bytes);
    const int8x8x2_t weights67 = ReadPairs(w, channel_bytes);
    for (size_t r = 0; r < kRows; ++r) {
      const int16x4x4_t pairs = vld4_dup_s16(PairsAt(in[r]));
      in[r] += 8;
      AddChannels(pairs.val[0], pairs.val[1], weights01, weights23, tile.sums[r]);
      AddChannels(pairs.val[2], pairs.val[3], weights45, weights67, tile.sums[r]);
    }
  }
  if ((k & 4) != 0) {
    const int8x8x2_t weights01 = ReadPairs(w, channel_bytes);
    const int8x8x2_t weights23 = ReadPairs(w, channel_bytes);
    for (size_t r = 0; r < kRows; ++r) {
      const int16x4x2_t pairs = vld2_dup_s16(PairsAt(in[r]));
      in[r] += 4;
      AddChannels(pairs.val[0], pairs.val[1], weights01, weights23, tile.sums[r]);
    }
  }
  if ((k & 3) != 0) AddLastProducts(in, w, k & 3, tile);
}

// Requantises the whole tile and stores its first m rows and `columns` columns, 8 if there are
// more.
template <size_t kRows>
static inline void StoreTile(const VectorTile<kRows>& tile, const uint8_t* scales,
                             OutputRange range, size_t m, size_t columns, int8_t* c,
                             size_t c_stride) {
  const float32x4_t low = LoadFloats(scales), high = LoadFloats(scales + 16);
  for (size_t r = 0; r < kRows; r += 2) {
    const size_t next = std::min(r + 1, kRows - 1);
    const int8x16_t two_rows = RequantiseFp32(tile.sums[r][0], tile.sums[r][1], tile.sums[next][0],
                                              tile.sums[next][1], low, high, low, high, range);
    if (r < m) StoreFirst(vget_low_s8(two_rows), columns, c + r * c_stride);
    if (r + 1 < m) StoreFirst(vget_high_s8(two_rows), columns, c + (r + 1) * c_stride);
  }
}

// All columns of one tile of a matrix product: Finish makes of the sums the tile that is stored.
template <size_t kRows, typename Finish>
static inline void MultiplyTile(const int8_t* const (&rows)[kRows], size_t n, size_t k,
                                const void* w, int8_t* c, size_t c_stride, size_t c_block_stride,
                                OutputRange range, size_t stored_rows, Finish finish) {
  const uint8_t* biases = static_cast<const uint8_t*>(w);
  for (size_t left = n; left > 0; left -= std::min(left, kTileColumns)) {
    const uint8_t* weights = biases + kBiasBytes;
    const uint8_t* scales = weights + k * kTileColumns;
    VectorTile<kRows> sums = StartVectorTile<kRows>(biases);
    AddProducts(rows, weights, k, sums);
    StoreTile(finish(sums), scales, range, stored_rows, left, c, c_stride);
    c += c_block_stride;
    biases = scales + kScaleBytes;
  }
}

}  // namespace qz
