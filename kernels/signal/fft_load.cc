// SPDX-License-Identifier: Apache-2.0
// The complex FFT's input in the order in which its first stage takes it.

#include <cstring>

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

namespace {

constexpr size_t kParts = 2;  // int16 of a complex value

inline void Copy(const int16_t* from, int16_t* to) {
  std::memcpy(to, from, kParts * sizeof(int16_t));
}

}  // namespace

// r = 64 d + 16 c + 4 b + a: of one entry to the next d changes first. Only with d = 3 can r be
// past the input.
QZ_KERNEL(orra_cs16_digitreverse_ukernel__neon_x16)
(size_t count, const int16_t* input, int16_t* output) {
  qz::Require(count >= 192 && count <= 256 && count % 4 == 0);
  constexpr int16_t kZero[kParts] = {};
  for (size_t a = 0; a < 4; ++a) {
    for (size_t b = 0; b < 4; ++b) {
      for (size_t c = 0; c < 4; ++c) {
        const size_t r = 16 * c + 4 * b + a;
        const int16_t* from = input + kParts * r;
        Copy(from, output);
        Copy(from + kParts * 64, output + kParts);
        Copy(from + kParts * 128, output + kParts * 2);
        Copy(192 + r < count ? from + kParts * 192 : kZero, output + kParts * 3);
        output += kParts * 4;
      }
    }
  }
}
