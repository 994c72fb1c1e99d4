// Ctrl-C, a request to terminate and the loss of the terminal, as requests to end: the first of
// each asks, a second one kills.
#pragma once

namespace qz::base {

void CatchInterrupt();
bool Interrupted();

// Waits until `fd` can be read or the interrupt comes; true in the first case.
bool WaitReadable(int fd);

}  // namespace qz::base
