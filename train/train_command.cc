// SPDX-License-Identifier: Apache-2.0
#include "train/train_command.h"

#include <array>
#include <cstdio>
#include <filesystem>
#include <optional>

#include "base/error.h"
#include "base/interrupt.h"
#include "base/output_file.h"
#include "model/packing.h"
#include "train/equivalence.h"
#include "train/state_file.h"
#include "train/train_progress.h"
#include "train/trainer.h"

namespace qz::train {
namespace {

constexpr int kEpochsAValidation = 5;
// Fewer clips of a class are called few, and a model that fails on its own clips is bad below this.
constexpr int kEnoughClips = 20;
constexpr double kBadAveragePrecision = 0.9;
constexpr auto kBetweenStates = std::chrono::seconds(30);

// Returns the mean average precision of the model.
double PrintMetrics(const TrainingState& state, const QuantisedParameters& quantised,
                    const std::vector<Clip>& clips, const std::vector<Batch>& features) {
  const auto line = [&](const char* what, const std::vector<Scores>& scores) {
    const Metrics metrics = MetricsOf(scores, clips);
    std::printf("%-28s mean AP %.4f, ROC AUC %.4f\n", what, metrics.average_precision,
                metrics.roc_auc);
    return metrics.average_precision;
  };
  std::vector<std::vector<Scores>> teachers;
  teachers.reserve(state.teachers.size());
  for (const Values& teacher : state.teachers) teachers.push_back(ScoresOf(teacher, features));
  const double first = line("float, first teacher", teachers[0]);
  const double together = line("float, all teachers together", MeanLogits(teachers));
  line("first teacher as int8", ScoresOf(QuantisedParameters(state.teachers[0]), features));
  const double model = line("int8, tuned: the model", ScoresOf(quantised, features));
  std::printf(
      "loss of quantisation         %.4f mean AP from the first teacher to the model, %.4f from "
      "all teachers together\n",
      first - model, together - model);
  return model;
}

// One run from its options to its exit code.
class Run {
 public:
  explicit Run(const TrainOptions& options) : options_(options) {}
  base::ExitCode Execute();

 private:
  void CheckPaths() const;
  void Load();
  void CheckClasses() const;
  void WarnOfFewClips() const;
  void Train(Trainer* trainer, TrainingState* state);
  void Validate(Trainer* trainer, bool tuning, TrainingState* state);
  void KeepState(const TrainingState& state, bool now);
  bool Finish(const TrainingState& state) const;

