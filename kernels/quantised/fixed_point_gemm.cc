// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cstring>

#include "kernels/precondition.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/quantised/requantisation.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7)
(size_t /*m*/, size_t n, size_t k, const int8_t* a, size_t /*a_stride*/, const void* w, int8_t* c,
 size_t /*c_stride*/, size_t c_block_stride, const orra_rndnu_requant_params* params) {
  qz::Require(n > 0 && k > 0 && params->post_shift < 0);
  constexpr size_t kColumns = 8;
  const uint8_t* block = static_cast<const uint8_t*>(w);
  for (size_t column = 0; column < n; column += kColumns) {
    uint32_t sums[kColumns];  // modulo 2^32
    std::memcpy(sums, block, sizeof sums);
    block += sizeof sums;
    for (size_t i = 0; i < k; ++i) {
      for (size_t j = 0; j < kColumns; ++j) {
        sums[j] += static_cast<uint32_t>(a[i] * static_cast<int8_t>(block[j]));
      }
      block += kColumns;
    }
    int8_t row[kColumns];
    for (size_t j = 0; j < kColumns; ++j) {
      row[j] = qz::RequantiseRndnu(static_cast<int32_t>(sums[j]), *params);
    }
    std::memcpy(c + column / kColumns * c_block_stride, row, std::min(n - column, kColumns));
  }
}
