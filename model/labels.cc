// SPDX-License-Identifier: Apache-2.0
#include "model/labels.h"

#include <vector>

#include "base/error.h"
#include "base/tab_table.h"

namespace qz::model {
namespace {

bool IsCategory(const std::string& text) {
  return !text.empty() && text.size() <= 3 &&
         text.find_first_not_of("0123456789") == std::string::npos && std::stoi(text) <= 255;
}

Label ParseRow(const base::TabRow& row, size_t output) {
  const std::string& number = row.fields[0];
  const std::string& category = row.fields[1];
  if (number != std::to_string(output)) {
    throw base::InputError(row.location + "the output is '" + number + "', should be " +
                           std::to_string(output));
  }
  if (!IsCategory(category)) {
    throw base::InputError(row.location + "the category is '" + category + "', should be 0 to 255");
  }
  if (row.fields[2].empty() || row.fields[3].empty()) {
    throw base::InputError(row.location + "the class or the name is empty");
  }
  return {std::stoi(category), row.fields[2], row.fields[3]};
}

}  // namespace

Labels ReadLabels(const std::string& path) {
  const std::vector<base::TabRow> rows =
      base::ReadTabTable(path, {"output", "category", "class", "name"});
  Labels labels;
  if (rows.size() != labels.size()) {
    throw base::InputError(path + ": labels of " + std::to_string(rows.size()) +
                           " outputs, should be " + std::to_string(labels.size()));
  }
  for (size_t output = 0; output < labels.size(); ++output) {
    const base::TabRow& row = rows[output];
    labels[output] = ParseRow(row, output);
    for (size_t i = 0; i < output; ++i) {
      if (labels[i].class_name != labels[output].class_name &&
          labels[i].category != labels[output].category) {
        continue;
      }
      throw base::InputError(row.location + "class or category is that of output " +
                             std::to_string(i) + " too");
    }
  }
  return labels;
}

int OutputOf(const Labels& labels, const std::string& class_name) {
  for (int i = 0; i < kClasses; ++i) {
    if (labels[static_cast<size_t>(i)].class_name == class_name) return i;
  }
  return -1;
}

}  // namespace qz::model
