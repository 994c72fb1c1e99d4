// SPDX-License-Identifier: Apache-2.0
// Instructions against the reference's, both g++ 12 -O3 (scripts/kernel-gains.py): 14,417
// for 85,790, a ratio of 6.0, with 4 rows, 60 columns and 3 taps of 60 channels.

#include "kernels/quantised/indirection.h"
#include "kernels/quantised/neon/vector_tile.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

// Tile by tile: each is computed whole, from its list's 4 rows a tap, and only the rows of the last
// tile that exist are stored.
QZ_KERNEL(orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35)
(size_t m, size_t n, size_t k, size_t tap_bytes, const int8_t* const* a_ptrs, const void* w,
 int8_t* c, size_t c_stride, size_t c_block_stride, size_t a_offset, const int8_t* zero,
 const orra_fp32_requant_params* params) {
  const qz::OutputRange range = qz::RangeOf(*params);
  for (;;) {
    const int8_t* const* end = qz::Advance(a_ptrs, tap_bytes);
    const uint8_t* biases = static_cast<const uint8_t*>(w);
    int8_t* tile = c;
    for (size_t left = n; left > 0; left -= std::min(left, qz::kTileColumns)) {
      const uint8_t* weights = biases + qz::kBiasBytes;
      auto sums = qz::StartVectorTile<qz::kTileRows>(biases);
      for (const int8_t* const* entries = a_ptrs; entries != end; entries += qz::kTileRows) {
        const int8_t* rows[qz::kTileRows];
        for (size_t r = 0; r < qz::kTileRows; ++r) {
          rows[r] = qz::ListedRow(entries, r, a_offset, zero);
        }
        qz::AddProducts(rows, weights, k, sums);
        weights += k * qz::kTileColumns;
      }
      const uint8_t* scales = weights;
      qz::StoreTile(sums, scales, range, m, left, tile, c_stride);
      tile += c_block_stride;
      biases = scales + qz::kScaleBytes;
    }
    if (m <= qz::kTileRows) return;
    m -= qz::kTileRows;
    a_ptrs = end;
    c += qz::kTileRows * c_stride;
  }
}
