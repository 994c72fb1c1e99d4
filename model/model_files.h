// SPDX-License-Identifier: Apache-2.0
// Packed models on disk and as a C++ header.
#pragma once

#include <string>

#include "base/input_file.h"
#include "model/weight_layout.h"

namespace qz::model {

// A file of any content, which may be a packed model, up to 1 MiB. Throws base::InputError.
inline PackedModel ReadModelFile(const std::string& path) {
  return base::ReadWholeFile(path, 1 << 20);
}

// A valid packed model. Throws base::InputError: why it can't be read, or the first finding and how
// many more there are.
PackedModel ReadValidModel(const std::string& path);

// A header that defines every table under its name, 16-byte aligned, at global scope with internal
// linkage, and a list of them, embedded_tables. The model is valid.
std::string TablesHeader(const PackedModel& model);

}  // namespace qz::model
