// What the loader binds each kernel's name to, by what the compiler's own library says of the
// processor.

#include <gtest/gtest.h>

#include "kernels/quantised/quantised_kernels.h"
#include "kernels/signal/signal_kernels.h"
#include "kernels/x86_64/choices.h"
#include "kernels/x86_64/processor.h"

#define QZ_DECLARE(kernel, row)                                \
  extern "C" decltype(kernel) kernel##__plain, kernel##__avx2; \
  extern "C" decltype(kernel)* kernel##__choice();
QZ_SIGNAL_CHOICES(QZ_DECLARE)
QZ_QUANTISED_CHOICES(QZ_DECLARE)

#define QZ_DECLARE_avx2(kernel)
#define QZ_DECLARE_avx2_plain(kernel)
#define QZ_DECLARE_avx512vnni(kernel) extern "C" decltype(kernel) kernel##__avx512vnni;
#define QZ_DECLARE_BEST(kernel, row) QZ_DECLARE_##row(kernel)
QZ_QUANTISED_CHOICES(QZ_DECLARE_BEST)

namespace qz {
namespace {

InstructionSet ByTheCompiler() {
  if (!__builtin_cpu_supports("avx2")) return InstructionSet::kBaseline;
  const bool vnni = __builtin_cpu_supports("avx512vnni") && __builtin_cpu_supports("avx512vl") &&
                    __builtin_cpu_supports("avx512bw");
  return vnni ? InstructionSet::kAvx512Vnni : InstructionSet::kAvx2;
}

TEST(Choice, TheProcessorIsKnown) { EXPECT_EQ(BestInstructionSet(), ByTheCompiler()); }

#define QZ_BEST_avx2(kernel) kernel##__avx2
#define QZ_BEST_avx2_plain(kernel) kernel##__avx2
#define QZ_BEST_avx512vnni(kernel) kernel##__avx512vnni
// By instruction set.
#define QZ_EXPECT(kernel, row)                                                                  \
  {                                                                                             \
    decltype(kernel)* const texts[] = {kernel##__plain, kernel##__avx2, QZ_BEST_##row(kernel)}; \
    EXPECT_EQ(kernel##__choice(), texts[static_cast<size_t>(best)]) << #kernel;                 \
  }

TEST(Choice, EveryKernelRunsTheTextOfItsRow) {
  const InstructionSet best = ByTheCompiler();
  QZ_SIGNAL_CHOICES(QZ_EXPECT)
  QZ_QUANTISED_CHOICES(QZ_EXPECT)
}

}  // namespace
}  // namespace qz
