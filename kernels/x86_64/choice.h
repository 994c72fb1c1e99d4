// SPDX-License-Identifier: Apache-2.0
// The choice among implementations, made at the first call of any kernel of a component.
#pragma once

#include <atomic>
#include <cstddef>

#include "kernels/x86_64/processor.h"

namespace qz {

// Kernels: a struct of function pointers. All is constant but a number that starts at 0, so that no
// code runs at load time. Threads that make the choice at the same time store the same.
template <typename Kernels>
struct Choice {
  // Functions that call Choose() first; then by instruction set, in the order of InstructionSet.
  const Kernels* const tables[4];
  std::atomic<size_t>& chosen;

  const Kernels& Get() const { return *tables[chosen.load(std::memory_order_relaxed)]; }

  const Kernels& Choose() const {
    chosen.store(1 + static_cast<size_t>(BestInstructionSet()), std::memory_order_relaxed);
    return Get();
  }
};

// Call() is what a kernel points to until the choice is made: a call then costs no test of whether
// it is.
template <const auto& choice, auto kernel>
struct FirstCall;
template <const auto& choice, typename Kernels, typename... Arguments,
          void (*Kernels::*kernel)(Arguments...)>
struct FirstCall<choice, kernel> {
  static void Call(Arguments... arguments) { (choice.Choose().*kernel)(arguments...); }
};

}  // namespace qz
