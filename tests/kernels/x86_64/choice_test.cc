// SPDX-License-Identifier: Apache-2.0
// Which implementations are chosen, compared with what the compiler's own library detects of the
// processor.

#include "kernels/x86_64/choice.h"

#include <gtest/gtest.h>

namespace qz {
namespace {

InstructionSet ByTheCompiler() {
  if (!__builtin_cpu_supports("avx2")) return InstructionSet::kBaseline;
  const bool vnni = __builtin_cpu_supports("avx512vnni") && __builtin_cpu_supports("avx512vl") &&
                    __builtin_cpu_supports("avx512bw");
  return vnni ? InstructionSet::kAvx512Vnni : InstructionSet::kAvx2;
}

struct Kernels {
  void (*kernel)(InstructionSet*);
};
template <InstructionSet set>
void Kernel(InstructionSet* called) {
  *called = set;
}
constexpr Kernels kSets[] = {{Kernel<InstructionSet::kBaseline>},
                             {Kernel<InstructionSet::kAvx2>},
                             {Kernel<InstructionSet::kAvx512Vnni>}};

extern const Choice<Kernels> choice;
constexpr Kernels kFirstCalls = {FirstCall<choice, &Kernels::kernel>::Call};
std::atomic<size_t> chosen;
constexpr Choice<Kernels> choice = {{&kFirstCalls, &kSets[0], &kSets[1], &kSets[2]}, chosen};

TEST(Choice, IsThatOfTheProcessorFromTheFirstCallOn) {
  for (int call = 0; call < 2; ++call) {
    auto called = static_cast<InstructionSet>(-1);
    choice.Get().kernel(&called);
    EXPECT_EQ(called, ByTheCompiler());
    EXPECT_NE(&choice.Get(), &kFirstCalls);
  }
}

}  // namespace
}  // namespace qz
