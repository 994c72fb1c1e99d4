// SPDX-License-Identifier: Apache-2.0
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

// All arrays by name, as NumPy names them: without ".npy". Stored or deflated. Throws
// base::InputError.
std::map<std::string, NpyArray> ReadNpz(const std::string& path, const NpzLimits& limits);

// The bytes of an archive, not compressed: the same whenever it is made.
std::string NpzBytes(const std::vector<std::pair<std::string, NpyArray>>& arrays);

}  // namespace qz::arrays
