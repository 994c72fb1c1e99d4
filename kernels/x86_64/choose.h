// QZ_CHOOSE(kernel, row) gives a kernel its name: the loader calls a function that picks the text
// for this processor, and binds the name to what it returns. A call costs no more than one to
// another file, and nothing has to be remembered.
#pragma once

#include "kernels/x86_64/processor.h"

namespace qz {

template <typename Kernel>
static inline Kernel* Choose(Kernel* plain, Kernel* avx2, Kernel* avx512vnni) {
  switch (BestInstructionSet()) {
    case InstructionSet::kAvx512Vnni:
      return avx512vnni;
    case InstructionSet::kAvx2:
      return avx2;
    case InstructionSet::kBaseline:
      break;
  }
  return plain;
}

}  // namespace qz

// Hidden, so that addresses need nothing of the loader, which is not done yet.
// NOLINTBEGIN(bugprone-macro-parentheses): what is declared stands in none.
#define QZ_CHOICE(kernel, best)                                           \
  extern "C" {                                                            \
  __attribute__((visibility("hidden"))) decltype(kernel) kernel##__plain; \
  __attribute__((visibility("hidden"))) decltype(kernel) kernel##__avx2;  \
  __attribute__((visibility("hidden"))) decltype(kernel) best;            \
  decltype(kernel)* kernel##__choice() {                                  \
    return qz::Choose(kernel##__plain, kernel##__avx2, best);             \
  }                                                                       \
  decltype(kernel) kernel __attribute__((ifunc(#kernel "__choice")));     \
  }
// NOLINTEND(bugprone-macro-parentheses)

#define QZ_CHOOSE_avx2(kernel) QZ_CHOICE(kernel, kernel##__avx2)
#define QZ_CHOOSE_avx2_plain(kernel) QZ_CHOICE(kernel, kernel##__avx2)
#define QZ_CHOOSE_avx512vnni(kernel) QZ_CHOICE(kernel, kernel##__avx512vnni)
#define QZ_CHOOSE(kernel, row) QZ_CHOOSE_##row(kernel)
