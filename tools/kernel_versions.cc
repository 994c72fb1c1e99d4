#include "tools/kernel_versions.h"

#ifdef QZ_KERNELS_X86_64
#include "kernels/x86_64/choices.h"
#include "kernels/x86_64/processor.h"
#endif

namespace qz::tools {

#ifdef QZ_KERNELS_X86_64

namespace {

const char* Running(ChoiceRow row, InstructionSet best) {
  if (best == InstructionSet::kBaseline) return "plain      ";
  if (row == avx2_plain) return "plain, avx2";
  return row == avx512vnni && best == InstructionSet::kAvx512Vnni ? "avx512vnni " : "avx2       ";
}

}  // namespace

std::string KernelVersions() {
  const InstructionSet best = BestInstructionSet();
  std::string text =
      "kernels on this processor (\"plain, avx2\" is the plain text, compiled for AVX2):";
  for (const Choice& choice : kChoices) {
    text += std::string("\n  ") + Running(choice.row, best) + "  " + choice.kernel;
  }
  return text;
}

#else

std::string KernelVersions() {
  const std::string texts = QZ_VECTOR_TEXTS;
  return texts.empty() ? "kernels: plain texts" : "kernels: plain texts, but for " + texts;
}

#endif

}  // namespace qz::tools
