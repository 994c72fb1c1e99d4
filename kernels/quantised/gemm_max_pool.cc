// SPDX-License-Identifier: Apache-2.0
#include "kernels/precondition.h"
#include "kernels/quantised/gemm_tile.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

namespace {

// The larger of each two rows' sums; what becomes of the tile's other rows does not count.
void PoolRows(qz::Tile& sums) {
  for (size_t i = 0; i < qz::kTileSize / 2; ++i) {
    const size_t first = i / qz::kTileColumns * 2 * qz::kTileColumns + i % qz::kTileColumns;
    sums[i] = static_cast<uint32_t>(std::max(static_cast<int32_t>(sums[first]),
                                             static_cast<int32_t>(sums[first + qz::kTileColumns])));
  }
}

}  // namespace

// Tiles of 4 rows, 2 of the output; in a last tile of fewer rows the last one is repeated.
QZ_KERNEL(orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon)
(size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w, int8_t* c,
 size_t c_stride, size_t c_block_stride, const orra_fp32_requant_params* params) {
  qz::Require(m > 0 && n > 0 && k > 0);
  constexpr size_t kPooledRows = qz::kTileRows / 2;
  for (size_t first = 0; first < m; first += kPooledRows, c += kPooledRows * c_stride) {
    const int8_t* rows[qz::kTileRows];
    for (size_t r = 0; r < qz::kTileRows; ++r) {
      rows[r] = a + std::min(2 * first + r, 2 * m - 1) * a_stride;
    }
    const uint8_t* biases = static_cast<const uint8_t*>(w);
    for (size_t column = 0; column < n; column += qz::kTileColumns) {
      const uint8_t* const weights = biases + qz::kBiasBytes;
      const uint8_t* const scales = weights + k * qz::kTileColumns;
      qz::Tile sums;
      qz::StartTile(biases, sums);
      qz::AddProducts(rows, weights, k, sums);
      PoolRows(sums);
      qz::StoreTile(sums, scales, qz::RangeOf(*params), std::min(m - first, kPooledRows),
                    std::min(n - column, qz::kTileColumns),
                    c + column / qz::kTileColumns * c_block_stride, c_stride);
      biases = scales + qz::kScaleBytes;
    }
  }
}
