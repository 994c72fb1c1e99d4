// SPDX-License-Identifier: Apache-2.0
// Instructions against the reference's, both g++ 12 -O3 (scripts/kernel-gains.py): 3,403
// for 10,240, a ratio of 3.0, with 64 columns and 60 channels.

#include <arm_neon.h>

#include <algorithm>

#include "kernels/quantised/neon/requantise.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

namespace {

constexpr size_t kColumns = 8;

// The steps of the reference's RequantiseRndnu, lane by lane. Shift instructions take the low byte
// of a count; counts beyond 32 give what 32 gives (33 for the rounded shift).
struct Steps {
  explicit Steps(const orra_rndnu_requant_params& params)
      : pre_shift(vdupq_n_s32(std::clamp(params.pre_shift, -32, 32))),
        multiplier(vdupq_n_s32(params.multiplier)),
        post_shift(vdupq_n_s32(std::max(params.post_shift, -33))),
        zero_point(vdupq_n_s16(params.output_zero_point)),
        low(vdup_n_s8(params.output_min)),
        high(vdup_n_s8(params.output_max)) {}

  // The doubled product's high half, not rounded, is floor(sum * multiplier / 2^31), saturated.
  int32x4_t Scale(int32x4_t sums) const {
    return vrshlq_s32(vqdmulhq_s32(vqshlq_s32(sums, pre_shift), multiplier), post_shift);
  }

  int8x8_t Requantise(int32x4_t low_sums, int32x4_t high_sums) const {
    const int16x8_t values =
        vcombine_s16(vqmovn_s32(Scale(low_sums)), vqmovn_s32(Scale(high_sums)));
    return vmin_s8(vmax_s8(vqmovn_s16(vqaddq_s16(values, zero_point)), low), high);
  }

  int32x4_t pre_shift;
  int32x4_t multiplier;
  int32x4_t post_shift;
  int16x8_t zero_point;
  int8x8_t low;
  int8x8_t high;
};

}  // namespace

QZ_KERNEL(orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7)
(size_t /*m*/, size_t n, size_t k, const int8_t* a, size_t /*a_stride*/, const void* w, int8_t* c,
 size_t /*c_stride*/, size_t c_block_stride, const orra_rndnu_requant_params* params) {
  const Steps steps(*params);
  const uint8_t* block = static_cast<const uint8_t*>(w);
  for (size_t left = n; left > 0; left -= std::min(left, kColumns)) {
    int32x4_t low = qz::LoadInts(block), high = qz::LoadInts(block + 16);
    const int8_t* weights = reinterpret_cast<const int8_t*>(block + 32);
    // Two channels at a time: their products' sum fits 16 bits, as no weight is -128.
    size_t i = 0;
    for (; i + 2 <= k; i += 2, weights += 2 * kColumns) {
      const int8x16_t two_channels = vld1q_s8(weights);
      int16x8_t products = vmull_s8(vld1_dup_s8(a + i), vget_low_s8(two_channels));
      products = vmlal_s8(products, vld1_dup_s8(a + i + 1), vget_high_s8(two_channels));
      low = vaddw_s16(low, vget_low_s16(products));
      high = vaddw_s16(high, vget_high_s16(products));
    }
    if (i < k) {
      const int16x8_t products = vmull_s8(vld1_dup_s8(a + i), vld1_s8(weights));
      low = vaddw_s16(low, vget_low_s16(products));
      high = vaddw_s16(high, vget_high_s16(products));
      weights += kColumns;
    }
    qz::StoreFirst(steps.Requantise(low, high), left, c);
    c += c_block_stride;
    block = reinterpret_cast<const uint8_t*>(weights);
  }
}
