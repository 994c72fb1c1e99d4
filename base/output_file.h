// SPDX-License-Identifier: Apache-2.0
// The one way in which programs write their output files.
//
// A regular or new file is written whole or not at all: into a temporary file of a unique name
// beside it, which is flushed to the disk and takes its name. The mode and owner of a file that is
// replaced are kept; where the path is a symbolic link, the file that it names is replaced. Devices
// and pipes are written straight through. Everything else is refused, and so is an output that is
// an input too. Errors leave a regular file as it was.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace qz::base {

// Whether both paths name one file, which need not exist. "-" is standard input.
bool IsSameFile(const std::string& path, const std::string& other);

// Throws OutputError if `path` can't be written, or is one of `inputs`; for a check before long
// work. Writes nothing.
void CheckOutputFile(const std::string& path, const std::vector<std::string>& inputs = {});

// Throws OutputError: "PATH: can't be written: Reason".
void WriteOutputFile(const std::string& path, std::string_view bytes);

// Makes a folder, and those above it, where they are missing. Throws OutputError.
void MakeOutputFolder(const std::string& path);

}  // namespace qz::base
