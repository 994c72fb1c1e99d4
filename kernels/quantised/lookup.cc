// SPDX-License-Identifier: Apache-2.0
#include "kernels/precondition.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_x8_lut_ukernel__scalar_x2)
(size_t count, const uint8_t* input, uint8_t* output, const uint8_t* table) {
  qz::Require(count > 0);
  for (size_t i = 0; i < count; ++i) output[i] = table[input[i]];
}
