// SPDX-License-Identifier: Apache-2.0
#include "tools/eval/eval_command.h"

#include <cstdio>
#include <utility>

#include "base/error.h"
#include "base/interrupt.h"
#include "base/output_file.h"
#include "dataset/clip.h"
#include "dataset/manifest.h"
#include "evaluation/clip_scores.h"
#include "evaluation/metrics.h"
#include "evaluation/report.h"
#include "model/labels.h"
#include "model/model_files.h"
#include "tools/console.h"

namespace qz::tools {
namespace {

using evaluation::ScoredClip;
using model::PackedModel;

// A model and the clips that it is to score.
struct Job {
  EvalOptions::Part part;
  PackedModel model;
  std::vector<ScoredClip> clips;  // without their scores at first
};

// A class without a clip would have no metrics.
void RequireAllClasses(const Job& job, const model::Labels& labels, const std::string& manifest,
                       const std::string& condition) {
  std::string missing;
  for (const int output : evaluation::EmptyClasses(job.clips)) {
    missing += (missing.empty() ? "" : ", ") + labels[static_cast<size_t>(output)].class_name;
  }
  if (missing.empty()) return;
  const std::string fold =
      job.part.fold > 0 ? ": fold " + std::to_string(job.part.fold) : std::string();
  throw base::InputError(manifest + fold + ": no clip of " + missing + condition +
                         ", should be one or more of each");
}

class Eval {
 public:
  explicit Eval(const EvalOptions& options) : options_(options) {}

  base::ExitCode Execute();

 private:
  void Prepare();
  // Now, not after the work.
  void CheckScoresOut(const std::vector<dataset::Recording>& recordings) const;
  void ScoreAll();
  // False, after a message, if the clip can't be read.
  bool Score(const PackedModel& packed, ScoredClip* clip);
  std::string ScoresTable() const;
  void Print();

  const EvalOptions& options_;
  Console console_;
  model::Labels labels_;
  std::vector<Job> jobs_;
  size_t skipped_ = 0;
};

void Eval::Prepare() {
  const std::vector<dataset::Recording> recordings = dataset::ReadManifest(options_.manifest);
  labels_ = model::ReadLabels(options_.labels);
  for (const EvalOptions::Part& part : options_.parts) {
    Job& job = jobs_.emplace_back(Job{part, model::ReadValidModel(part.model), {}});
    for (const dataset::Recording& recording : recordings) {
      if (recording.fold == 0 || (part.fold > 0 && recording.fold != part.fold)) continue;
      ScoredClip& clip = job.clips.emplace_back();
      clip.file = recording.file;
      clip.class_name = recording.class_name;
      clip.output = model::OutputOf(labels_, recording.class_name);
      clip.fold = recording.fold;
    }
    RequireAllClasses(job, labels_, options_.manifest, "");
  }
  CheckScoresOut(recordings);
}

void Eval::CheckScoresOut(const std::vector<dataset::Recording>& recordings) const {
  if (options_.scores_out.empty()) return;
  std::vector<std::string> inputs = {options_.manifest, options_.labels};
  inputs.reserve(inputs.size() + options_.parts.size() + recordings.size());
  for (const EvalOptions::Part& part : options_.parts) inputs.push_back(part.model);
  for (const dataset::Recording& recording : recordings) inputs.push_back(recording.file);
  base::CheckOutputFile(options_.scores_out, inputs);
}

bool Eval::Score(const PackedModel& packed, ScoredClip* clip) {
  try {
    std::vector<int16_t> samples = dataset::ReadClip(clip->file);
    if (samples.empty()) throw base::InputError(clip->file + ": holds no audio");
    clip->samples = samples.size();
    clip->max = evaluation::ScoreClip(packed, std::move(samples)).max;
    return true;
  } catch (const base::InputError& error) {
    console_.Message("qz: skipped: " + std::string(error.what()));
    return false;
  }
}

void Eval::ScoreAll() {
  size_t all = 0;
  size_t done = 0;
  for (const Job& job : jobs_) all += job.clips.size();
  for (Job& job : jobs_) {
    std::vector<ScoredClip> scored;
    for (ScoredClip& clip : job.clips) {
      if (base::Interrupted()) return;
      if (Score(job.model, &clip)) scored.push_back(clip);
      console_.ClipProgress(++done, all);
    }
    skipped_ += job.clips.size() - scored.size();
    job.clips = std::move(scored);
  }
  if (skipped_ > 0) {
    console_.Message("qz: skipped " + std::to_string(skipped_) + " of " + std::to_string(all) +
                     " clips");
  }
  for (const Job& job : jobs_) {
    RequireAllClasses(job, labels_, options_.manifest, " that can be read");
  }
}

std::string Eval::ScoresTable() const {
  std::string table = "file\tclass\tfold";
  for (const model::Label& label : labels_) table += '\t' + label.class_name;
  table += '\n';
  for (const Job& job : jobs_) {
    for (const ScoredClip& clip : job.clips) {
      table += clip.file + '\t' + clip.class_name + '\t' + std::to_string(clip.fold);
      for (const float score : clip.max) {
        char text[32];
        std::snprintf(text, sizeof text, "\t%.8f", static_cast<double>(score));  // exact
        table += text;
      }
      table += '\n';
    }
  }
  return table;
}

void Eval::Print() {
  evaluation::Evaluation all;
  all.manifest = options_.manifest;
  all.labels = labels_;
  all.skipped = skipped_;
  std::vector<ScoredClip> clips;
  for (const Job& job : jobs_) {
    all.parts.push_back({job.part.model, job.part.fold, evaluation::MetricsOf(job.clips)});
    clips.insert(clips.end(), job.clips.begin(), job.clips.end());
  }
  all.confusion = evaluation::ConfusionOf(clips);
  console_.Data(options_.json ? evaluation::JsonReport(all) : evaluation::TextReport(all));
}

base::ExitCode Eval::Execute() {
  base::CatchInterrupt();
  Prepare();
  ScoreAll();
  if (base::Interrupted()) {
    console_.Message("qz: interrupted; metrics of some clips only would mislead");
    return base::kNotRunnable;
  }
  Print();
  if (!options_.scores_out.empty()) base::WriteOutputFile(options_.scores_out, ScoresTable());
  const std::string fault = console_.OutputFault();
  if (!fault.empty()) throw base::OutputError(fault);
  return skipped_ > 0 ? base::kUnreadableInput : base::kSuccess;
}

}  // namespace

base::ExitCode EvalCommand(const EvalOptions& options) { return Eval(options).Execute(); }

}  // namespace qz::tools
