#include "gemm_tile.h"
#include "quantised_kernels.h"

namespace {

// Rows from m on repeat row m - 1: the tile is computed whole, and only its first m rows are
// stored.
void MultiplyTile(size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w,
                  int8_t* c, size_t c_stride, size_t c_block_stride, qz::OutputRange range) {
  const int8_t* rows[qz::kTileRows];
  for (size_t r = 0; r < qz::kTileRows; ++r) rows[r] = a + std::min(r, m - 1) * a_stride;

  const uint8_t* biases = static_cast<const uint8_t*>(w);
  for (size_t column = 0; column < n; column += qz::kTileColumns) {
    const uint8_t* weights = biases + qz::kBiasBytes;
    const uint8_t* scales = weights + k * qz::kTileColumns;
    qz::Tile sums;
    qz::StartTile(biases, sums);
    qz::AddProducts(rows, weights, k, sums);
    qz::StoreTile(sums, scales, range, m, std::min(n - column, qz::kTileColumns),
                  c + column / qz::kTileColumns * c_block_stride, c_stride);
    biases = scales + qz::kScaleBytes;
  }
}

}  // namespace

extern "C" void orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
    size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w, int8_t* c,
    size_t c_stride, size_t c_block_stride, const orra_fp32_requant_params* params) {
  const qz::OutputRange range = qz::RangeOf(*params);
  for (size_t row = 0; row < m; row += qz::kTileRows) {
    MultiplyTile(std::min(m - row, qz::kTileRows), n, k, a + row * a_stride, a_stride, w,
                 c + row * c_stride, c_stride, c_block_stride, range);
  }
}
