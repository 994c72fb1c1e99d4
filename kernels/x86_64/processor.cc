// SPDX-License-Identifier: Apache-2.0
#include "kernels/x86_64/processor.h"

#include <cpuid.h>

#include <cstdint>

namespace qz {
namespace {

constexpr uint32_t Bit(int number) { return uint32_t{1} << number; }

// Registers whose contents the operating system keeps from one thread to another: XCR0.
uint32_t KeptRegisters() {
  uint32_t low;
  uint32_t high;
  __asm__("xgetbv" : "=a"(low), "=d"(high) : "c"(0));
  return low;
}

}  // namespace

// Bits of leaves 1 and 7 and of XCR0 by the processor makers' manuals.
InstructionSet BestInstructionSet() {
  constexpr uint32_t kXsaveInUse = Bit(27), kAvx = Bit(28);                            // 1, ecx
  constexpr uint32_t kAvx2 = Bit(5), kAvx512Foundation = Bit(16);                      // 7, ebx
  constexpr uint32_t kAvx512Bytes = Bit(30), kAvx512Length = Bit(31);                  // 7, ebx
  constexpr uint32_t kVnni = Bit(11);                                                  // 7, ecx
  constexpr uint32_t kYmmKept = Bit(1) | Bit(2), kZmmKept = Bit(5) | Bit(6) | Bit(7);  // XCR0

  uint32_t eax, ebx, ecx, edx;
  const auto has = [](uint32_t word, uint32_t bits) { return (word & bits) == bits; };
  if (!__get_cpuid(1, &eax, &ebx, &ecx, &edx) || !has(ecx, kXsaveInUse | kAvx)) {
    return InstructionSet::kBaseline;
  }
  const uint32_t kept = KeptRegisters();
  if (!has(kept, kYmmKept) || !__get_cpuid_count(7, 0, &eax, &ebx, &ecx, &edx) ||
      !has(ebx, kAvx2)) {
    return InstructionSet::kBaseline;
  }
  const bool vnni = has(kept, kZmmKept) && has(ecx, kVnni) &&
                    has(ebx, kAvx512Foundation | kAvx512Bytes | kAvx512Length);
  return vnni ? InstructionSet::kAvx512Vnni : InstructionSet::kAvx2;
}

}  // namespace qz
