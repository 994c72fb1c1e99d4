// SPDX-License-Identifier: Apache-2.0
// The largest magnitude of a frame.

#include <algorithm>

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_s16_rmaxabs_ukernel__neon_x32)
(size_t bytes, const int16_t* input, uint16_t* output) {
  qz::Require(bytes > 0 && bytes % 2 == 0);
  int16_t max = 0;
  int16_t min = 0;
  for (size_t i = 0; i < bytes / sizeof(int16_t); ++i) {
    max = std::max(max, input[i]);
    min = std::min(min, input[i]);
  }
  *output = static_cast<uint16_t>(std::max<int32_t>(max, -min));
}