  const TrainOptions& options_;
  Recipe recipe_;
  model::Labels labels_;
  std::vector<Clip> trained_;
  std::vector<Clip> validation_clips_;
  std::vector<Batch> validation_features_;
  size_t skipped_ = 0;
  std::optional<Metrics> metrics_;
  std::string fingerprint_;
  std::chrono::steady_clock::time_point last_state_ = std::chrono::steady_clock::now();
};

base::ExitCode Run::Execute() {
  base::CatchInterrupt();
  Load();
  CheckClasses();
  WarnOfFewClips();
  Trainer trainer(recipe_, options_.seed, options_.threads, trained_);
  fingerprint_ = Fingerprint(recipe_, options_.seed, trained_, validation_clips_) + "patience " +
                 std::to_string(options_.patience) + "\n";
  TrainingState state;
  if (!options_.state_file.empty()) {
    if (auto stopped = ReadState(options_.state_file, fingerprint_)) {
      if (!trainer.Accepts(*stopped)) {
        throw base::InputError(options_.state_file + ": is not a state of this run; remove it");
      }
      state = std::move(*stopped);
      std::fprintf(stderr, "%s: continuing after epoch %d\n", options_.state_file.c_str(),
                   state.epoch);
    }
  }
  Train(&trainer, &state);
  if (!trainer.Done(state)) {
    std::fprintf(stderr, "qz-train: stopped after epoch %d; %s\n", state.epoch,
                 options_.state_file.empty() ? "nothing is kept without --state"
                                             : "the same command continues");
    return base::ExitCodeAfterInterrupt(base::kNotRunnable);
  }
  if (!Finish(state)) return base::kFaultFound;
  return skipped_ == 0 ? base::kSuccess : base::kUnreadableInput;
}

// Before the training, not after it.
void Run::CheckPaths() const {
  const std::string& state = options_.state_file;
  const std::vector<std::string> inputs = {options_.manifest, options_.recipe_file,
                                           options_.labels_file};
  base::CheckOutputFile(options_.output, inputs);
  if (state.empty()) return;
  if (base::IsSameFile(options_.output, state)) {
    throw base::OutputError(options_.output + ": can't be the model and the state at once");
  }
  base::CheckOutputFile(state, inputs);
}

void Run::Load() {
  CheckPaths();
  if (!options_.recipe_file.empty()) recipe_ = ReadRecipe(options_.recipe_file);
  labels_ = model::ReadLabels(options_.labels_file);
  ClipList list = LoadClips(dataset::ReadManifest(options_.manifest), labels_);
  skipped_ = list.skipped.size();
  for (const std::string& line : list.skipped) {
    std::fprintf(stderr, "qz-train: skipped: %s\n", line.c_str());
  }
  for (Clip& clip : list.clips) {
    const bool held_out = options_.hold_out != 0 && clip.fold == options_.hold_out;
    (held_out ? validation_clips_ : trained_).push_back(std::move(clip));
  }
  validation_features_.reserve(validation_clips_.size());
  for (const Clip& clip : validation_clips_) {
    validation_features_.push_back(ValidationFeatures(clip.samples));
  }
  std::fprintf(stderr, "training on %zu clips, validating on %zu, %zu skipped\n", trained_.size(),
               validation_clips_.size(), skipped_);
}

// Every class has clips to train on, and to validate on.
void Run::CheckClasses() const {
  const auto check = [&](const std::vector<Clip>& clips, const std::string& purpose) {
    for (int output = 0; output < model::kClasses; ++output) {
      bool found = false;
      for (const Clip& clip : clips) found |= clip.output == output;
      if (found) continue;
      throw base::InputError(options_.manifest + ": no clip of the class '" +
                             labels_[static_cast<size_t>(output)].class_name + "' " + purpose);
    }
  };
  check(trained_, "to train on");
  if (options_.hold_out == 0) return;
  check(validation_clips_, "to validate on in fold " + std::to_string(options_.hold_out));
}

void Run::WarnOfFewClips() const {
  std::array<int, model::kClasses> counts = {};
  for (const Clip& clip : trained_) {
    if (clip.output >= 0) ++counts[static_cast<size_t>(clip.output)];
  }
  std::string few;
  for (size_t output = 0; output < counts.size(); ++output) {
    if (counts[output] >= kEnoughClips) continue;
    few += (few.empty() ? "" : ", ") + labels_[output].class_name + " " +
           std::to_string(counts[output]);
  }
  if (few.empty()) return;
  std::fprintf(stderr,
               "qz-train: warning: few clips to train on: %s; expected %d or more a class\n",
               few.c_str(), kEnoughClips);
}

void Run::Train(Trainer* trainer, TrainingState* state) {
  TrainProgress progress(state->epoch);
  while (!trainer->Done(*state) && !base::Interrupted()) {
    const size_t teachers = state->teachers.size();
    const bool tuning = trainer->Tuning(*state);
    const double loss = trainer->RunEpoch(state);
    // At the end of a teacher's phase its average stays for a moment.
    if (!validation_features_.empty() && state->phase_epoch % kEpochsAValidation == 0) {
      Validate(trainer, tuning, state);
    }
    progress.Show(tuning ? "tuning" : "teacher " + std::to_string(teachers + 1), state->epoch,
                  trainer->EpochsLeft(*state), loss, metrics_ ? &*metrics_ : nullptr);
    KeepState(*state, base::Interrupted());
  }
}

void Run::Validate(Trainer* trainer, bool tuning, TrainingState* state) {
  Values folded = state->average;
  if (!tuning) {
    FoldNormalisations(&folded);
    ClampWeights(&folded);
  }
  metrics_ = MetricsOf(tuning ? ScoresOf(QuantisedParameters(folded), validation_features_)
                              : ScoresOf(folded, validation_features_),
                       validation_clips_);
  if (options_.patience == 0 || tuning || state->phase_epoch == 0) return;
  if (metrics_->average_precision > state->best_metric) {
    state->best_metric = metrics_->average_precision;
    state->best_epoch = state->phase_epoch;
    state->best = state->average;
  } else if (state->phase_epoch - state->best_epoch >= options_.patience) {
    trainer->EndTeacher(state->best, state);
  }
}

void Run::KeepState(const TrainingState& state, bool now) {
  if (options_.state_file.empty()) return;
  if (!now && std::chrono::steady_clock::now() - last_state_ < kBetweenStates) return;
  WriteState(options_.state_file, fingerprint_, state);
  last_state_ = std::chrono::steady_clock::now();
}

// Prints the metrics, checks that the module computes the same, and writes the model. On the clips
// that were held out; without any on those that were trained on. False if the check fails: nothing
// is written.
bool Run::Finish(const TrainingState& state) const {
  const QuantisedParameters quantised(state.average);
  const model::PackedModel packed = model::Pack(ArraysOf(quantised));
  const std::vector<Clip>& clips = validation_clips_.empty() ? trained_ : validation_clips_;
  std::vector<Batch> features = validation_features_;
  if (features.empty()) {
    for (const Clip& clip : clips) features.push_back(ValidationFeatures(clip.samples));
  }
  std::printf("%s: on %zu clips that were %s:\n", options_.output.c_str(), clips.size(),
              validation_clips_.empty() ? "trained on" : "held out");
  const double average_precision = PrintMetrics(state, quantised, clips, features);
  if (validation_clips_.empty() && average_precision < kBadAveragePrecision) {
    std::fprintf(stderr,
                 "qz-train: warning: the model does not recognise its own clips: mean AP %.2f, "
                 "expected %.2f or more; train on more clips or for more steps\n",
                 average_precision, kBadAveragePrecision);
  }
  const EquivalenceCheck check = Prove(quantised, packed, features);
  std::printf("%s\n", Message(check).c_str());
  if (!check.difference.empty()) return false;
  base::WriteOutputFile(options_.output, std::string(packed.begin(), packed.end()));
  if (!options_.state_file.empty()) std::filesystem::remove(options_.state_file);
  return true;
}

}  // namespace

base::ExitCode TrainCommand(const TrainOptions& options) { return Run(options).Execute(); }

}  // namespace qz::train
