// SPDX-License-Identifier: Apache-2.0
// What the PC's processor can do, of what kernels have implementations for.
#pragma once

namespace qz {

enum class InstructionSet {
  kBaseline,    // what every x86-64 processor has: SSE2
  kAvx2,        // 256-bit integers
  kAvx512Vnni,  // kAvx2, and sums of byte products on 256-bit vectors (AVX512-VNNI, AVX512VL)
};

// The largest that both the processor and the operating system offer. In a library of its own, so
// that a program can force a smaller one.
InstructionSet BestInstructionSet();

}  // namespace qz
