// SPDX-License-Identifier: Apache-2.0
#include "kernels/precondition.h"
#include "kernels/quantised/gemm_tile.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35)
(size_t m, size_t n, size_t k, size_t tap_bytes, const int8_t* const* a_ptrs, const void* w,
 int8_t* c, size_t c_stride, size_t c_block_stride, size_t a_offset, const int8_t* zero,
 const orra_fp32_requant_params* params) {
  qz::Require(m > 0 && n > 0 && k > 0 && tap_bytes > 0 && tap_bytes % (4 * sizeof *a_ptrs) == 0);
  const size_t taps = tap_bytes / (qz::kTileRows * sizeof(const int8_t*));
  const auto row_at = [=](size_t tap, size_t row) {
    return qz::TileRow(a_ptrs, taps, tap, row, a_offset, zero);
  };
  qz::MultiplyTiles(m, n, k, taps, row_at, w, c, c_stride, c_block_stride, qz::RangeOf(*params));
}
