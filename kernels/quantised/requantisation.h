// SPDX-License-Identifier: Apache-2.0
// From an int32 accumulator to an int8 output, in the two ways of the kernels. Internal linkage
// throughout these helper headers: a kernel's source may be compiled again for another processor.
#pragma once

#include <algorithm>
#include <cfloat>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "kernels/quantised/quantised_kernels.h"

namespace qz {

static_assert(FLT_EVAL_METHOD == 0, "float steps must round to single precision one by one");

// What the zero point and the clamp leave of the output range, as bounds of the unrounded value.
struct OutputRange {
  float low;
  float high;
  int32_t zero_point;
};

// The steps after rounding are to saturate to int32 and to int16, to add the zero point Z
// saturating to int16, to saturate to int8, and to clamp to [min, max]. Together they clamp the
// rounded value q to int16 and then to [min - Z, max - Z], and add Z. Two clamps in a row make one,
// whose bounds are those of the first put through the second. All bounds are integers, and rounding
// is monotone and leaves integers alone, so that clamping before rounding gives the same.
//
// The matrix kernels' clamp is min(max(q, output_min), output_max), which is a clamp to output_max
// alone where output_min is larger.
static inline OutputRange RangeOf(const orra_fp32_requant_params& params) {
  const int32_t zero_point = params.output_zero_point;
  const int32_t low = std::min(params.output_min, params.output_max) - zero_point;
  const int32_t high = params.output_max - zero_point;
  return {static_cast<float>(std::clamp<int32_t>(INT16_MIN, low, high)),
          static_cast<float>(std::clamp<int32_t>(INT16_MAX, low, high)), zero_point};
}

// The depthwise kernel's is max(min(q, output_max), output_min): to output_min alone where that is
// larger.
static inline orra_fp32_requant_params DepthwiseParams(const orra_fp32_requant_params& params) {
  return {params.output_zero_point, params.output_min,
          std::max(params.output_min, params.output_max)};
}

constexpr float kRoundingTerm = 12582912.0f;  // 1.5 * 2^23

// Clamped first, the value lies within +-2^15 (or, by a zero point beyond int8, +-2^16), where
// adding 1.5 * 2^23 rounds it to an integer, ties to even, as floats have a spacing of 1 there. The
// sum's bits then count up from those of 1.5 * 2^23, of which the low byte is 0: the low byte of
// (bits + zero point) is the output, which the clamp has fitted to int8.
static inline int8_t RequantiseFp32(uint32_t accumulator, float scale, OutputRange range) {
  float value = static_cast<float>(static_cast<int32_t>(accumulator)) * scale;
  value = value > range.low ? value : range.low;
  value = value < range.high ? value : range.high;
  const float rounded = value + kRoundingTerm;
  int32_t bits;
  std::memcpy(&bits, &rounded, sizeof bits);
  return static_cast<int8_t>(bits + range.zero_point);
}

// `restrict` and the range's copy let the loop be vectorised: bytes might else be written over
// both.
template <size_t kCount>
static inline void RequantiseFp32(const uint32_t (&accumulators)[kCount],
                                  const float (&scales)[kCount], OutputRange range,
                                  int8_t* __restrict out) {
  for (size_t i = 0; i < kCount; ++i) out[i] = RequantiseFp32(accumulators[i], scales[i], range);
}

static inline int64_t SaturateToInt32(int64_t value) {
  return std::clamp<int64_t>(value, INT32_MIN, INT32_MAX);
}

// Shift counts beyond 32 give what 32 gives (33 for the rounded shift): all bits are gone by then.
static inline int8_t RequantiseRndnu(int32_t accumulator, const orra_rndnu_requant_params& params) {
  int64_t value = accumulator;
  if (params.pre_shift >= 0) {
    value = SaturateToInt32(value * (int64_t{1} << std::min(params.pre_shift, 32)));
  } else {
    value >>= -std::max(params.pre_shift, -32);
  }
  value = SaturateToInt32((value * params.multiplier) >> 31);
  const int32_t shift = -std::max(params.post_shift, -33);
  value = (value + (int64_t{1} << (shift - 1))) >> shift;

  const int64_t zero_point = params.output_zero_point;
  value = std::clamp<int64_t>(value, INT16_MIN, INT16_MAX) + zero_point;
  value = std::max<int64_t>(value, params.output_min);
  return static_cast<int8_t>(std::min<int64_t>(value, params.output_max));
}

}  // namespace qz
