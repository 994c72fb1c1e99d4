// SPDX-License-Identifier: Apache-2.0
#include "kernels/precondition.h"
#include "kernels/quantised/gemm_tile.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35)
(size_t m, size_t n, size_t k, const int8_t* a, size_t a_stride, const void* w, int8_t* c,
 size_t c_stride, size_t c_block_stride, const orra_fp32_requant_params* params) {
  qz::Require(m > 0 && n > 0 && k > 0);
  qz::MultiplyTiles(
      m, n, k, 1, [=](size_t, size_t row) { return a + row * a_stride; }, w, c, c_stride,
      c_block_stride, qz::RangeOf(*params));
}
