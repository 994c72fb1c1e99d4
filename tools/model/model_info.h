// SPDX-License-Identifier: Apache-2.0
// What is in a packed model and in the tensors of its network, as tables for people.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "base/digest.h"
#include "model/packing.h"
#include "model/reference_network.h"
#include "model/weight_layout.h"

namespace qz::tools {

// A tensor over all network runs of a clip.
struct TensorSummary {
  uint64_t values = 0;
  int min = 127;
  int max = -128;
  uint64_t at_min_int8 = 0;
  uint64_t at_max_int8 = 0;
  uint64_t digest = base::kEmptyDigest;  // of the bytes, run by run
};

struct TensorSummaries {
  size_t frames = 0;
  size_t runs = 0;
  TensorSummary input;
  std::array<TensorSummary, model::kOperators - 1> outputs;  // of operators 0 to 19
  std::array<float, model::kClasses> max_scores{};
};

// Runs the network over features, frames x channels: over the first window and then at the
// detector's cadence. The model has passed the checker.
TensorSummaries TensorsOf(const model::PackedModel& packed, const std::vector<uint16_t>& features);

// A line for each table.
std::string TablesText(const model::PackedModel& packed, const model::ModelArrays& arrays);

// A line for each tensor.
std::string TensorsText(const TensorSummaries& tensors);

}  // namespace qz::tools
