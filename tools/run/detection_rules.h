// SPDX-License-Identifier: Apache-2.0
// Detections on the host's side, by thresholds and cooling times of a user's table.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "model/labels.h"
#include "tools/run/score_stream.h"

namespace qz::tools {

struct DetectionRule {
  float threshold = 1;
  uint64_t cooling_ns = 0;
};

// By output.
using DetectionTable = std::array<DetectionRule, model::kClasses>;

// Reads a table of the columns class, threshold, cooling_s (see base/tab_table.h): a row for each
// of the labels' classes, in any order. Throws base::InputError.
DetectionTable ReadDetectionTable(const std::string& path, const model::Labels& labels);

// The classifier's rules over another table.
class DetectionRules {
 public:
  explicit DetectionRules(const DetectionTable& table) : table_(table) {}

  // The outputs detected by a pass that ends at `now_ns`, in the hub's clock and not 0.
  std::vector<int> Detect(const Scores& confidences, uint64_t now_ns);

 private:
  DetectionTable table_;
  std::array<uint64_t, model::kClasses> last_ns_{};  // 0: never
};

}  // namespace qz::tools
