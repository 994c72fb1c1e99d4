// Lists of labelled recordings: text, tab-separated, headed by the line "file class fold".
#pragma once

#include <string>
#include <vector>

namespace qz::dataset {

struct Recording {
  std::string file;        // as it can be opened from here
  std::string class_name;  // one of the labels' or any other, which is then heard as a negative
  int fold = 0;            // 1 and up; 0 belongs to no fold: always for training, never measured
};

constexpr int kMaxFold = 99;

// The recordings in the order of their lines. Empty lines and lines that begin with # say nothing;
// names of files that are not absolute start from the manifest's own folder. Throws
// base::InputError.
std::vector<Recording> ReadManifest(const std::string& path);

}  // namespace qz::dataset
