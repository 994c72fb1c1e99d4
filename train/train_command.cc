#include "train_command.h"

#include <cstdio>
#include <filesystem>
#include <optional>
#include <stdexcept>

#include "interrupt.h"
#include "model_files.h"
#include "packing.h"
#include "proof.h"
#include "state_file.h"
#include "train_progress.h"
#include "trainer.h"

namespace qz::train {
namespace {

constexpr int kEpochsAJudgement = 5;
constexpr auto kBetweenStates = std::chrono::seconds(30);

void PrintFigures(const TrainingState& state, const QuantisedParameters& quantised,
                  const std::vector<Clip>& clips, const std::vector<Batch>& features) {
  const auto line = [&](const char* what, const std::vector<Scores>& scores) {
    const Figures figures = FiguresOf(scores, clips);
    std::printf("%-28s mean AP %.4f, ROC AUC %.4f\n", what, figures.average_precision,
                figures.roc_auc);
    return figures.average_precision;
  };
  std::vector<std::vector<Scores>> taught;
  for (const Values& teacher : state.teachers) taught.push_back(ScoresOf(teacher, features));
  const double first = line("float, first teacher", taught[0]);
  const double together = line("float, all teachers together", MeanLogits(taught));
  line("first teacher as int8", ScoresOf(QuantisedParameters(state.teachers[0]), features));
  const double model = line("int8, tuned: the model", ScoresOf(quantised, features));
  std::printf(
      "loss of quantisation         %.4f mean AP from the first teacher to the model, %.4f from "
      "all teachers together\n",
      first - model, together - model);
}

// One run from its options to its exit code.
class Run {
 public:
  explicit Run(const TrainOptions& options) : options_(options) {}
  programs::ExitCode Execute();

 private:
  void CheckPlaces() const;
  void Load();
  void CheckClasses() const;
  void Train(Trainer* trainer, TrainingState* state);
  void Judge(Trainer* trainer, bool tuning, TrainingState* state);
  void KeepState(const TrainingState& state, bool now);
  bool Finish(const TrainingState& state) const;

