// SPDX-License-Identifier: Apache-2.0
// Tables as text files: a line a row, fields with tabs between, headed by a line of column names.
// Empty lines and lines that begin with # are skipped; line ends may be CRLF, and a byte-order mark
// may come first.
#pragma once

#include <string>
#include <vector>

namespace qz::base {

struct TabRow {
  std::string location;  // "PATH: line N: ", with which a message about the row begins
  std::vector<std::string> fields;
};

// The rows of a table with these columns, each with as many fields. Throws InputError, also for
// control characters, which messages and reports would pass on to a terminal.
std::vector<TabRow> ReadTabTable(const std::string& path, const std::vector<std::string>& columns);

}  // namespace qz::base
