// SPDX-License-Identifier: Apache-2.0
// Squared magnitudes of complex bins.

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8)
(size_t bytes, const int16_t* input, uint32_t* output) {
  qz::Require(bytes > 0 && bytes % 4 == 0);
  for (size_t i = 0; i < bytes / (2 * sizeof(int16_t)); ++i) {
    const int32_t re = input[2 * i];
    const int32_t im = input[2 * i + 1];
    // Each square fits 31 bits; their sum may reach 2^31 and needs the unsigned type.
    output[i] = static_cast<uint32_t>(re * re) + static_cast<uint32_t>(im * im);
  }
}
