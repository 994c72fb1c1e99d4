// SPDX-License-Identifier: Apache-2.0
// The complex FFT's input in digit-reversed order, 16 values at a time.

#include "kernels/signal/fft_load_vector.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_cs16_digitreverse_ukernel__neon_x16)
(size_t count, const int16_t* input, int16_t* output) {
  qz::signal::LoadDigitReversed(count, input, output);
}
