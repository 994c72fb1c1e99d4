// SPDX-License-Identifier: Apache-2.0
#include "tools/kernel_versions.h"

#include "kernels/kernel_table.h"
#ifdef QZ_KERNELS_X86_64
#include "kernels/x86_64/processor.h"
#endif

namespace qz::tools {
namespace {

// As in the table of kernels.
std::string Implementation([[maybe_unused]] const KernelRow& row) {
#ifdef QZ_KERNELS_X86_64
  switch (BestInstructionSet()) {
    case InstructionSet::kAvx512Vnni:
      return row.avx512vnni;
    case InstructionSet::kAvx2:
      return row.avx2;
    case InstructionSet::kBaseline:
      break;
  }
#else
  const std::string kernels = QZ_KERNELS;
  if (kernels == "neon") return row.neon;
#endif
  return "reference";
}

std::string ForPeople(const std::string& implementation) {
  if (implementation == "reference_avx2") return "C++ compiled for AVX2";
  if (implementation == "avx2") return "AVX2";
  if (implementation == "avx512vnni") return "AVX512-VNNI";
  if (implementation == "neon") return "NEON";
  return "C++";
}

}  // namespace

std::string KernelVersions(bool verbose) {
  std::string lines = "kernels on this processor:";
  for (const KernelRow& row : kKernelTable) {
    const std::string implementation = Implementation(row);
    lines += std::string("\n  ") + row.title + ": " + ForPeople(implementation);
    if (verbose) lines += std::string("\n    ") + row.kernel + ", " + implementation;
  }
  return lines;
}

}  // namespace qz::tools
