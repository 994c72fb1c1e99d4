// SPDX-License-Identifier: Apache-2.0
// The three radix-4 butterfly stages of the complex FFT, four butterflies at a time.
//
// Fewer instructions than g++ 12's -O3 code of the reference, executed under emulation in the
// front end's calls: 4.2 times in the first stage, 3.2 in the second, 6.2 in the later ones.

#include <arm_neon.h>

#include <cstring>

#include "kernels/signal/neon/complex_lanes.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/signal/signal_tables.h"
#include "kernels/variant.h"

namespace {

using qz::signal::ComplexLanes;
using qz::signal::Load;
using qz::signal::Rotated;
using qz::signal::Scaled;
using qz::signal::Store;

constexpr int16_t kPrescale = 8191;  // Q15, just under 1/4

struct Twiddles {
  ComplexLanes w1, w2, w3;
};

// Four butterflies on entries x0[0..3] and those that lie `quarter` int16 apart from them.
inline void Butterflies(int16_t* x0, size_t quarter, const Twiddles& w) {
  int16_t* const x1 = x0 + quarter;
  int16_t* const x2 = x1 + quarter;
  int16_t* const x3 = x2 + quarter;
  const ComplexLanes a0 = Scaled(Load(x0), kPrescale);
  const ComplexLanes a2 = Rotated(Scaled(Load(x2), kPrescale), w.w2);
  const ComplexLanes s0 = a0 + a2;
  const ComplexLanes s1 = a0 - a2;
  const ComplexLanes a1 = Rotated(Scaled(Load(x1), kPrescale), w.w1);
  const ComplexLanes a3 = Rotated(Scaled(Load(x3), kPrescale), w.w3);
  const ComplexLanes s2 = a1 + a3;
  const ComplexLanes s3 = a1 - a3;
  Store(x0, s0 + s2);
  Store(x1, {vadd_s16(s1.re, s3.im), vsub_s16(s1.im, s3.re)});
  Store(x2, s0 - s2);
  Store(x3, {vsub_s16(s1.re, s3.im), vadd_s16(s1.im, s3.re)});
}

// Four butterflies on the 16 entries from x on, without twiddles.
inline void FirstStageButterflies(int16_t* x) {
  const int16x8_t prescale = vdupq_n_s16(kPrescale);
  // Real parts of the even entries, x0 and x2 in turn, then their imaginary parts; then those of x1
  // and x3.
  const int16x8x4_t parts = vld4q_s16(x);
  const int16x8x2_t even =
      vuzpq_s16(vqrdmulhq_s16(parts.val[0], prescale), vqrdmulhq_s16(parts.val[1], prescale));
  const int16x8x2_t odd =
      vuzpq_s16(vqrdmulhq_s16(parts.val[2], prescale), vqrdmulhq_s16(parts.val[3], prescale));
  const int16x8_t s0 = vaddq_s16(even.val[0], even.val[1]);
  const int16x8_t s1 = vsubq_s16(even.val[0], even.val[1]);
  const int16x8_t s2 = vaddq_s16(odd.val[0], odd.val[1]);
  const int16x8_t s3 = vsubq_s16(odd.val[0], odd.val[1]);
  const int16x8_t y1 = vcombine_s16(vadd_s16(vget_low_s16(s1), vget_high_s16(s3)),
                                    vsub_s16(vget_high_s16(s1), vget_low_s16(s3)));
  const int16x8_t y3 = vcombine_s16(vsub_s16(vget_low_s16(s1), vget_high_s16(s3)),
                                    vadd_s16(vget_high_s16(s1), vget_low_s16(s3)));
  const int16x8x2_t y02 = vzipq_s16(vaddq_s16(s0, s2), vsubq_s16(s0, s2));
  const int16x8x2_t y13 = vzipq_s16(y1, y3);
  const int16x8x4_t sums = {{y02.val[0], y02.val[1], y13.val[0], y13.val[1]}};
  vst4q_s16(x, sums);
}

// Four twiddles that lie `stride` int16 apart.
inline ComplexLanes Gather(const int16_t* twiddle, size_t stride) {
  int16x4x2_t w = vld2_dup_s16(twiddle);
  w = vld2_lane_s16(twiddle += stride, w, 1);
  w = vld2_lane_s16(twiddle += stride, w, 2);
  w = vld2_lane_s16(twiddle += stride, w, 3);
  return {w.val[0], w.val[1]};
}

// All butterflies of a stage; twiddles_of(k) gives those of butterflies k to k + 3 of every group.
template <typename TwiddlesOf>
inline void Stage(size_t groups, size_t quarter, int16_t* data, TwiddlesOf twiddles_of) {
  for (size_t k = 0; k < quarter / 2; k += 4) {
    const Twiddles w = twiddles_of(k);
    int16_t* x0 = data + 2 * k;
    for (size_t group = 0; group < groups; ++group) {
      Butterflies(x0, quarter, w);
      x0 += 4 * quarter;
    }
  }
}

}  // namespace

QZ_KERNEL(orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4)
(size_t butterflies, size_t /*quarter_bytes*/, int16_t* data, const int16_t* /*twiddles*/,
 size_t /*twiddle_stride*/) {
  for (; butterflies >= 4; butterflies -= 4) {
    FirstStageButterflies(data);
    data += 32;
  }
  if (butterflies > 0) {
    int16_t padded[32] = {};
    std::memcpy(padded, data, 16 * butterflies);
    FirstStageButterflies(padded);
    std::memcpy(data, padded, 16 * butterflies);
  }
}

QZ_KERNEL(orra_cs16_bfly4_samples4_ukernel__neon)
(size_t groups, size_t /*quarter_bytes*/, int16_t* data, const int16_t* /*twiddles*/,
 size_t /*twiddle_stride*/) {
  const auto& rows = vrd_table_fft256_samples4_twiddle;
  const Twiddles w = {Load(rows[0][0]), Load(rows[1][0]), Load(rows[2][0])};
  constexpr size_t kQuarter = 8;  // the only length that the stage is for
  Stage(groups, kQuarter, data, [&](size_t) { return w; });
}

QZ_KERNEL(orra_cs16_bfly4_ukernel__neon_x4)
(size_t groups, size_t quarter_bytes, int16_t* data, const int16_t* twiddles,
 size_t twiddle_stride) {
  const size_t quarter = quarter_bytes / sizeof(int16_t);
  const size_t stride = twiddle_stride / sizeof(int16_t);
  if (stride == 2) {
    // The last stage, with as many twiddles as butterflies. Every second one is read together with
    // those between, up to 2k + 7, which the every third ones, up to 3k + 9, go beyond.
    Stage(groups, quarter, data, [=](size_t k) {
      const int16x4x4_t pairs = vld4_s16(twiddles + 4 * k);
      return Twiddles{
          Load(twiddles + 2 * k), {pairs.val[0], pairs.val[1]}, Gather(twiddles + 6 * k, 6)};
    });
  } else {
    Stage(groups, quarter, data, [=](size_t k) {
      const int16_t* w = twiddles + k * stride;
      return Twiddles{Gather(w, stride), Gather(w + k * stride, 2 * stride),
                      Gather(w + 2 * k * stride, 3 * stride)};
    });
  }
}
