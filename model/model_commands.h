// SPDX-License-Identifier: Apache-2.0
// The subcommands of qz-model-tool.
#pragma once

#include <string>
#include <vector>

#include "base/exit_code.h"

namespace qz::model {

// Runs the subcommand words[0] with its arguments. Prints errors of usage and findings about a
// model itself; throws base::InputError and base::OutputError.
//   synthetic --seed N -o FILE  writes the synthetic model of a seed
//   check FILE                  checks a packed model
//   labels FILE                 reads the labels of a model's outputs
//   embed FILE -o HEADER        checks a packed model and writes it as a C++ header
//   describe -o FILE            writes the detector's description as JSON
base::ExitCode RunModelCommand(const std::vector<std::string>& words);

}  // namespace qz::model
