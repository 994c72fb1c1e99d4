// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cstdio>

#include "evaluation/report.h"

namespace qz::evaluation {
namespace {

using Row = std::vector<std::string>;

// In characters; bytes 0x80 to 0xBF continue one in UTF-8.
size_t WidthOf(const std::string& text) {
  return static_cast<size_t>(
      std::count_if(text.begin(), text.end(), [](char c) { return (c & 0xC0) != 0x80; }));
}

// Columns two blanks apart; the first flush left, the others flush right. Each row has as many
// cells as the first.
std::string Table(const std::vector<Row>& rows) {
  std::vector<size_t> widths(rows[0].size());
  for (const Row& row : rows) {
    for (size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], WidthOf(row[i]));
  }
  std::string text;
  for (const Row& row : rows) {
    std::string line;
    for (size_t i = 0; i < row.size(); ++i) {
      const std::string blanks(widths[i] - WidthOf(row[i]), ' ');
      line += i == 0 ? row[i] + blanks : "  " + blanks + row[i];
    }
    line.resize(line.find_last_not_of(' ') + 1);
    text += line + '\n';
  }
  return text;
}

std::string Fixed(double value, int digits) {
  char text[32];
  std::snprintf(text, sizeof text, "%.*f", digits, value);
  return text;
}

void Append(const Merit& merit, Row* row) {
  row->insert(row->end(),
              {Fixed(merit.average_precision, 3), Fixed(merit.roc_auc, 3), Fixed(merit.recall, 3)});
}

std::string FoldTable(const std::vector<Part>& parts) {
  std::vector<Row> rows = {
      {"fold", "clips", "average precision", "ROC AUC", "recall", "false alarms allowed"}};
  for (const Part& part : parts) {
    Row& row =
        rows.emplace_back(Row{std::to_string(part.fold), std::to_string(part.metrics.clips)});
    Append(part.metrics.mean, &row);
    row.push_back(std::to_string(part.metrics.allowed_false_alarms));
  }
  return Table(rows);
}

std::string ClassTable(const model::Labels& labels, const Metrics& metrics) {
  std::vector<Row> rows = {{"class", "clips", "average precision", "ROC AUC", "recall"}};
  for (size_t i = 0; i < labels.size(); ++i) {
    const ClassMetrics& of_class = metrics.classes[i];
    Row& row = rows.emplace_back(Row{labels[i].name, std::to_string(of_class.clips)});
    Append(of_class.merit, &row);
  }
  Append(metrics.mean, &rows.emplace_back(Row{"mean", ""}));
  return Table(rows);
}

std::string ConfusionTable(const model::Labels& labels, const Confusion& confusion) {
  std::vector<Row> rows = {{"clips of"}};
  const auto add = [&rows](const std::string& name, const auto& counts) {
    Row& row = rows.emplace_back(Row{name});
    for (const size_t count : counts) row.push_back(count == 0 ? "." : std::to_string(count));
    row.resize(model::kClasses + 2);
  };
  for (const model::Label& label : labels) rows[0].push_back(label.name);
  rows[0].emplace_back("none");
  for (size_t i = 0; i < labels.size(); ++i) add(labels[i].name, confusion.classes[i]);
  for (const auto& [name, counts] : confusion.negatives) add(name, counts);
  return Table(rows);
}

}  // namespace

std::string TextReport(const Evaluation& evaluation) {
  const bool crossed = evaluation.parts.size() > 1;
  std::vector<Metrics> metrics;
  for (const Part& part : evaluation.parts) metrics.push_back(part.metrics);
  const Metrics mean = MeanOverFolds(metrics);

  std::string text = evaluation.manifest + ": " + std::to_string(mean.clips) + " clips, " +
                     Fixed(static_cast<double>(mean.samples) / kSampleRateHz, 1) + " s of audio";
  if (evaluation.skipped > 0) text += ", " + std::to_string(evaluation.skipped) + " skipped";
  text += '\n';
  for (const Part& part : evaluation.parts) {
    if (part.fold > 0) text += "fold " + std::to_string(part.fold) + ": ";
    text += "model " + part.model + '\n';
  }
  text += '\n';
  if (crossed) text += FoldTable(evaluation.parts) + "\nMeans over the folds:\n";
  text += ClassTable(evaluation.labels, mean);
  text += crossed ? "Recall: each fold's at one false alarm of the class per 300 s of its audio\n"
                  : "Recall: at " + std::to_string(mean.allowed_false_alarms) +
                        (mean.allowed_false_alarms == 1 ? " false alarm" : " false alarms") +
                        " of the class, one per 300 s of audio\n";
  text +=
      "\nWhich output scored highest, of equal ones the first; of other sounds, if above 0.5:\n";
  text += ConfusionTable(evaluation.labels, evaluation.confusion);
  text.pop_back();
  return text;
}

}  // namespace qz::evaluation
