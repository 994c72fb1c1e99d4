// SPDX-License-Identifier: Apache-2.0
// The requantisation by float scales, 16 sums at a time: the steps of the reference's
// RequantiseFp32, lane by lane. Vector instructions take what is smaller than 2^-126 for 0; a
// product with such a scale rounds to 0 anyway.
#pragma once

#include <arm_neon.h>

#include "kernels/quantised/requantisation.h"

namespace qz {

// Sums and scales of 16 outputs, in order.
static inline int8x16_t RequantiseFp32(int32x4_t sums0, int32x4_t sums1, int32x4_t sums2,
                                       int32x4_t sums3, float32x4_t scales0, float32x4_t scales1,
                                       float32x4_t scales2, float32x4_t scales3,
                                       OutputRange range) {
  const auto round = [range](int32x4_t sums, float32x4_t scales) {
    float32x4_t values = vmulq_f32(vcvtq_f32_s32(sums), scales);
    values = vmaxq_f32(values, vdupq_n_f32(range.low));
    values = vminq_f32(values, vdupq_n_f32(range.high));
    return vreinterpretq_s16_f32(vaddq_f32(values, vdupq_n_f32(kRoundingTerm)));
  };
  // Only the low byte of each lane counts: the even halves, and of these the even halves.
  const int16x8_t low = vuzpq_s16(round(sums0, scales0), round(sums1, scales1)).val[0];
  const int16x8_t high = vuzpq_s16(round(sums2, scales2), round(sums3, scales3)).val[0];
  const int8x16_t rounded = vuzpq_s8(vreinterpretq_s8_s16(low), vreinterpretq_s8_s16(high)).val[0];
  return vaddq_s8(rounded, vdupq_n_s8(static_cast<int8_t>(range.zero_point)));
}

// Packed data need no alignment: they are loaded as bytes.
static inline int32x4_t LoadInts(const uint8_t* from) {
  return vreinterpretq_s32_u8(vld1q_u8(from));
}
static inline float32x4_t LoadFloats(const uint8_t* from) {
  return vreinterpretq_f32_u8(vld1q_u8(from));
}

// Stores the first `count` of 8 bytes, 8 if there are more.
static inline void StoreFirst(int8x8_t values, size_t count, int8_t* out) {
  if (count >= 8) {
    vst1_s8(out, values);
    return;
  }
  uint32_t word = vget_lane_u32(vreinterpret_u32_s8(values), 0);
  if ((count & 4) != 0) {
    std::memcpy(out, &word, 4);
    out += 4;
    word = vget_lane_u32(vreinterpret_u32_s8(values), 1);
  }
  if ((count & 2) != 0) {
    std::memcpy(out, &word, 2);
    out += 2;
    word >>= 16;
  }
  if ((count & 1) != 0) *out = static_cast<int8_t>(word);
}

// Stores the first `count` of 16 bytes, less than 16.
static inline void StoreFirst(int8x16_t values, size_t count, int8_t* out) {
  StoreFirst(vget_low_s8(values), count, out);
  if (count > 8) StoreFirst(vget_high_s8(values), count - 8, out + 8);
}

}  // namespace qz
