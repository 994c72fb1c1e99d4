// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

#include "base/exit_code.h"

namespace qz::train {

struct TrainOptions {
  std::string manifest;
  std::string output;  // the packed model
  std::string labels_file;
  std::string recipe_file;  // empty: the recipe built in
  std::string state_file;   // empty: none, a stopped run is lost
  uint64_t seed = 1;
  int hold_out = 0;  // fold that is not trained but validated on; 0: none
  int patience = 0;  // epochs without a better metric that end a teacher's training; 0: never
  int threads = 2;
};

// Trains on a list of recordings and writes a packed model. Prints its own warnings; throws
// base::Error.
base::ExitCode TrainCommand(const TrainOptions& options);

}  // namespace qz::train
