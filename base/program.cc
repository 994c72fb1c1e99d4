// SPDX-License-Identifier: Apache-2.0
#include "base/program.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <exception>

#include "base/error.h"
#include "base/interrupt.h"

namespace qz::base {
namespace {

// A standard stream that is closed stays an error: nothing opened later may take its number.
void OccupyStandardStreams() {
  for (int fd = 0; fd <= 2; ++fd) {
    if (fcntl(fd, F_GETFD) == -1) open("/dev/null", fd == 0 ? O_WRONLY : O_RDONLY);
  }
}

bool ReaderLeft(int fd) {
  pollfd output = {fd, POLLOUT, 0};
  return poll(&output, 1, 0) > 0 && (output.revents & POLLERR) != 0;
}

// One line when something printed to standard output was lost, else empty.
std::string StandardOutputFault() {
  const bool failed_before = std::ferror(stdout) != 0;
  const bool flushed = std::fflush(stdout) == 0;
  const int error = errno;
  if ((!failed_before && flushed) || ReaderLeft(STDOUT_FILENO)) return {};
  return std::string("standard output: can't be written") +
         (flushed ? "" : std::string(": ") + std::strerror(error));
}

}  // namespace

int RunProgram(const char* program, const std::function<ExitCode()>& command) {
  OccupyStandardStreams();
  signal(SIGPIPE, SIG_IGN);
  signal(SIGXFSZ, SIG_IGN);
  ExitCode result = kSuccess;
  try {
    result = command();
  } catch (const std::exception& error) {
    std::fprintf(stderr, "%s: %s\n", program, error.what());
    result = ExitCodeOf(error);
  }
  const std::string fault = StandardOutputFault();
  if (!fault.empty() && result != kUnwritableOutput) {
    std::fprintf(stderr, "%s: %s\n", program, fault.c_str());
    result = kUnwritableOutput;
  }
  return ExitCodeAfterInterrupt(result);
}

std::string VersionLine(const std::string& program) {
  return program + " " QZ_VERSION " (build " QZ_BUILD_NUMBER ")";
}

}  // namespace qz::base
