// Ctrl-C as a request to end: the first one asks, a second one kills.
#pragma once

namespace qz::tools {

void CatchInterrupt();
bool Interrupted();

// Waits until `fd` can be read or the interrupt comes; true in the first case.
bool WaitReadable(int fd);

}  // namespace qz::tools
