// SPDX-License-Identifier: Apache-2.0
#include "model/array_files.h"

#include <map>
#include <utility>
#include <vector>

#include "arrays/npz_file.h"
#include "base/output_file.h"

namespace qz::model {
namespace {

using arrays::NpyArray;

// More than a model's 34 arrays, and the largest of them in a type of eight bytes, so that an error
// can name what differs.
constexpr arrays::NpzLimits kLimits = {128, 1 << 18};

std::string ArrayName(const TableLayout& table, const char* array) {
  return std::string(table.name) + "." + array;
}

std::vector<size_t> WeightShape(const TableLayout& table) {
  std::vector<size_t> shape;
  if (table.taps > 1) shape.push_back(static_cast<size_t>(table.taps));
  if (!table.IsDepthwise()) shape.push_back(static_cast<size_t>(table.inputs));
  shape.push_back(static_cast<size_t>(table.outputs));
  return shape;
}

// Takes a model's arrays out of an archive's.
class ArrayTaker {
 public:
  explicit ArrayTaker(std::map<std::string, NpyArray> found) : found_(std::move(found)) {}

  ModelArrays Run() {
    ModelArrays arrays;
    for (size_t i = 0; i < kTableCount; ++i) {
      const TableLayout& table = kTables[i];
      const std::vector<size_t> outputs = {static_cast<size_t>(table.outputs)};
      Take(ArrayName(table, "weight"), WeightShape(table), &arrays[i].weight);
      Take(ArrayName(table, "bias"), outputs, &arrays[i].bias);
      if (table.HasScales()) Take(ArrayName(table, "scale"), outputs, &arrays[i].scale);
    }
    for (const auto& [name, array] : found_) {
      findings_.push_back(name + " is none of a model's arrays.");
    }
    if (!findings_.empty()) throw PackingError(std::move(findings_));
    return arrays;
  }

 private:
  template <typename T>
  void Take(const std::string& name, const std::vector<size_t>& shape, std::vector<T>* values) {
    constexpr arrays::ElementType kType = arrays::ElementTypeOf<T>();
    const std::string expected = std::string(NameOf(kType)) + " " + arrays::ShapeText(shape);
    const auto found = found_.find(name);
    if (found == found_.end()) {
      findings_.push_back(name + " is missing; expected " + expected + ".");
      return;
    }
    const NpyArray& array = found->second;
    if (array.type != kType || array.shape != shape) {
      findings_.push_back(name + " is " + NameOf(array.type) + " " +
                          arrays::ShapeText(array.shape) + "; expected " + expected + ".");
    } else {
      *values = arrays::ValuesOf<T>(array);
    }
    found_.erase(found);
  }

  std::map<std::string, NpyArray> found_;
  std::vector<std::string> findings_;
};

}  // namespace

ModelArrays ReadModelArrays(const std::string& path) {
  return ArrayTaker(arrays::ReadNpz(path, kLimits)).Run();
}

void WriteModelArrays(const std::string& path, const ModelArrays& arrays) {
  std::vector<std::pair<std::string, NpyArray>> files;
  for (size_t i = 0; i < kTableCount; ++i) {
    const TableLayout& table = kTables[i];
    const std::vector<size_t> outputs = {static_cast<size_t>(table.outputs)};
    files.emplace_back(ArrayName(table, "weight"),
                       arrays::MakeArray(WeightShape(table), arrays[i].weight));
    files.emplace_back(ArrayName(table, "bias"), arrays::MakeArray(outputs, arrays[i].bias));
    if (!table.HasScales()) continue;
    files.emplace_back(ArrayName(table, "scale"), arrays::MakeArray(outputs, arrays[i].scale));
  }
  base::WriteOutputFile(path, arrays::NpzBytes(files));
}

}  // namespace qz::model
