#include "dataset/manifest.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>

#include "base/error.h"

namespace qz::dataset {
namespace {

constexpr char kHeader[] = "file\tclass\tfold";

std::vector<std::string> Fields(const std::string& line) {
  std::vector<std::string> fields;
  size_t begin = 0;
  for (size_t tab; (tab = line.find('\t', begin)) != std::string::npos; begin = tab + 1) {
    fields.push_back(line.substr(begin, tab - begin));
  }
  fields.push_back(line.substr(begin));
  return fields;
}

// -1 if it is none.
int FoldOf(const std::string& text) {
  if (text.empty() || text.size() > 2) return -1;
  if (text.find_first_not_of("0123456789") != std::string::npos) return -1;
  return std::stoi(text);
}

Recording ParseLine(const std::string& line, const std::filesystem::path& folder,
                    const std::string& location) {
  const std::vector<std::string> fields = Fields(line);
  if (fields.size() != 3) {
    throw base::InputError(location + std::to_string(fields.size()) +
                           " fields, should be 3 between tabs: file, class, fold");
  }
  if (fields[0] == "-") throw base::InputError(location + "the file is -, should be a file's name");
  if (fields[0].empty()) throw base::InputError(location + "no file name before the first tab");
  if (fields[1].empty()) throw base::InputError(location + "no class between the tabs");
  const int fold = FoldOf(fields[2]);
  if (fold < 0) {
    throw base::InputError(location + "the fold is '" + fields[2] + "', should be 0 to " +
                           std::to_string(kMaxFold));
  }
  return {(folder / fields[0]).string(), fields[1], fold};
}

}  // namespace

std::vector<Recording> ReadManifest(const std::string& path) {
  std::ifstream file(path);
  if (!file) throw base::InputError(path + ": can't be opened: " + std::strerror(errno));
  const std::filesystem::path folder = std::filesystem::path(path).parent_path();
  std::vector<Recording> recordings;
  std::map<std::string, int> lines;  // by file
  bool headed = false;
  std::string line;
  for (int number = 1; std::getline(file, line); ++number) {
    if (!line.empty() && line.back() == '\r') line.pop_back();
    if (line.empty() || line[0] == '#') continue;
    const std::string location = path + ": line " + std::to_string(number) + ": ";
    if (headed) {
      recordings.push_back(ParseLine(line, folder, location));
      // In two folds it would be learnt from and measured.
      const auto [before, is_new] = lines.emplace(recordings.back().file, number);
      if (!is_new) {
        throw base::InputError(location + recordings.back().file + " stands in line " +
                               std::to_string(before->second) + " already");
      }
    } else if (line != kHeader) {
      throw base::InputError(location +
                             "the first line should be: file, class, fold, with tabs between");
    }
    headed = true;
  }
  if (file.bad()) throw base::InputError(path + ": can't be read: " + std::strerror(errno));
  if (recordings.empty()) throw base::InputError(path + ": lists no recording");
  return recordings;
}

}  // namespace qz::dataset
