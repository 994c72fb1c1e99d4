// SPDX-License-Identifier: Apache-2.0
// Instructions against the reference's, both g++ 12 -O3 (scripts/kernel-gains.py): 96,598
// for 496,716, a ratio of 5.1, with 48 channels and 380 positions.

#include <arm_neon.h>

#include "kernels/quantised/indirection.h"
#include "kernels/quantised/neon/requantise.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/variant.h"

namespace {

constexpr size_t kTaps = 3;
constexpr size_t kGroup = 16;
constexpr size_t kWeightsAt = kGroup * sizeof(int32_t);
constexpr size_t kScalesAt = kWeightsAt + kTaps * kGroup;
constexpr size_t kGroupBytes = kScalesAt + kGroup * sizeof(float);

// 8 channels: taps 0 and 1 together fit 16 bits, at most 2 * 128 * 127 as no weight is -128; tap 2
// comes on top in 32 bits.
inline void Convolve(const int8x8_t (&in)[kTaps], const int8x8_t (&weights)[kTaps],
                     const uint8_t* biases, int32x4_t& low, int32x4_t& high) {
  const int16x8_t taps01 = vmlal_s8(vmull_s8(in[0], weights[0]), in[1], weights[1]);
  const int16x8_t tap2 = vmull_s8(in[2], weights[2]);
  low = vaddw_s16(qz::LoadInts(biases), vget_low_s16(taps01));
  low = vaddw_s16(low, vget_low_s16(tap2));
  high = vaddw_s16(qz::LoadInts(biases + 16), vget_high_s16(taps01));
  high = vaddw_s16(high, vget_high_s16(tap2));
}

// One position's output of 16 channels.
inline int8x16_t ConvolveGroup(const int8x16_t (&in)[kTaps], const uint8_t* packed,
                               qz::OutputRange range) {
  int8x8_t low_in[kTaps], high_in[kTaps], low_weights[kTaps], high_weights[kTaps];
  for (size_t t = 0; t < kTaps; ++t) {
    const int8x16_t weights = vreinterpretq_s8_u8(vld1q_u8(packed + kWeightsAt + t * kGroup));
    low_in[t] = vget_low_s8(in[t]);
    high_in[t] = vget_high_s8(in[t]);
    low_weights[t] = vget_low_s8(weights);
    high_weights[t] = vget_high_s8(weights);
  }
  int32x4_t sums[4];
  Convolve(low_in, low_weights, packed, sums[0], sums[1]);
  Convolve(high_in, high_weights, packed + 32, sums[2], sums[3]);
  const uint8_t* scales = packed + kScalesAt;
  return qz::RequantiseFp32(sums[0], sums[1], sums[2], sums[3], qz::LoadFloats(scales),
                            qz::LoadFloats(scales + 16), qz::LoadFloats(scales + 32),
                            qz::LoadFloats(scales + 48), range);
}

// The last 1 to 15 channels: 8 of a row are read, or all 16 if there are 9 or more, so that a read
// goes no more than 7 bytes too far.
inline void ConvolveLast(const int8_t* const (&rows)[kTaps], size_t channels, const uint8_t* packed,
                         qz::OutputRange range, int8_t* out) {
  int8x16_t in[kTaps];
  for (size_t t = 0; t < kTaps; ++t) {
    in[t] = channels > 8 ? vld1q_s8(rows[t]) : vcombine_s8(vld1_s8(rows[t]), vdup_n_s8(0));
  }
  qz::StoreFirst(ConvolveGroup(in, packed, range), channels, out);
}

}  // namespace

QZ_KERNEL(orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35)
(size_t channels, size_t width, const int8_t* const* in_ptrs, const void* w, int8_t* out,
 size_t in_ptrs_step, size_t out_gap, size_t in_offset, const int8_t* zero,
 const orra_fp32_requant_params* params) {
  const qz::OutputRange range = qz::RangeOf(qz::DepthwiseParams(*params));
  for (; width > 0; --width) {
    const int8_t* rows[kTaps];
    for (size_t t = 0; t < kTaps; ++t) rows[t] = qz::ListedRow(in_ptrs, t, in_offset, zero);
    const uint8_t* packed = static_cast<const uint8_t*>(w);
    size_t left = channels;
    for (; left >= kGroup; left -= kGroup, packed += kGroupBytes) {
      int8x16_t in[kTaps];
      for (size_t t = 0; t < kTaps; ++t) {
        in[t] = vld1q_s8(rows[t]);
        rows[t] += kGroup;
      }
      vst1q_s8(out, ConvolveGroup(in, packed, range));
      out += kGroup;
    }
    if (left > 0) ConvolveLast(rows, left, packed, range, out);
    out += left + out_gap;
    in_ptrs = qz::Advance(in_ptrs, in_ptrs_step);
  }
}
