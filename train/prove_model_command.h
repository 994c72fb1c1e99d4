// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "base/exit_code.h"

namespace qz::train {

// Compares the trainer's integer network with the module's, on every clip of a list. Prints what it
// compared, the difference and the recordings that it skipped.
base::ExitCode ProveModelCommand(const std::string& model_file, const std::string& manifest);

}  // namespace qz::train
