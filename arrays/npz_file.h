// Archives of named arrays, NumPy's .npz: a zip file that holds NAME.npy for every array.
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "arrays/npy_file.h"

namespace qz::arrays {

// What an archive may hold; one that claims more is refused before it is unpacked.
struct NpzLimits {
  size_t arrays;
  size_t file_bytes;  // of one .npy file, its header included
};

// All arrays by name, as NumPy names them: without ".npy". Stored or deflated. Throws NpyError.
std::map<std::string, NpyArray> ReadNpz(const std::string& path, const NpzLimits& limits);

// Writes an archive, not compressed, of the same bytes whenever it is written; into a temporary
// file beside `path` that then takes its name. Throws NpyError; `path` is then as it was.
void WriteNpz(const std::string& path, const std::vector<std::pair<std::string, NpyArray>>& arrays);

}  // namespace qz::arrays
