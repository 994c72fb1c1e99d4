// Thresholds and cooling times of a table of one's own, applied by this program.
#pragma once

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
using DetectionRules = std::array<DetectionRule, model::kClasses>;

// Reads a table of the columns class, threshold, cooling_s (see base/tab_table.h): a row for each
// of the labels' classes, in any order. Throws base::InputError.
DetectionRules ReadDetectionRules(const std::string& path, const model::Labels& labels);

// The rules by which the classifier detects: a confidence is detected when it is greater than its
// threshold and its output's last detection is longer ago than the cooling time.
class ToolDetector {
 public:
  explicit ToolDetector(const DetectionRules& rules) : rules_(rules) {}

  // The outputs detected by a pass that ends at `now_ns`, in the hub's clock and not 0.
  std::vector<int> Detect(const Scores& confidences, uint64_t now_ns);

 private:
  DetectionRules rules_;
  std::array<uint64_t, model::kClasses> last_ns_{};  // 0: never
};

}  // namespace qz::tools
