// SPDX-License-Identifier: Apache-2.0
// Block normalisation of a frame.

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_i16_vlshift_ukernel__neon_x32)
(size_t count, const int16_t* input, int16_t* output, uint32_t shift) {
  qz::Require(count > 0);
  const uint32_t factor = shift < 16 ? 1u << shift : 0;
  for (size_t i = 0; i < count; ++i) {
    output[i] = static_cast<int16_t>(static_cast<uint32_t>(input[i]) * factor);
  }
}
