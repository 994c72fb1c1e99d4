// SPDX-License-Identifier: Apache-2.0
// A runtime that does next to nothing, so that its own instructions and stack hardly count: for
// programs that measure the module's components linked into them.
#pragma once

#include <cstdint>

namespace qz::bench {

// Sent so far: events to client nanoapps, messages to host endpoints. Each is freed at once.
struct Sent {
  uint32_t events = 0;
  uint32_t messages = 0;
};
extern Sent sent;

}  // namespace qz::bench
