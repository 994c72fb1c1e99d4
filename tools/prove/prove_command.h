// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "base/exit_code.h"

namespace qz::tools {

struct ProveOptions {
  std::string file;                 // "-": standard input
  std::vector<std::string> builds;  // two build folders, or modules in them
  uint32_t host_clients = 1;
  uint32_t client_nanoapps = 1;  // with none the detector takes no audio
};

// Plays a file to the detector of both builds and compares what they do: their modules, as loaded,
// by all that they log and send and by what is in their memory after each buffer of audio; the
// same nanoapp linked into qz-trace by every frame and every operator too. Both nanoapps of a build
// must agree. Prints what was compared, or the first difference. Throws base::Error.
base::ExitCode ProveCommand(const ProveOptions& options);

}  // namespace qz::tools
