// SPDX-License-Identifier: Apache-2.0
#include <nlohmann/json.hpp>

#include "evaluation/report.h"

namespace qz::evaluation {
namespace {

using Json = nlohmann::ordered_json;

void Append(const Merit& merit, Json* object) {
  (*object)["average_precision"] = merit.average_precision;
  (*object)["roc_auc"] = merit.roc_auc;
  (*object)["recall"] = merit.recall;
}

Json MetricsObject(const Metrics& metrics, const model::Labels& labels) {
  Json object = {{"clips", metrics.clips},
                 {"audio_s", static_cast<double>(metrics.samples) / kSampleRateHz},
                 {"false_alarms_allowed", metrics.allowed_false_alarms},
                 {"classes", Json::array()}};
  for (size_t i = 0; i < labels.size(); ++i) {
    Json of_class = {{"class", labels[i].class_name}, {"clips", metrics.classes[i].clips}};
    Append(metrics.classes[i].merit, &of_class);
    object["classes"].push_back(std::move(of_class));
  }
  Append(metrics.mean, &object["mean"]);
  return object;
}

}  // namespace

std::string JsonReport(const Evaluation& evaluation) {
  Json parts = Json::array();
  std::vector<Metrics> metrics;
  for (const Part& part : evaluation.parts) {
    Json object = {{"model", part.model}, {"fold", nullptr}};
    if (part.fold > 0) object["fold"] = part.fold;
    object.update(MetricsObject(part.metrics, evaluation.labels));
    parts.push_back(std::move(object));
    metrics.push_back(part.metrics);
  }
  Json confusion;
  for (size_t i = 0; i < evaluation.labels.size(); ++i) {
    confusion["classes"][evaluation.labels[i].class_name] = evaluation.confusion.classes[i];
  }
  confusion["negatives"] = Json::object();
  for (const auto& [name, counts] : evaluation.confusion.negatives) {
    confusion["negatives"][name] = counts;
  }
  Json object = {
      {"type", "evaluation"}, {"manifest", evaluation.manifest}, {"skipped", evaluation.skipped}};
  object.update(MetricsObject(MeanOverFolds(metrics), evaluation.labels));
  object["parts"] = std::move(parts);
  object["confusion"] = std::move(confusion);
  // Names of files and classes are whatever bytes they are.
  return object.dump(-1, ' ', false, Json::error_handler_t::replace);
}

}  // namespace qz::evaluation
