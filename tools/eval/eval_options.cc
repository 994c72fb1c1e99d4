// SPDX-License-Identifier: Apache-2.0
// The command line of qz eval.

#include <algorithm>
#include <charconv>
#include <map>
#include <memory>

#include "dataset/manifest.h"
#include "tools/commands.h"
#include "tools/eval/eval_command.h"

namespace qz::tools {
namespace {

struct EvalLine {
  EvalOptions options;
  std::string model;
  int fold = 0;
  std::vector<std::string> fold_models;
};

// Of "3=FILE" and the like.
std::vector<EvalOptions::Part> ParseFoldModels(const std::vector<std::string>& words) {
  std::map<int, std::string> models;
  for (const std::string& word : words) {
    const size_t equals = std::min(word.find('='), word.size());
    const char* const end = word.data() + equals;
    int fold = 0;
    const auto [stop, error] = std::from_chars(word.data(), end, fold);
    const bool valid = error == std::errc() && stop == end && equals + 1 < word.size() &&
                       fold >= 1 && fold <= dataset::kMaxFold;
    if (!valid) {
      throw CLI::ValidationError(
          "--fold-model",
          word + " should be FOLD=FILE, with a fold of 1 to " + std::to_string(dataset::kMaxFold));
    }
    if (!models.emplace(fold, word.substr(equals + 1)).second) {
      throw CLI::ValidationError("--fold-model",
                                 word + " is a second model for fold " + std::to_string(fold));
    }
  }
  std::vector<EvalOptions::Part> parts;
  parts.reserve(models.size());
  for (const auto& [fold, model] : models) parts.push_back({fold, model});
  return parts;
}

}  // namespace

void AddEval(CLI::App* app, base::ExitCode* exit_code) {
  CLI::App* eval = app->add_subcommand("eval", "Measure how well a model classifies recordings");
  const auto line = std::make_shared<EvalLine>();
  EvalOptions& options = line->options;
  eval->add_option("MANIFEST", options.manifest,
                   "List of recordings: file, class and fold, with tabs between. Fold 0 is never "
                   "measured; each clip is scored from a fresh start, with silence behind it")
      ->required();
  CLI::Option* model = eval->add_option("--model", line->model,
                                        "Packed model (default: the module's, ../lib/qz.model)");
  eval->add_option("--labels", options.labels,
                   "The classes of the model's outputs (default: ../lib/qz.labels)");
  CLI::Option* fold = eval->add_option("--fold", line->fold, "Measure the clips of one fold only")
                          ->check(CLI::Range(1, dataset::kMaxFold));
  eval->add_option("--fold-model", line->fold_models,
                   "FOLD=FILE, once for each fold to measure: cross-validation. A fold's clips are "
                   "scored by its own model; the metrics are means over those of the folds")
      ->excludes(model)
      ->excludes(fold)
      ->allow_extra_args(false);
  eval->add_flag("--json", options.json, "One JSON object on standard output");
  eval->add_option("--scores-out", options.scores_out,
                   "A file for the maximum scores of each clip, with tabs between");
  eval->callback([line, exit_code] {
    const std::filesystem::path lib = OwnBuild() / "lib";
    if (line->model.empty()) line->model = (lib / "qz.model").string();
    if (line->options.labels.empty()) line->options.labels = (lib / "qz.labels").string();
    line->options.parts = ParseFoldModels(line->fold_models);
    if (line->options.parts.empty()) line->options.parts = {{line->fold, line->model}};
    *exit_code = EvalCommand(line->options);
  });
}

}  // namespace qz::tools
