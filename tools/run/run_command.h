// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "audio/pcm_format.h"
#include "base/exit_code.h"
#include "chre.h"
#include "tools/run/report_format.h"

namespace qz::tools {

struct RunOptions {
  std::string file;                     // "-": standard input
  std::optional<audio::PcmFormat> raw;  // of headerless samples; none: the file has a header
  uint32_t host_clients = 1;
  uint32_t client_nanoapps = 1;
  chreLogLevel log_level = CHRE_LOG_WARN;
  const NamedFormat* format = nullptr;  // null: text for people
  bool real_time = false;
  std::string module_path;
  bool scores = false;          // all five, computed beside the module
  std::string thresholds_path;  // a table of detection rules; empty: none
  std::string model_path;       // of these two: the module's own model
  std::string labels_path;      // names of the outputs; empty: none, and neither of the two
};

// Plays a file to the nanoapp and prints what its clients receive. Prints its own errors.
base::ExitCode RunCommand(const RunOptions& options);

}  // namespace qz::tools
