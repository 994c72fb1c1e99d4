// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "kernels/precondition.h"
#include "kernels/quantised/indirection.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16)
(size_t positions, size_t pool_size, size_t channels, const int8_t* const* in_ptrs,
 size_t in_offset, int8_t* out, size_t in_ptrs_gap, size_t out_gap,
 const orra_s8_clamp_params* params) {
  qz::Require(positions > 0 && pool_size > 0 && channels > 0);
  const int8_t low = params->output_min;
  const int8_t high = params->output_max;
  for (size_t position = 0; position < positions; ++position) {
    int8_t* __restrict position_out = out + position * (channels + out_gap);
    for (size_t entry = 0; entry < pool_size; entry += 2) {
      const int8_t* first = qz::RowAt(qz::ListEntry(in_ptrs, entry) + in_offset);
      const int8_t* second =
          qz::RowAt(qz::ListEntry(in_ptrs, std::min(entry + 1, pool_size - 1)) + in_offset);
      // From the second pass on, the output so far is one of the rows.
      const int8_t* so_far = entry == 0 ? first : position_out;
      for (size_t c = 0; c < channels; ++c) {
        const int8_t max = std::max(std::max(first[c], second[c]), so_far[c]);
        position_out[c] = std::min(std::max(max, low), high);
      }
    }
    const size_t entries = pool_size + pool_size % 2;
    in_ptrs = qz::Advance(in_ptrs, entries * sizeof(const int8_t*) + in_ptrs_gap);
  }
}
