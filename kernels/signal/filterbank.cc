// SPDX-License-Identifier: Apache-2.0
// Energies of overlapping triangular channels.

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2)
(size_t rows, const uint32_t* input, const uint8_t* widths, const uint16_t* weights,
 uint64_t* output) {
  qz::Require(rows > 0);
  // Each segment falls for the current channel (w0) and rises for the next (w1); the first only
  // rises.
  uint64_t current = 0;
  for (size_t bin = 0; bin < widths[0]; ++bin) {
    current += uint64_t{*input++} * weights[1];
    weights += 2;
  }
  for (size_t row = 0; row < rows; ++row) {
    uint64_t next = 0;
    for (size_t bin = 0; bin < widths[row + 1]; ++bin) {
      const uint64_t power = *input++;
      current += power * weights[0];
      next += power * weights[1];
      weights += 2;
    }
    output[row] = current;
    current = next;
  }
}
