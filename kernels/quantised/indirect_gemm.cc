#include "gemm_tile.h"
#include "indirection.h"
#include "quantised_kernels.h"

namespace {

struct Rows {
  size_t taps;
  size_t offset;
  const int8_t* zero;
};

// The tile is computed whole, from the list's 4 rows a tap, and only its first m rows are stored.
void MultiplyTile(size_t m, size_t n, size_t k, const int8_t* const* list, Rows in, const void* w,
                  int8_t* c, size_t c_stride, size_t c_block_stride, qz::OutputRange range) {
  const uint8_t* biases = static_cast<const uint8_t*>(w);
  for (size_t column = 0; column < n; column += qz::kTileColumns) {
    const uint8_t* weights = biases + qz::kBiasBytes;
    qz::Tile sums;
    qz::StartTile(biases, sums);
    for (size_t tap = 0; tap < in.taps; ++tap) {
      const int8_t* rows[qz::kTileRows];
      for (size_t r = 0; r < qz::kTileRows; ++r) {
        rows[r] = qz::ListedRow(list, tap * qz::kTileRows + r, in.offset, in.zero);
      }
      qz::AddProducts(rows, weights, k, sums);
      weights += k * qz::kTileColumns;
    }
    const uint8_t* scales = weights;
    qz::StoreTile(sums, scales, range, m, std::min(n - column, qz::kTileColumns),
                  c + column / qz::kTileColumns * c_block_stride, c_stride);
    biases = scales + qz::kScaleBytes;
  }
}

}  // namespace

extern "C" void orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
    size_t m, size_t n, size_t k, size_t tap_bytes, const int8_t* const* a_ptrs, const void* w,
    int8_t* c, size_t c_stride, size_t c_block_stride, size_t a_offset, const int8_t* zero,
    const orra_fp32_requant_params* params) {
  const qz::OutputRange range = qz::RangeOf(*params);
  const size_t taps = tap_bytes / (qz::kTileRows * sizeof(const int8_t*));
  for (size_t row = 0; row < m; row += qz::kTileRows) {
    MultiplyTile(std::min(m - row, qz::kTileRows), n, k, a_ptrs, {taps, a_offset, zero}, w,
                 c + row * c_stride, c_stride, c_block_stride, range);
    a_ptrs = qz::Advance(a_ptrs, tap_bytes);
  }
}
