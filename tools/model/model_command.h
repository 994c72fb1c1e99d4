// The subcommands of qz model. All say what went wrong themselves: kUnreadableInput for a file that
// can't be read, kFaultFound for a model that is not sound and for a file that can't be written,
// which then stays as it was.
#pragma once

#include <string>

#include "base/exit_code.h"

namespace qz::tools {

// Prints table by table whether a packed model is sound, or else what is wrong and where.
base::ExitCode ModelCheckCommand(const std::string& file);

// Prints what is in the tables of a sound packed model, and, unless `clip` is empty, what the
// network's tensors hold while it hears that sound file and the silence behind it.
base::ExitCode ModelInfoCommand(const std::string& file, const std::string& clip);

// Packs the arrays of an .npz file.
base::ExitCode ModelImportCommand(const std::string& arrays, const std::string& output);

// The inverse.
base::ExitCode ModelExportCommand(const std::string& file, const std::string& output);

}  // namespace qz::tools
