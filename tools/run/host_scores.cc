// SPDX-License-Identifier: Apache-2.0
#include "tools/run/host_scores.h"

#include <cstdio>
#include <stdexcept>

#include "model/model_files.h"

namespace qz::tools {
namespace {

// The outputs in a report, in its order.
constexpr size_t kReportedOutputs[] = {config::kShortSmoothedOutput, config::kLongSmoothedOutput};

}  // namespace

HostScores::HostScores(const std::string& model_path, bool show_scores,
                       const std::optional<DetectionTable>& table, const ReportFormat* format,
                       Console* console)
    : model_path_(model_path),
      show_scores_(show_scores),
      format_(*format),
      console_(*console),
      score_stream_(model::ReadValidModel(model_path)) {
  if (table) rules_.emplace(*table);
}

void HostScores::Pass(const int16_t* samples, size_t count, uint64_t now_ns,
                      const std::optional<hub::SoundReport>& report) {
  if (!faults_.empty()) return;
  const PassScores scores = score_stream_.Follow(samples, count);
  if (report) Compare(scores, *report);
  if (!faults_.empty()) return;
  if (show_scores_) console_.Data(format_.Scores(now_ns, scores));
  if (!rules_) return;
  const std::vector<int> detected = rules_->Detect(scores.confidences, now_ns);
  if (!detected.empty()) console_.Data(format_.HostDetection(now_ns, scores, detected));
}

void HostScores::Compare(const PassScores& scores, const hub::SoundReport& report) {
  for (size_t i = 0; i < std::size(kReportedOutputs) && i < report.results.size(); ++i) {
    const size_t output = kReportedOutputs[i];
    const float here = scores.confidences[output], there = report.results[i].confidence;
    if (here == there) continue;
    char text[160];
    std::snprintf(text, sizeof(text),
                  ": is not the model in the module: at %.3f s output %zu is %.9g by this file, "
                  "%.9g in the module's report",
                  static_cast<double>(report.timestamp_ns) * 1e-9, output,
                  static_cast<double>(here), static_cast<double>(there));
    faults_.push_back(model_path_ + text);
    return;
  }
}

}  // namespace qz::tools
