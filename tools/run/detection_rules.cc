// SPDX-License-Identifier: Apache-2.0
#include "tools/run/detection_rules.h"

#include <charconv>
#include <cmath>

#include "base/error.h"
#include "base/tab_table.h"

namespace qz::tools {
namespace {

constexpr double kMaxCoolingS = 1e6;

// Of `text` as a whole; false if it is no number of [0, max].
template <typename T>
bool ParseNumber(const std::string& text, T max, T* number) {
  const char* const end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, *number);
  return error == std::errc() && stop == end && *number >= 0 && *number <= max;
}

std::string ClassNames(const model::Labels& labels) {
  std::string names;
  for (const model::Label& label : labels) names += (names.empty() ? "" : ", ") + label.class_name;
  return names;
}

// The row's rule goes to its class's index, where none has been.
void ParseRow(const base::TabRow& row, const model::Labels& labels, DetectionTable* table,
              std::array<bool, model::kClasses>* given) {
  const std::string& name = row.fields[0];
  const int output = model::OutputOf(labels, name);
  if (output < 0) {
    throw base::InputError(row.location + "the class is '" + name + "', expected one of " +
                           ClassNames(labels));
  }
  const auto index = static_cast<size_t>(output);
  if ((*given)[index]) {
    throw base::InputError(row.location + "the class '" + name + "' has a line already");
  }
  (*given)[index] = true;
  DetectionRule& rule = (*table)[index];
  if (!ParseNumber(row.fields[1], 1.0f, &rule.threshold)) {
    throw base::InputError(row.location + "the threshold is '" + row.fields[1] +
                           "', expected 0 to 1");
  }
  double cooling_s = 0;
  if (!ParseNumber(row.fields[2], kMaxCoolingS, &cooling_s)) {
    throw base::InputError(row.location + "the cooling time is '" + row.fields[2] +
                           "', expected 0 to 1000000 seconds");
  }
  rule.cooling_ns = static_cast<uint64_t>(std::llround(cooling_s * 1e9));
}

}  // namespace

DetectionTable ReadDetectionTable(const std::string& path, const model::Labels& labels) {
  DetectionTable table;
  std::array<bool, model::kClasses> given{};
  for (const base::TabRow& row : base::ReadTabTable(path, {"class", "threshold", "cooling_s"})) {
    ParseRow(row, labels, &table, &given);
  }
  for (size_t i = 0; i < given.size(); ++i) {
    if (given[i]) continue;
    throw base::InputError(path + ": no line for the class '" + labels[i].class_name + "'");
  }
  return table;
}

std::vector<int> DetectionRules::Detect(const Scores& confidences, uint64_t now_ns) {
  std::vector<int> detected;
  detected.reserve(confidences.size());
  for (size_t i = 0; i < confidences.size(); ++i) {
    const DetectionRule& rule = table_[i];
    if (detector::Detect(confidences[i], rule.threshold, rule.cooling_ns, now_ns, &last_ns_[i])) {
      detected.push_back(static_cast<int>(i));
    }
  }
  return detected;
}

}  // namespace qz::tools
