// SPDX-License-Identifier: Apache-2.0
#include "dataset/manifest.h"

#include <filesystem>
#include <set>

#include "base/error.h"
#include "base/tab_table.h"

namespace qz::dataset {
namespace {

// -1 if it is none.
int FoldOf(const std::string& text) {
  if (text.empty() || text.size() > 2) return -1;
  if (text.find_first_not_of("0123456789") != std::string::npos) return -1;
  return std::stoi(text);
}

Recording ParseRow(const base::TabRow& row, const std::filesystem::path& folder) {
  const std::string& file = row.fields[0];
  if (file == "-") throw base::InputError(row.location + "the file is -, should be a file's name");
  if (file.empty()) throw base::InputError(row.location + "no file name before the first tab");
  if (row.fields[1].empty()) throw base::InputError(row.location + "no class between the tabs");
  const int fold = FoldOf(row.fields[2]);
  if (fold < 0) {
    throw base::InputError(row.location + "the fold is '" + row.fields[2] + "', should be 0 to " +
                           std::to_string(kMaxFold));
  }
  return {(folder / file).string(), row.fields[1], fold};
}

}  // namespace

std::vector<Recording> ReadManifest(const std::string& path) {
  const std::vector<base::TabRow> rows = base::ReadTabTable(path, {"file", "class", "fold"});
  if (rows.empty()) throw base::InputError(path + ": lists no recording");
  const std::filesystem::path folder = std::filesystem::path(path).parent_path();
  std::vector<Recording> recordings;
  recordings.reserve(rows.size());
  std::set<std::string> files;
  for (const base::TabRow& row : rows) {
    recordings.push_back(ParseRow(row, folder));
    // In two folds it would be trained on and validated with.
    if (!files.insert(recordings.back().file).second) {
      throw base::InputError(row.location + recordings.back().file + " is listed already");
    }
  }
  return recordings;
}

}  // namespace qz::dataset
