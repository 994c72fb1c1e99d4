// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdio>
#include <cstdlib>

// A precondition of a hub's function, checked in every build: a caller that breaks it ends the
// program with a line that names the condition and where it is.
#define QZ_HUB_REQUIRE(condition)                                                      \
  do {                                                                                 \
    if (!(condition)) ::qz::hub::PreconditionViolated(#condition, __FILE__, __LINE__); \
  } while (false)

namespace qz::hub {

[[noreturn]] inline void PreconditionViolated(const char* condition, const char* file, int line) {
  std::fprintf(stderr, "%s:%d: precondition violated: %s\n", file, line, condition);
  std::abort();
}

}  // namespace qz::hub
