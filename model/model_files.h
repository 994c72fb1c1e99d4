// Packed models on disk and as a C++ header.
#pragma once

#include <string>

#include "weight_layout.h"

namespace qz::model {

// A whole file, whatever its size. Throws std::runtime_error naming the file and the cause.
PackedModel ReadModelFile(const std::string& path);

// Writes all of `bytes` or nothing: into a temporary file beside `path` that then takes its name.
// Throws std::runtime_error naming the file and the cause.
void WriteWholeFile(const std::string& path, const std::string& bytes);

// A header that defines every table under its name, 16-byte aligned, at global scope with internal
// linkage. The model has passed the checker.
std::string TablesHeader(const PackedModel& model);

}  // namespace qz::model
