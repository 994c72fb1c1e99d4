// SPDX-License-Identifier: Apache-2.0
#include "model/packing.h"

#include <cmath>
#include <limits>
#include <utility>

#include "model/check_weights.h"

namespace qz::model {
namespace {

std::string Headline(const std::vector<std::string>& findings) {
  const size_t more = findings.size() - 1;
  return findings.front() + (more > 0 ? " And " + std::to_string(more) + " more findings." : "");
}

std::string Location(const TableLayout& table, const char* array, const std::string& index) {
  return std::string(table.name) + "." + array + "[" + index + "]";
}

size_t WeightIndex(const TableLayout& table, int tap, int input, int output) {
  const int row = tap * table.inputs + input;
  return static_cast<size_t>(row) * static_cast<size_t>(table.outputs) +
         static_cast<size_t>(output);
}

// The location of a weight, with the indices that the array has.
std::string WeightLocation(const TableLayout& table, int tap, int input, int output) {
  std::string index;
  if (table.taps > 1) index += std::to_string(tap) + ",";
  if (!table.IsDepthwise()) index += std::to_string(input) + ",";
  return Location(table, "weight", index + std::to_string(output));
}

bool FitsInt32(int64_t value) {
  return value >= std::numeric_limits<int32_t>::min() &&
         value <= std::numeric_limits<int32_t>::max();
}

class TablePacker {
 public:
  TablePacker(const TableLayout& table, const LayerArrays& arrays, PackedModel& model,
              std::vector<std::string>& findings)
      : table_(table), arrays_(arrays), model_(model), findings_(findings) {}

  void Run() {
    const size_t outputs = static_cast<size_t>(table_.outputs);
    const bool weights = HasSize("weight", arrays_.weight.size(), WeightCount(table_));
    const bool biases = HasSize("bias", arrays_.bias.size(), outputs);
    const bool scales = HasSize("scale", arrays_.scale.size(), table_.HasScales() ? outputs : 0);
    if (!weights || !biases || !scales) return;
    for (int output = 0; output < table_.outputs; ++output) {
      PackBias(output, PackWeights(output));
      if (table_.HasScales()) PackScale(output);
    }
  }

 private:
  void Report(const std::string& what, const std::string& expectation) {
    findings_.push_back(what + "; " + expectation + ".");
  }

  bool HasSize(const char* array, size_t size, size_t expected) {
    if (size == expected) return true;
    Report(std::string(table_.name) + "." + array + " has " + std::to_string(size) + " values",
           "expected " + std::to_string(expected));
    return false;
  }

  // The sum of the output's weights.
  int PackWeights(int output) {
    int sum = 0;
    for (int tap = 0; tap < table_.taps; ++tap) {
      for (int input = 0; input < table_.inputs; ++input) {
        const int8_t weight = arrays_.weight[WeightIndex(table_, tap, input, output)];
        if (weight == -128) {
          Report(WeightLocation(table_, tap, input, output) + " is -128", "expected -127 to 127");
        }
        Store(model_, table_.WeightOffset(tap, input, output), weight);
        sum += weight;
      }
    }
    return sum;
  }

  void PackBias(int output, int sum) {
    const int32_t bias = arrays_.bias[static_cast<size_t>(output)];
    const std::string what =
        Location(table_, "bias", std::to_string(output)) + " is " + std::to_string(bias);
    if (table_.IsDepthwise() && bias != 0) {
      Report(what, "operator " + std::to_string(table_.op) + " has no biases: expected 0");
    }
    const int64_t offset = int64_t{table_.input_zero_point} * sum;
    const int64_t folded = bias - offset;
    if (!FitsInt32(folded)) {
      Report(what + ", with the input's zero point folded in " + std::to_string(folded),
             "that must fit into 32 bits");
      return;
    }
    Store(model_, table_.BiasOffset(output), static_cast<int32_t>(folded));
  }

  void PackScale(int output) {
    const float scale = arrays_.scale[static_cast<size_t>(output)];
    const std::string what =
        Location(table_, "scale", std::to_string(output)) + " is " + ExactText(scale);
    if (!std::isfinite(scale) || scale < 0) {
      Report(what, "expected finite and not negative");
    } else if (table_.fixed_scale != 0 && scale != table_.fixed_scale) {
      Report(what, "expected " + ExactText(table_.fixed_scale));
    }
    Store(model_, table_.ScaleOffset(output), scale);
  }

  const TableLayout& table_;
  const LayerArrays& arrays_;
  PackedModel& model_;
  std::vector<std::string>& findings_;
};

LayerArrays UnpackTable(const PackedModel& model, const TableLayout& table,
                        std::vector<std::string>& findings) {
  LayerArrays arrays;
  arrays.weight.resize(WeightCount(table));
  for (int output = 0; output < table.outputs; ++output) {
    int sum = 0;
    for (int tap = 0; tap < table.taps; ++tap) {
      for (int input = 0; input < table.inputs; ++input) {
        const int8_t weight = Load<int8_t>(model, table.WeightOffset(tap, input, output));
        arrays.weight[WeightIndex(table, tap, input, output)] = weight;
        sum += weight;
      }
    }
    const int64_t bias =
        Load<int32_t>(model, table.BiasOffset(output)) + int64_t{table.input_zero_point} * sum;
    if (!FitsInt32(bias)) {
      findings.push_back(Location(table, "bias", std::to_string(output)) + " would be " +
                         std::to_string(bias) +
                         " without the input's zero point; that must fit into 32 bits.");
    }
    arrays.bias.push_back(static_cast<int32_t>(bias));
    if (table.HasScales()) arrays.scale.push_back(Load<float>(model, table.ScaleOffset(output)));
  }
  return arrays;
}

}  // namespace

PackingError::PackingError(std::vector<std::string> findings)
    : base::ModelError(Headline(findings)), findings_(std::move(findings)) {}

PackedModel Pack(const ModelArrays& arrays) {
  PackedModel model(kModelBytes, 0);
  std::vector<std::string> findings;
  for (size_t i = 0; i < kTableCount; ++i) {
    TablePacker(kTables[i], arrays[i], model, findings).Run();
  }
  if (!findings.empty()) throw PackingError(std::move(findings));
  return model;
}

ModelArrays Unpack(const PackedModel& model) {
  ModelArrays arrays;
  std::vector<std::string> findings;
  for (size_t i = 0; i < kTableCount; ++i) {
    arrays[i] = UnpackTable(model, kTables[i], findings);
  }
  if (!findings.empty()) throw PackingError(std::move(findings));
  return arrays;
}

}  // namespace qz::model
