// SPDX-License-Identifier: Apache-2.0
// Preconditions of kernels, checked in every build but the device's. A failure ends the program
// without a call, so that the module needs no import for it.
#pragma once

namespace qz {

// Internal linkage: what is compiled for AVX2 must not be linked to others.
static inline void Require([[maybe_unused]] bool holds) {
#ifndef QZ_WITHOUT_CHECKS
  if (__builtin_expect(!holds, 0)) __builtin_trap();
#endif
}

}  // namespace qz
