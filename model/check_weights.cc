// SPDX-License-Identifier: Apache-2.0
#include "model/check_weights.h"

#include <cmath>
#include <cstdio>

namespace qz::model {
namespace {

class TableChecker {
 public:
  TableChecker(const PackedModel& model, const TableLayout& table,
               std::vector<std::string>& findings)
      : model_(model), table_(table), findings_(findings) {}

  void Run() {
    for (int column = 0; column < table_.PaddedColumns(); ++column) {
      if (column < table_.outputs) {
        CheckColumn(column);
      } else {
        CheckPadding(column);
      }
    }
  }

 private:
  bool depthwise() const { return table_.IsDepthwise(); }

  std::string ColumnName(int column) const {
    return (depthwise() ? "channel " : "column ") + std::to_string(column);
  }

  void Report(const char* what, int column, const std::string& location, const std::string& value,
              const std::string& expectation) {
    findings_.push_back(std::string(table_.name) + (depthwise() ? ", group " : ", block ") +
                        std::to_string(column / table_.BlockColumns()) + ": the " + what + " of " +
                        ColumnName(column) + location + " is " + value + "; " + expectation + ".");
  }

  // Calls visit(weight, location) for every weight of a column.
  template <typename Visit>
  void ForEachWeight(int column, Visit visit) const {
    for (int tap = 0; tap < table_.taps; ++tap) {
      for (int input = 0; input < table_.inputs; ++input) {
        std::string location;
        if (table_.taps > 1) location += ", tap " + std::to_string(tap);
        if (!depthwise()) location += ", input channel " + std::to_string(input);
        visit(int{Load<int8_t>(model_, table_.WeightOffset(tap, input, column))}, location);
      }
    }
  }

  void CheckColumn(int column) {
    int sum = 0;
    ForEachWeight(column, [&](int weight, const std::string& location) {
      sum += weight;
      if (weight == -128) {
        Report("weight", column, location, "-128", "expected -127 to 127");
      }
    });
    if (depthwise()) CheckDepthwiseBias(column, 128 * sum);
    if (table_.HasScales()) CheckScale(column);
  }

  void CheckDepthwiseBias(int column, int expected) {
    const int32_t bias = Load<int32_t>(model_, table_.BiasOffset(column));
    if (bias == expected) return;
    Report("bias", column, "", std::to_string(bias),
           "expected " + std::to_string(expected) + ", 128 x the sum of its weights");
  }

  void CheckScale(int column) {
    const float scale = Load<float>(model_, table_.ScaleOffset(column));
    if (!std::isfinite(scale) || scale < 0) {
      Report("scale", column, "", ExactText(scale), "expected finite and not negative");
    } else if (table_.fixed_scale != 0 && scale != table_.fixed_scale) {
      Report("scale", column, "", ExactText(scale), "expected " + ExactText(table_.fixed_scale));
    }
  }

  void CheckPadding(int column) {
    const std::string expectation = "expected 0: " + ColumnName(column) + " is padding (" +
                                    std::to_string(table_.outputs) + " are real)";
    const int32_t bias = Load<int32_t>(model_, table_.BiasOffset(column));
    if (bias != 0) Report("bias", column, "", std::to_string(bias), expectation);
    ForEachWeight(column, [&](int weight, const std::string& location) {
      if (weight != 0) Report("weight", column, location, std::to_string(weight), expectation);
    });
    if (!table_.HasScales()) return;
    // By its bits: padding is zero bytes, and a negative zero is not.
    if (Load<uint32_t>(model_, table_.ScaleOffset(column)) != 0) {
      Report("scale", column, "", ExactText(Load<float>(model_, table_.ScaleOffset(column))),
             expectation);
    }
  }

  const PackedModel& model_;
  const TableLayout& table_;
  std::vector<std::string>& findings_;
};

}  // namespace

std::vector<std::string> CheckWeights(const PackedModel& model) {
  std::vector<std::string> findings;
  if (model.size() != kModelBytes) {
    findings.push_back("The packed model has " + std::to_string(model.size()) +
                       " bytes; expected " + std::to_string(kModelBytes) + ".");
    return findings;
  }
  for (const TableLayout& table : kTables) TableChecker(model, table, findings).Run();
  return findings;
}

std::vector<std::string> CheckTable(const PackedModel& model, const TableLayout& table) {
  std::vector<std::string> findings;
  TableChecker(model, table, findings).Run();
  return findings;
}

std::string ExactText(float value) {
  char text[32];
  std::snprintf(text, sizeof(text), "%.9g", static_cast<double>(value));
  return text;
}

std::string FormatFindings(const std::string& file, const std::vector<std::string>& findings,
                           size_t cap) {
  std::string text;
  for (size_t i = 0; i < findings.size() && i < cap; ++i) {
    text += file + ": " + findings[i] + "\n";
  }
  if (findings.size() > cap) {
    text += file + ": and " + std::to_string(findings.size() - cap) + " more findings.\n";
  }
  return text;
}

}  // namespace qz::model
