// SPDX-License-Identifier: Apache-2.0
// The subcommands of qz model. All return kFaultFound for a model that is not valid, whose findings
// they print, and throw base::InputError and base::OutputError.
#pragma once

#include <string>

#include "base/exit_code.h"

namespace qz::tools {

// Prints table by table whether a packed model is valid, or else what is wrong and where.
base::ExitCode ModelCheckCommand(const std::string& file);

// Prints what is in the tables of a valid packed model, and, unless `clip` is empty, the values of
// the network's tensors over that sound file and the silence behind it.
base::ExitCode ModelInfoCommand(const std::string& file, const std::string& clip);

// Packs the arrays of an .npz file.
base::ExitCode ModelImportCommand(const std::string& arrays, const std::string& output);

// The inverse.
base::ExitCode ModelExportCommand(const std::string& file, const std::string& output);

}  // namespace qz::tools
