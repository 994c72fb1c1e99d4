// SPDX-License-Identifier: Apache-2.0
// Ctrl-C, a request to terminate and the loss of the terminal, as requests to end: the first of
// each asks, a second one kills.
#pragma once

#include "base/exit_code.h"

namespace qz::base {

void CatchInterrupt();
bool Interrupted();

// The exit code of a command after an interrupt: that of the first signal. `result` when there was
// none, or when the command found a fault or could not write its output.
ExitCode ExitCodeAfterInterrupt(ExitCode result);

// Waits until `fd` can be read or the interrupt comes; true in the first case.
bool WaitReadable(int fd);

}  // namespace qz::base
