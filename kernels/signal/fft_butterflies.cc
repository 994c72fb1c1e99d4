// SPDX-License-Identifier: Apache-2.0
// The three radix-4 butterfly stages of the complex FFT: they differ in where the entries and the
// twiddles of a butterfly lie.

#include "kernels/precondition.h"
#include "kernels/signal/signal_arithmetic.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/signal/signal_tables.h"
#include "kernels/variant.h"

namespace {

using qz::signal::Complex;
using qz::signal::Rotated;
using qz::signal::Scaled;
using qz::signal::StoreWrapped;

constexpr int32_t kPrescale = 8191;  // Q15, just under 1/4

// Entries x0 to x3 lie `quarter` int16 apart. Sums are wrapped only as they are stored: additions
// modulo 2^16 give the same low bits wherever they are cut.
inline void StoreSums(int16_t* x0, size_t quarter, Complex a0, Complex a1, Complex a2, Complex a3) {
  const Complex s0 = {a0.re + a2.re, a0.im + a2.im};
  const Complex s1 = {a0.re - a2.re, a0.im - a2.im};
  const Complex s2 = {a1.re + a3.re, a1.im + a3.im};
  const Complex s3 = {a1.re - a3.re, a1.im - a3.im};
  StoreWrapped(x0, s0.re + s2.re, s0.im + s2.im);
  StoreWrapped(x0 + quarter, s1.re + s3.im, s1.im - s3.re);
  StoreWrapped(x0 + 2 * quarter, s0.re - s2.re, s0.im - s2.im);
  StoreWrapped(x0 + 3 * quarter, s1.re - s3.im, s1.im + s3.re);
}

inline void Butterfly(int16_t* x0, size_t quarter, const int16_t* w1, const int16_t* w2,
                      const int16_t* w3) {
  const Complex a0 = Scaled(x0, kPrescale);
  const Complex a1 = Rotated(Scaled(x0 + quarter, kPrescale), w1);
  const Complex a2 = Rotated(Scaled(x0 + 2 * quarter, kPrescale), w2);
  const Complex a3 = Rotated(Scaled(x0 + 3 * quarter, kPrescale), w3);
  StoreSums(x0, quarter, a0, a1, a2, a3);
}

}  // namespace

QZ_KERNEL(orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4)
(size_t butterflies, size_t /*quarter_bytes*/, int16_t* data, const int16_t* /*twiddles*/,
 size_t /*twiddle_stride*/) {
  qz::Require(butterflies > 0);
  for (size_t b = 0; b < butterflies; ++b) {
    int16_t* x = data + 8 * b;
    StoreSums(x, 2, Scaled(x, kPrescale), Scaled(x + 2, kPrescale), Scaled(x + 4, kPrescale),
              Scaled(x + 6, kPrescale));
  }
}

QZ_KERNEL(orra_cs16_bfly4_samples4_ukernel__neon)
(size_t groups, size_t quarter_bytes, int16_t* data, const int16_t* /*twiddles*/,
 size_t /*twiddle_stride*/) {
  qz::Require(groups > 0 && quarter_bytes == 16);
  const auto& twiddles = vrd_table_fft256_samples4_twiddle;
  const size_t quarter = quarter_bytes / sizeof(int16_t);
  for (size_t group = 0; group < groups; ++group) {
    for (size_t k = 0; k < 4; ++k) {
      Butterfly(data + 2 * k, quarter, twiddles[0][k], twiddles[1][k], twiddles[2][k]);
    }
    data += 4 * quarter;
  }
}

QZ_KERNEL(orra_cs16_bfly4_ukernel__neon_x4)
(size_t groups, size_t quarter_bytes, int16_t* data, const int16_t* twiddles,
 size_t twiddle_stride) {
  qz::Require(groups > 0 && quarter_bytes > 0 && quarter_bytes % 16 == 0 &&
              twiddle_stride % 4 == 0);
  const size_t quarter = quarter_bytes / sizeof(int16_t);
  const size_t stride = twiddle_stride / sizeof(int16_t);
  for (size_t group = 0; group < groups; ++group) {
    for (size_t k = 0; k < quarter / 2; ++k) {
      const int16_t* w = twiddles;
      Butterfly(data + 2 * k, quarter, w + k * stride, w + 2 * k * stride, w + 3 * k * stride);
    }
    data += 4 * quarter;
  }
}
