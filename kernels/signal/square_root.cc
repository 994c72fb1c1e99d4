// SPDX-License-Identifier: Apache-2.0
// Integer square root of 64-bit values through the double-precision instruction.

#include <cmath>

#include "kernels/precondition.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/variant.h"

namespace {

// Both halves convert exactly, so the sum is the only rounding.
inline double ToDouble(uint64_t v) {
  return static_cast<double>(static_cast<uint32_t>(v >> 32)) * 4294967296.0 +
         static_cast<double>(static_cast<uint32_t>(v));
}

inline uint32_t Truncated(double x) {
  return x < 4294967296.0 ? static_cast<uint32_t>(x) : UINT32_MAX;
}

// r is the root of v when r^2 - r < v <= r^2 + r. The truncated root t is at most one step away;
// the differences are taken modulo 2^64 and read as signed.
inline uint32_t NearestRoot(uint64_t v) {
  if (v == 0) return 0;
  const uint32_t t = Truncated(std::sqrt(ToDouble(v)));
  const uint64_t excess = uint64_t{t} * t - v;
  if (static_cast<int64_t>(excess + t) < 0) {
    // Roots of 32-bit values stay within 16 bits, and all within 32.
    return t == 65535 || t == UINT32_MAX ? t : t + 1;
  }
  return static_cast<int64_t>(excess - t) >= 0 ? t - 1 : t;
}

}  // namespace

QZ_KERNEL(orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1)
(size_t bytes, const uint64_t* input, uint32_t* output, uint32_t shift) {
  qz::Require(bytes > 0 && bytes % 8 == 0);
  for (size_t i = 0; i < bytes / sizeof(uint64_t); ++i) {
    const uint32_t root = NearestRoot(input[i]);
    output[i] = shift < 32 ? root >> shift : 0;
  }
}
