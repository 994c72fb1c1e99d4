// SPDX-License-Identifier: Apache-2.0
// The analysis window of a frame.

#include <algorithm>

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_s16_window_shift12_ukernel__neon_x32)
(size_t rows, size_t row_bytes, const int16_t* input, const int16_t* weights, int16_t* output,
 uint32_t /*shift*/) {
  qz::Require(rows > 0 && row_bytes > 0 && row_bytes % 2 == 0);
  const size_t row_samples = row_bytes / sizeof(int16_t);
  for (size_t row = 0; row < rows; ++row) {
    for (size_t i = 0; i < row_samples; ++i) {
      const int32_t scaled = (input[i] * weights[i]) >> 12;
      output[i] = static_cast<int16_t>(std::clamp(scaled, -32768, 32767));
    }
    input += row_samples;
    output += row_samples;
  }
}
