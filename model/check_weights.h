// SPDX-License-Identifier: Apache-2.0
// The checker of packed models: what it passes drives the network within its contracts.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "model/weight_layout.h"

namespace qz::model {

// Every finding as one sentence that names the table, the block (or group), the location, its value
// and what was expected; none for a valid model. A model of another size yields that one finding.
// Findings come in file order of their tables and columns.
//
// A valid model has kModelBytes; weights from -127 to 127; zeros beyond the real columns; finite
// scales that are not negative; and in the depthwise tables the table's fixed scale and the bias
// 128 x the sum of the channel's weights (a real bias of 0 at input zero point -128).
std::vector<std::string> CheckWeights(const PackedModel& model);

// The findings in one table of a model of kModelBytes.
std::vector<std::string> CheckTable(const PackedModel& model, const TableLayout& table);

// With nine significant digits, which distinguish any two float32.
std::string ExactText(float value);

// One line per finding, each begun by `file`; from `cap` on only their number.
std::string FormatFindings(const std::string& file, const std::vector<std::string>& findings,
                           size_t cap = 20);

}  // namespace qz::model
