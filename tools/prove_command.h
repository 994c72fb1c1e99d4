#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "exit_code.h"

namespace qz::tools {

struct ProveOptions {
  std::string file;                 // "-": standard input
  std::vector<std::string> builds;  // two build folders
  uint32_t host_clients = 1;
  uint32_t client_nanoapps = 1;
};

// Plays a file to the detector of both builds and compares all that they say and compute. Prints
// what was compared, or the first difference; says what went wrong itself.
ExitCode ProveCommand(const ProveOptions& options);

}  // namespace qz::tools
