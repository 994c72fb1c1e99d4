// SPDX-License-Identifier: Apache-2.0
#include "base/interrupt.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <unistd.h>

#include <cerrno>

namespace qz::base {
namespace {

volatile sig_atomic_t first_signal = 0;  // 0: none yet
// The handler writes a byte here, so that an interrupt just before poll() is not slept through.
int wake_pipe[2] = {-1, -1};

void OnInterrupt(int signal_number) {
  const int saved_errno = errno;
  if (first_signal == 0) first_signal = signal_number;
  [[maybe_unused]] const ssize_t written = write(wake_pipe[1], "", 1);
  errno = saved_errno;
}

}  // namespace

void CatchInterrupt() {
  if (pipe2(wake_pipe, O_CLOEXEC | O_NONBLOCK) != 0) return;
  struct sigaction action = {};
  action.sa_handler = OnInterrupt;
  action.sa_flags = SA_RESETHAND;
  sigaction(SIGINT, &action, nullptr);
  sigaction(SIGTERM, &action, nullptr);
  // If it was ignored at the start, the program is to outlive its terminal.
  struct sigaction before = {};
  sigaction(SIGHUP, nullptr, &before);
  if (before.sa_handler != SIG_IGN) sigaction(SIGHUP, &action, nullptr);
}

bool Interrupted() { return first_signal != 0; }

ExitCode ExitCodeAfterInterrupt(ExitCode result) {
  if (!Interrupted() || result == kFaultFound || result == kUnwritableOutput) return result;
  return static_cast<ExitCode>(128 + first_signal);
}

bool WaitReadable(int fd) {
  while (!Interrupted()) {
    pollfd wanted[] = {{fd, POLLIN, 0}, {wake_pipe[0], POLLIN, 0}};
    if (poll(wanted, 2, -1) > 0 && wanted[0].revents != 0) return true;
  }
  return false;
}

}  // namespace qz::base
