// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "base/exit_code.h"

namespace qz::tools {

struct FeaturesOptions {
  std::vector<std::string> files;  // sound files; or none, and those of
  std::string manifest;            // a list of recordings
  std::string output;  // a folder, made if it is missing; for one file also a name with .npy
};

// Runs the module's own front end over each sound from a fresh start and writes its features,
// uint16 [frames][48], as NumPy arrays: FOLDER/NAME.npy; of a manifest FOLDER/CLASS/NAME.npy, and
// the list of them with their classes and folds, in the form of a manifest, FOLDER/features.tsv.
// Where a name is taken by an earlier sound, a number follows it: NAME-2.npy. Sounds that can't be
// read are named, left out and counted, and make the exit code kUnreadableInput. Throws
// base::InputError and base::OutputError.
base::ExitCode FeaturesCommand(const FeaturesOptions& options);

}  // namespace qz::tools
