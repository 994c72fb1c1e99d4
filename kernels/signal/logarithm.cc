// SPDX-License-Identifier: Apache-2.0
// Table-driven natural logarithm in Q16.

#include "kernels/signal/signal_kernels.h"
#include "kernels/signal/signal_tables.h"
#include "kernels/variant.h"

namespace {

constexpr uint64_t kLn2 = 45426;  // ln 2, Q16

// log2(y) in Q16, y not 0: the exponent, the mantissa as a straight line, and the table's
// correction at the low end of the mantissa's segment. The shift of 16 leaves next to nothing of
// the step to the segment's other end, 512 further (9 would interpolate): the results are defined
// that way.
inline uint32_t Log2(uint32_t y) {
  const uint32_t leading_zeros = static_cast<uint32_t>(__builtin_clz(y));
  const uint32_t exponent = 31 - leading_zeros;
  // The 16 bits behind the leading one, which the second shift drops.
  const uint32_t fraction = (y << leading_zeros << 1) >> 16;
  const uint32_t segment = fraction >> 9;
  const int32_t offset = static_cast<int32_t>(fraction & 511);
  const int32_t low = vrd_table_vlog[segment];
  const int32_t slope = vrd_table_vlog[segment + 1] - low;
  return (exponent << 16) + fraction + static_cast<uint32_t>(low + ((slope * offset) >> 16));
}

}  // namespace

QZ_KERNEL(orra_u32_vlog_ukernel__scalar_x1)
(size_t count, const uint32_t* input, uint32_t input_shift, uint32_t output_scale,
 uint16_t* output) {
  constexpr uint32_t kMax = 32767;
  for (size_t i = 0; i < count; ++i) {
    const uint32_t y = input_shift < 32 ? input[i] << input_shift : 0;
    if (y == 0) {
      output[i] = 0;
      continue;
    }
    const uint32_t natural = static_cast<uint32_t>((Log2(y) * kLn2 + 32768) >> 16);
    const uint32_t scaled = output_scale * natural + 32768;
    output[i] = static_cast<uint16_t>(scaled < kMax << 16 ? scaled >> 16 : kMax);
  }
}
