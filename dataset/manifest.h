// SPDX-License-Identifier: Apache-2.0
// Lists of labelled recordings: tables of the columns file, class, fold (see base/tab_table.h).
#pragma once

#include <string>
#include <vector>

namespace qz::dataset {

struct Recording {
  std::string file;        // as it can be opened from here
  std::string class_name;  // one of the labels' or any other, which is then a negative
  int fold = 0;  // 1 and up; 0 belongs to no fold: always for training, never for validation
};

constexpr int kMaxFold = 99;

// The recordings in the order of their rows, each file once; names of files that are not absolute
// start from the manifest's own folder. Throws base::InputError.
std::vector<Recording> ReadManifest(const std::string& path);

}  // namespace qz::dataset
