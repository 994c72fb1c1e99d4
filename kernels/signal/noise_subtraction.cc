// SPDX-License-Identifier: Apache-2.0
// Spectral subtraction of a slowly followed noise level, with a floor.

#include <algorithm>

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_u32_filterbank_subtract_ukernel__scalar_x2)
(size_t count, const uint32_t* input, uint32_t smoothing_even, uint32_t smoothing_odd,
 uint32_t retain_even, uint32_t retain_odd, uint32_t floor_fraction, uint32_t scale_bits,
 uint32_t fraction_bits, uint32_t* noise, uint32_t* output) {
  qz::Require(count > 0 && count % 2 == 0 && scale_bits < 32 && fraction_bits < 64);
  for (size_t c = 0; c < count; ++c) {
    const uint64_t smoothing = c % 2 == 0 ? smoothing_even : smoothing_odd;
    const uint64_t retain = c % 2 == 0 ? retain_even : retain_odd;
    const uint32_t level = input[c] << scale_bits;
    const uint32_t estimate =
        static_cast<uint32_t>((level * smoothing + noise[c] * retain) >> fraction_bits);
    noise[c] = estimate;
    const uint32_t above = (level > estimate ? level - estimate : 0) >> scale_bits;
    const uint32_t floor =
        static_cast<uint32_t>((uint64_t{input[c]} * floor_fraction) >> fraction_bits);
    output[c] = std::max(above, floor);
  }
}
