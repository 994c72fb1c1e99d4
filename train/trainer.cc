// SPDX-License-Identifier: Apache-2.0
#include "train/trainer.h"

#include <algorithm>
#include <cmath>
#include <optional>
#include <thread>

namespace qz::train {
namespace {

// A batch is divided into this many parts, whatever the number of threads, each normalised by
// itself: the sums do not depend on the machine.
constexpr size_t kShards = 2;

constexpr float kRunningRate = 0.05f;
constexpr double kWarmUpSteps = 50;
constexpr double kPi = 3.14159265358979323846;

uint64_t Mixed(uint64_t a, uint64_t b) {
  return base::NumberGenerator(a ^ (b * 0x9E3779B97F4A7C15u)).Next();
}

// A class with half as many clips as the others weighs twice as much.
LossShape ShapeOf(const Recipe& recipe, const std::vector<Clip>& clips) {
  RowVector counts = RowVector::Zero(model::kClasses);
  for (const Clip& clip : clips) {
    if (clip.output >= 0) counts(clip.output) += 1;
  }
  const float mean = counts.mean();
  LossShape shape;
  shape.sharpness = static_cast<float>(recipe.sharpness);
  shape.smoothing = static_cast<float>(recipe.smoothing);
  shape.positive_weight =
      static_cast<float>(recipe.positive_weight) * mean * counts.cwiseMax(1.0f).cwiseInverse();
  return shape;
}

}  // namespace

Trainer::Trainer(const Recipe& recipe, uint64_t seed, int threads, const std::vector<Clip>& clips)
    : recipe_(recipe),
      seed_(seed),
      threads_(threads),
      clips_(clips),
      augmentation_(recipe_, clips_),
      loss_shape_(ShapeOf(recipe, clips)),
      shards_(kShards) {
  const int sequences = recipe.batch / static_cast<int>(kShards);
  for (Shard& shard : shards_) {
    shard.features.Resize(sequences, FramesFor(recipe.windows), model::kInputChannels);
    shard.targets.resize(sequences, model::kClasses);
  }
}

int Trainer::EpochsLeft(const TrainingState& state) const {
  const int left = EpochsOf(Tuning(state)) - state.phase_epoch;
  if (Tuning(state)) return left;
  const int teachers = recipe_.teachers - static_cast<int>(state.teachers.size());
  return left + (teachers - 1) * EpochsOf(/*tuning=*/false) + EpochsOf(/*tuning=*/true);
}

bool Trainer::Accepts(const TrainingState& state) const {
  return state.teachers.size() <= static_cast<size_t>(recipe_.teachers) && state.phase_epoch >= 0 &&
         state.phase_epoch <= EpochsOf(Tuning(state)) && state.epoch >= state.phase_epoch &&
         state.epoch <= recipe_.teachers * EpochsOf(/*tuning=*/false) + EpochsOf(/*tuning=*/true);
}

void Trainer::BeginPhase(TrainingState* state) const {
  state->values =
      Tuning(*state) ? state->teachers[0] : InitialParameters(Mixed(seed_, state->teachers.size()));
  state->average = state->values;
  state->adam = Adam();
  state->best_metric = -1;
}

void Trainer::EndTeacher(const Values& average, TrainingState* state) const {
  state->teachers.push_back(average);
  FoldNormalisations(&state->teachers.back());
  ClampWeights(&state->teachers.back());
  state->phase_epoch = 0;
}

std::vector<size_t> Trainer::OrderOf(int epoch) const {
  std::vector<size_t> order(clips_.size());
  for (size_t i = 0; i < order.size(); ++i) order[i] = i;
  base::NumberGenerator random(Mixed(seed_ + 1, static_cast<uint64_t>(epoch)));
  for (size_t i = order.size(); i > 1; --i) std::swap(order[i - 1], order[random.Next() % i]);
  return order;
}

double Trainer::RunEpoch(TrainingState* state) {
  if (state->phase_epoch == 0) BeginPhase(state);
  const std::vector<size_t> order = OrderOf(state->epoch);
  const auto batch = static_cast<size_t>(recipe_.batch);
  const size_t steps = StepsAnEpoch();
  double loss = 0;
  for (size_t i = 0; i < steps; ++i) {
    loss += RunStep(state, order, i * batch, static_cast<uint64_t>(state->epoch) * steps + i);
  }
  ++state->epoch;
  ++state->phase_epoch;
  if (!Tuning(*state) && state->phase_epoch == EpochsOf(/*tuning=*/false)) {
    EndTeacher(state->best_metric >= 0 ? state->best : state->average, state);
  }
  return loss / static_cast<double>(steps);
}

size_t Trainer::StepsAnEpoch() const {
  const auto batch = static_cast<size_t>(recipe_.batch);
  return (clips_.size() + batch - 1) / batch;
}

int Trainer::EpochsOf(bool tuning) const {
  const auto min_steps = static_cast<size_t>(tuning ? recipe_.min_tuning_steps : recipe_.min_steps);
  const size_t steps = StepsAnEpoch();
  return std::max(tuning ? recipe_.tuning_epochs : recipe_.epochs,
                  static_cast<int>((min_steps + steps - 1) / steps));
}

void Trainer::SetDistillationTargets(const TrainingState& state, Shard* shard) const {
  Batch& targets = shard->distillation_targets;
  targets = Batch();
  for (const Values& teacher : state.teachers) {
    const Batch& logits = shard->float_network.Forward(teacher, shard->features, nullptr);
    if (targets.sequences == 0) {
      targets = logits;
    } else {
      targets.values += logits.values;
    }
  }
  targets.values /= static_cast<float>(state.teachers.size());
}

void Trainer::RunShard(const TrainingState& state, const QuantisedParameters* quantised,
                       const std::vector<size_t>& order, size_t first, uint64_t step,
                       size_t index) {
  Shard& shard = shards_[index];
  const auto sequences = static_cast<size_t>(shard.features.sequences);
  for (size_t s = 0; s < sequences; ++s) {
    const size_t location = first + index * sequences + s;
    augmentation_.Make(order[location % order.size()], Mixed(Mixed(seed_, step), location),
                       static_cast<Eigen::Index>(s), &shard.features, &shard.targets);
  }
  const auto divisor = static_cast<float>(recipe_.batch);
  shard.gradient.assign(kParameters.trained, 0);
  if (quantised == nullptr) {
    const TrainingNoise noise{static_cast<float>(recipe_.dropout),
                              Mixed(Mixed(seed_ + 2, step), index)};
    const Batch& logits = shard.float_network.Forward(state.values, shard.features, &noise);
    shard.loss = ClipLoss(logits, shard.targets, loss_shape_, divisor, &shard.dlogits);
    shard.float_network.Backward(state.values, shard.dlogits, &shard.gradient);
  } else {
    Batch logits = shard.quantised_network.Forward(*quantised, shard.features);
    logits.values *= static_cast<float>(kLogitScale);
    SetDistillationTargets(state, &shard);
    shard.loss = DistillationLoss(logits, shard.distillation_targets, divisor, &shard.dlogits);
    shard.quantised_network.Backward(*quantised, shard.dlogits, &shard.gradient);
  }
}

double Trainer::RunStep(TrainingState* state, const std::vector<size_t>& order, size_t first,
                        uint64_t step) {
  const bool tuning = Tuning(*state);
  std::optional<QuantisedParameters> quantised;
  if (tuning) quantised.emplace(state->values);
  const auto run = [&](size_t index) {
    RunShard(*state, tuning ? &*quantised : nullptr, order, first, step, index);
  };
  std::vector<std::thread> threads;
  for (size_t i = 1; i < kShards; ++i) {
    if (threads_ > 1) threads.emplace_back(run, i);
  }
  run(0);
  for (size_t i = 1; i < kShards && threads_ <= 1; ++i) run(i);
  for (std::thread& thread : threads) thread.join();

  double loss = shards_[0].loss;
  Values gradient = shards_[0].gradient;
  for (size_t i = 1; i < kShards; ++i) {
    loss += shards_[i].loss;
    for (size_t j = 0; j < gradient.size(); ++j) gradient[j] += shards_[i].gradient[j];
  }
  state->adam.Step(gradient, RateAt(*state), static_cast<float>(recipe_.decay), &state->values);
  ClampWeights(&state->values);
  for (const Shard& shard : shards_) {
    if (!tuning) shard.float_network.MoveRunning(kRunningRate, &state->values);
  }
  const auto memory = static_cast<float>(
      std::min(recipe_.average, 1 - 1 / (9 + static_cast<double>(state->adam.steps))));
  for (size_t i = 0; i < state->values.size(); ++i) {
    state->average[i] = memory * state->average[i] + (1 - memory) * state->values[i];
  }
  return loss;
}

float Trainer::RateAt(const TrainingState& state) const {
  const bool tuning = Tuning(state);
  const auto done = static_cast<double>(state.adam.steps);
  const double all = static_cast<double>(EpochsOf(tuning)) * static_cast<double>(StepsAnEpoch());
  const double warmth = std::min(1.0, (done + 1) / kWarmUpSteps);
  const double max = tuning ? recipe_.tuning_rate : recipe_.rate;
  return static_cast<float>(max * warmth * 0.5 * (1 + std::cos(kPi * done / all)));
}

}  // namespace qz::train
