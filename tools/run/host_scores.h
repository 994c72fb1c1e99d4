// SPDX-License-Identifier: Apache-2.0
// Host-side scores: what qz computes itself beside the module, all scores and, by a user's table,
// detections. Never messages of the module, and marked so wherever they are printed.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "hub/messages.h"
#include "model/labels.h"
#include "tools/console.h"
#include "tools/run/detection_rules.h"
#include "tools/run/report_format.h"
#include "tools/run/score_stream.h"

namespace qz::tools {

class HostScores {
 public:
  // Throws std::runtime_error if the model can't be read or is not sound. Prints the scores of each
  // pass if `show_scores`, and the detections by `rules` if there are.
  HostScores(const std::string& model_path, bool show_scores,
             const std::optional<DetectionTable>& table, const ReportFormat* format,
             Console* console);

  // A pass that ended at `now_ns`: the samples that the module got, and its report of them if
  // somebody received one. The report's two confidences must be those of this view; if they are
  // not, that is a fault, and this and all further passes are not shown.
  void Pass(const int16_t* samples, size_t count, uint64_t now_ns,
            const std::optional<hub::SoundReport>& report);

  // At most one message.
  const std::vector<std::string>& faults() const { return faults_; }

 private:
  void Compare(const PassScores& scores, const hub::SoundReport& report);

  std::string model_path_;
  bool show_scores_;
  std::optional<DetectionRules> rules_;
  const ReportFormat& format_;
  Console& console_;
  ScoreStream score_stream_;
  std::vector<std::string> faults_;
};

}  // namespace qz::tools