  const TrainOptions& options_;
  Recipe recipe_;
  model::Labels labels_;
  std::vector<Clip> learnt_;
  std::vector<Clip> judged_clips_;
  std::vector<Batch> judged_;
  size_t skipped_ = 0;
  std::optional<Figures> figures_;
  std::string fingerprint_;
  std::chrono::steady_clock::time_point last_state_ = std::chrono::steady_clock::now();
};

programs::ExitCode Run::Execute() {
  programs::CatchInterrupt();
  Load();
  CheckClasses();
  Trainer trainer(recipe_, options_.seed, options_.threads, learnt_);
  fingerprint_ = Fingerprint(recipe_, options_.seed, learnt_, judged_clips_) + "patience " +
                 std::to_string(options_.patience) + "\n";
  TrainingState state;
  if (!options_.state_file.empty()) {
    if (auto stopped = ReadState(options_.state_file, fingerprint_)) {
      if (!trainer.Accepts(*stopped)) {
        throw std::runtime_error(options_.state_file + ": is no state of this run; remove it");
      }
      state = std::move(*stopped);
      std::fprintf(stderr, "%s: going on after epoch %d\n", options_.state_file.c_str(),
                   state.epoch);
    }
  }
  Train(&trainer, &state);
  if (!trainer.Done(state)) {
    std::fprintf(stderr, "qz-train: stopped after epoch %d; %s\n", state.epoch,
                 options_.state_file.empty() ? "nothing is kept without --state"
                                             : "the same command goes on");
    return programs::kNotRunnable;
  }
  if (!Finish(state)) return programs::kFaultFound;
  return skipped_ == 0 ? programs::kFine : programs::kUnreadableInput;
}

// Now, not after an hour.
void Run::CheckPlaces() const {
  if (options_.output == options_.state_file) {
    throw std::runtime_error(options_.output + ": can't be the model and the state at once");
  }
  model::CheckWritable(options_.output);
  if (!options_.state_file.empty()) model::CheckWritable(options_.state_file);
}

void Run::Load() {
  CheckPlaces();
  if (!options_.recipe_file.empty()) recipe_ = ReadRecipe(options_.recipe_file);
  labels_ = model::ReadLabels(options_.labels_file);
  ClipList list = LoadClips(dataset::ReadManifest(options_.manifest), labels_);
  skipped_ = list.skipped.size();
  for (const std::string& line : list.skipped) {
    std::fprintf(stderr, "qz-train: skipped: %s\n", line.c_str());
  }
  for (Clip& clip : list.clips) {
    const bool held_out = options_.hold_out != 0 && clip.fold == options_.hold_out;
    (held_out ? judged_clips_ : learnt_).push_back(std::move(clip));
  }
  for (const Clip& clip : judged_clips_) judged_.push_back(JudgedFeatures(clip.samples));
  std::fprintf(stderr, "learning from %zu clips, judged by %zu, %zu skipped\n", learnt_.size(),
               judged_clips_.size(), skipped_);
}

// Of each class there are some to learn from, and some to judge by.
void Run::CheckClasses() const {
  const auto check = [&](const std::vector<Clip>& clips, const std::string& purpose) {
    for (int output = 0; output < model::kClasses; ++output) {
      bool found = false;
      for (const Clip& clip : clips) found |= clip.output == output;
      if (found) continue;
      throw std::runtime_error(options_.manifest + ": no clip of the class '" +
                               labels_[static_cast<size_t>(output)].class_name + "' " + purpose);
    }
  };
  check(learnt_, "to learn from");
  if (options_.hold_out == 0) return;
  check(judged_clips_, "to judge by in fold " + std::to_string(options_.hold_out));
}

void Run::Train(Trainer* trainer, TrainingState* state) {
  TrainProgress progress(state->epoch);
  while (!trainer->Done(*state) && !programs::Interrupted()) {
    const size_t teachers = state->teachers.size();
    const bool tuning = trainer->Tuning(*state);
    const double loss = trainer->RunEpoch(state);
    // At the end of a teacher's phase its average stays for a moment.
    if (!judged_.empty() && state->phase_epoch % kEpochsAJudgement == 0) {
      Judge(trainer, tuning, state);
    }
    progress.Show(tuning ? "tuning" : "teacher " + std::to_string(teachers + 1), state->epoch,
                  trainer->EpochsLeft(*state), loss, figures_ ? &*figures_ : nullptr);
    KeepState(*state, programs::Interrupted());
  }
}

void Run::Judge(Trainer* trainer, bool tuning, TrainingState* state) {
  Values folded = state->average;
  if (!tuning) {
    FoldNormalisations(&folded);
    ClampWeights(&folded);
  }
  figures_ =
      FiguresOf(tuning ? ScoresOf(QuantisedParameters(folded), judged_) : ScoresOf(folded, judged_),
                judged_clips_);
  if (options_.patience == 0 || tuning || state->phase_epoch == 0) return;
  if (figures_->average_precision > state->best_figure) {
    state->best_figure = figures_->average_precision;
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

// Says what the rounding cost, proves the model and writes it. On clips that were held out; else,
// for want of others, on those that were learnt. False if the proof fails: nothing is written.
bool Run::Finish(const TrainingState& state) const {
  const QuantisedParameters quantised(state.average);
  const model::PackedModel packed = model::Pack(ArraysOf(quantised));
  const std::vector<Clip>& clips = judged_clips_.empty() ? learnt_ : judged_clips_;
  std::vector<Batch> features = judged_;
  if (features.empty()) {
    for (const Clip& clip : clips) features.push_back(JudgedFeatures(clip.samples));
  }
  std::printf("%s: on %zu clips that were %s:\n", options_.output.c_str(), clips.size(),
              judged_clips_.empty() ? "learnt from" : "held out");
  PrintFigures(state, quantised, clips, features);
  const Proof proof = Prove(quantised, packed, features);
  std::printf("%s\n", Sentence(proof).c_str());
  if (!proof.difference.empty()) return false;
  model::WriteWholeFile(options_.output, std::string(packed.begin(), packed.end()));
  if (!options_.state_file.empty()) std::filesystem::remove(options_.state_file);
  return true;
}

}  // namespace

programs::ExitCode TrainCommand(const TrainOptions& options) { return Run(options).Execute(); }

}  // namespace qz::train
