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

// One run from its options to its exit code.
class Run {
 public:
  explicit Run(const TrainOptions& options) : options_(options) {}
  tools::ExitCode Execute();

 private:
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

tools::ExitCode Run::Execute() {
  tools::CatchInterrupt();
  Load();
  CheckClasses();
  Trainer trainer(recipe_, options_.seed, options_.threads, learnt_);
  fingerprint_ = Fingerprint(recipe_, options_.seed, learnt_, judged_clips_);
  TrainingState state;
  if (!options_.state_file.empty()) {
    if (auto stopped = ReadState(options_.state_file, fingerprint_)) {
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
    return tools::kFaultFound;
  }
  if (!Finish(state)) return tools::kFaultFound;
  return skipped_ == 0 ? tools::kFine : tools::kUnreadableInput;
}

void Run::Load() {
  // Now, not after an hour.
  const std::filesystem::path folder = std::filesystem::path(options_.output).parent_path();
  if (!folder.empty() && !std::filesystem::is_directory(folder)) {
    throw std::runtime_error(options_.output + ": can't be written: there is no folder " +
                             folder.string());
  }
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

void Run::CheckClasses() const {
  if (options_.hold_out != 0 && judged_clips_.empty()) {
    throw std::runtime_error(options_.manifest + ": fold " + std::to_string(options_.hold_out) +
                             " is to be held out, but no readable clip is in it");
  }
  for (int output = 0; output < model::kClasses; ++output) {
    bool found = false;
    for (const Clip& clip : learnt_) found |= clip.output == output;
    if (found) continue;
    throw std::runtime_error(options_.manifest + ": no clip to learn the class '" +
                             labels_[static_cast<size_t>(output)].class_name + "' from");
  }
}

void Run::Train(Trainer* trainer, TrainingState* state) {
  TrainProgress progress(state->epoch);
  while (!trainer->Done(*state) && !tools::Interrupted()) {
    const size_t teachers = state->teachers.size();
    const bool tuning = trainer->Tuning(*state);
    const double loss = trainer->RunEpoch(state);
    // At the end of a teacher's phase its average stays for a moment.
    if (!judged_.empty() && state->phase_epoch % kEpochsAJudgement == 0) {
      Judge(trainer, tuning, state);
    }
    progress.Show(tuning ? "tuning" : "teacher " + std::to_string(teachers + 1), state->epoch,
                  trainer->EpochsLeft(*state), loss, figures_ ? &*figures_ : nullptr);
    KeepState(*state, tools::Interrupted());
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

// Writes the model, says what the rounding cost and proves the model, on clips that were held out;
// else, for want of others, on those that were learnt. False if the proof fails.
bool Run::Finish(const TrainingState& state) const {
  const QuantisedParameters quantised(state.average);
  const model::PackedModel packed = model::Pack(ArraysOf(quantised));
  model::WriteWholeFile(options_.output, std::string(packed.begin(), packed.end()));
  if (!options_.state_file.empty()) std::filesystem::remove(options_.state_file);

  const std::vector<Clip>& clips = judged_clips_.empty() ? learnt_ : judged_clips_;
  std::vector<Batch> features = judged_;
  if (features.empty()) {
    for (const Clip& clip : clips) features.push_back(JudgedFeatures(clip.samples));
  }
  const auto line = [&](const char* what, const std::vector<Scores>& scores) {
    const Figures figures = FiguresOf(scores, clips);
    std::printf("%-28s mean AP %.4f, ROC AUC %.4f\n", what, figures.average_precision,
                figures.roc_auc);
    return figures.average_precision;
  };
  std::printf("%s: on %zu clips that were %s:\n", options_.output.c_str(), clips.size(),
              judged_clips_.empty() ? "learnt from" : "held out");
  std::vector<std::vector<Scores>> taught;
  for (const Values& teacher : state.teachers) taught.push_back(ScoresOf(teacher, features));
  const double of_float = line("float, first teacher", taught[0]);
  line("float, all teachers together", MeanLogits(taught));
  line("first teacher as int8", ScoresOf(QuantisedParameters(state.teachers[0]), features));
  const double of_device = line("int8, tuned: the model", ScoresOf(quantised, features));
  std::printf("%-28s %.4f mean AP, from the first teacher to the model\n", "loss of quantisation",
              of_float - of_device);
  const Proof proof = Prove(quantised, packed, features);
  std::printf("%s\n", Sentence(proof).c_str());
  return proof.difference.empty();
}

}  // namespace

tools::ExitCode TrainCommand(const TrainOptions& options) { return Run(options).Execute(); }

}  // namespace qz::train
