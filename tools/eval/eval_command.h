// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "base/exit_code.h"

namespace qz::tools {

struct EvalOptions {
  struct Part {
    int fold = 0;  // whose clips the model scores; 0: those of all folds from 1 on
    std::string model;
  };
  std::string manifest;
  std::string labels;
  std::vector<Part> parts;  // in order of their folds; one, or one a fold
  std::string scores_out;   // empty: none
  bool json = false;
};

// Scores the clips of a manifest, each from a fresh start, and prints the metrics of each part and
// their means over the parts. Clips that can't be read are named, left out and counted, and make
// the exit code kUnreadableInput. Throws base::InputError and base::OutputError.
base::ExitCode EvalCommand(const EvalOptions& options);

}  // namespace qz::tools
