// SPDX-License-Identifier: Apache-2.0
#include "kernels/precondition.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

QZ_KERNEL(orra_qs8_f32_vcvt_ukernel__neon_x32)
(size_t count, const int8_t* input, float* output, const orra_dequant_params* params) {
  qz::Require(count > 0);
  const int32_t negated_zero_point = params->negated_zero_point[0];
  const float scale = params->scale;
  for (size_t i = 0; i < count; ++i) {
    output[i] = static_cast<float>(input[i] + negated_zero_point) * scale;
  }
}
