// Packed models on disk and as a C++ header.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "model/weight_layout.h"

namespace qz::model {

// A whole file, whatever is in it. Throws std::runtime_error naming the file and the cause, also
// where it has more than `most` bytes.
std::vector<uint8_t> ReadWholeFile(const std::string& path, size_t most);

// What may be a packed model: of any content, and of any size that is not absurd.
inline PackedModel ReadModelFile(const std::string& path) { return ReadWholeFile(path, 1 << 20); }

// A packed model that the checker passes. Throws std::runtime_error: why it can't be read, or the
// first finding and how many more there are.
PackedModel ReadValidModel(const std::string& path);

// Throws as WriteWholeFile would, before there is anything to write.
void CheckWritable(const std::string& path);

// Writes all of `bytes` or nothing: into a temporary file beside `path` that then takes its name.
// Throws std::runtime_error naming the file and the cause.
void WriteWholeFile(const std::string& path, const std::string& bytes);

// A header that defines every table under its name, 16-byte aligned, at global scope with internal
// linkage, and a list of them, embedded_tables. The model has passed the checker.
std::string TablesHeader(const PackedModel& model);

}  // namespace qz::model
