// SPDX-License-Identifier: Apache-2.0
#include "base/tab_table.h"

#include <cstdint>
#include <cstdio>
#include <sstream>
#include <utility>

#include "base/error.h"
#include "base/input_file.h"

namespace qz::base {
namespace {

constexpr size_t kMaxBytes = 64 << 20;
constexpr char kByteOrderMark[] = "\xEF\xBB\xBF";
constexpr size_t kByteOrderMarkLength = 3;

std::vector<std::string> FieldsOf(const std::string& line) {
  std::vector<std::string> fields;
  size_t begin = 0;
  for (size_t tab; (tab = line.find('\t', begin)) != std::string::npos; begin = tab + 1) {
    fields.push_back(line.substr(begin, tab - begin));
  }
  fields.push_back(line.substr(begin));
  return fields;
}

std::string Joined(const std::vector<std::string>& columns) {
  std::string names;
  for (const std::string& column : columns) names += (names.empty() ? "" : ", ") + column;
  return names;
}

// Those of ASCII, but for the tab, and of Latin-1 as UTF-8 has them.
void RefuseControlCharacters(const std::string& line, const std::string& location) {
  for (size_t i = 0; i < line.size(); ++i) {
    const auto byte = static_cast<uint8_t>(line[i]);
    const auto next = static_cast<uint8_t>(i + 1 < line.size() ? line[i + 1] : 0);
    const bool latin = byte == 0xC2 && next >= 0x80 && next < 0xA0;
    if ((byte >= 0x20 && byte != 0x7F && !latin) || byte == '\t') continue;
    char code[8];
    std::snprintf(code, sizeof(code), "U+%04X", latin ? unsigned{next} : unsigned{byte});
    throw InputError(location + "holds the control character " + code +
                     ", should be printable text");
  }
}

}  // namespace

std::vector<TabRow> ReadTabTable(const std::string& path, const std::vector<std::string>& columns) {
  const std::vector<uint8_t> bytes = ReadWholeFile(path, kMaxBytes);
  std::string text(bytes.begin(), bytes.end());
  if (text.compare(0, kByteOrderMarkLength, kByteOrderMark) == 0) {
    text.erase(0, kByteOrderMarkLength);
  }
  std::istringstream lines(text);
  std::vector<TabRow> rows;
  bool headed = false;
  std::string line;
  for (int number = 1; std::getline(lines, line); ++number) {
    if (!line.empty() && line.back() == '\r') line.pop_back();
    if (line.empty() || line[0] == '#') continue;
    const std::string location = path + ": line " + std::to_string(number) + ": ";
    RefuseControlCharacters(line, location);
    std::vector<std::string> fields = FieldsOf(line);
    if (!headed) {
      if (fields != columns) {
        throw InputError(location + "the first line should be: " + Joined(columns) +
                         ", with tabs between");
      }
      headed = true;
    } else if (fields.size() != columns.size()) {
      throw InputError(location + std::to_string(fields.size()) + " fields, should be " +
                       std::to_string(columns.size()) + " between tabs: " + Joined(columns));
    } else {
      rows.push_back({location, std::move(fields)});
    }
  }
  return rows;
}

}  // namespace qz::base
