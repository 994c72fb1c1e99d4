// SPDX-License-Identifier: Apache-2.0
// From the complex FFT of sample pairs to the spectrum of the real samples.

#include "kernels/precondition.h"
#include "kernels/signal/signal_arithmetic.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

using qz::signal::Complex;
using qz::signal::Rotated;
using qz::signal::Scaled;
using qz::signal::StoreWrapped;

QZ_KERNEL(orra_cs16_fftr_ukernel__asm_aarch32_neon_x4)
(size_t count, int16_t* data, const int16_t* twiddles) {
  qz::Require(count > 0 && count % 8 == 0);
  constexpr int32_t kHalf = 16383;  // Q15, just under 1/2

  const Complex first = Scaled(data, kHalf);
  StoreWrapped(data, first.re + first.im, 0);
  StoreWrapped(data + 2 * count, first.re - first.im, 0);

  // Bins k and N - k need each other's entries and replace them. At k = N/2 they are one entry,
  // which the second store leaves as the right one.
  for (size_t k = 1; k <= count / 2; ++k) {
    int16_t* front = data + 2 * k;
    int16_t* back = data + 2 * (count - k);
    const Complex f = Scaled(front, kHalf);
    const Complex b = Scaled(back, kHalf);
    const Complex even = {f.re + b.re, f.im - b.im};
    const Complex odd = Rotated({f.re - b.re, f.im + b.im}, twiddles + 2 * (k - 1));
    StoreWrapped(front, (even.re + odd.re) >> 1, (even.im + odd.im) >> 1);
    StoreWrapped(back, (even.re - odd.re) >> 1, (odd.im - even.im) >> 1);
  }
}
