// SPDX-License-Identifier: Apache-2.0
// A training run: some networks over float, the teachers; then the model, which starts from the
// first of them and is trained in the device's arithmetic on the mean of their logits
// (distillation).
#pragma once

#include <cstdint>
#include <functional>
#include <vector>

#include "train/adam.h"
#include "train/augmentation.h"
#include "train/loss.h"
#include "train/recipe.h"
#include "train/validation.h"

namespace qz::train {

// The state of a run at the end of an epoch: what is written to continue from later.
struct TrainingState {
  int epoch = 0;                             // epochs done in all
  int phase_epoch = 0;                       // of them in this phase: a teacher, or the tuning
  std::vector<Values> teachers;              // folded, of the completed phases
  Values values = Values(kParameters.all);   // being trained
  Values average = Values(kParameters.all);  // their moving average: validated, and the result
  Adam adam;
  // With patience: the average that was best in this phase.
  Values best = Values(kParameters.all);
  double best_metric = -1;
  int best_epoch = 0;  // of the phase
};

class Trainer {
 public:
  // Nothing is copied; both lists outlive this. Threads change nothing but the time it takes.
  Trainer(const Recipe& recipe, uint64_t seed, int threads, const std::vector<Clip>& clips);

  // The next epoch is in the device's arithmetic.
  bool Tuning(const TrainingState& state) const {
    return state.teachers.size() == static_cast<size_t>(recipe_.teachers);
  }
  bool Done(const TrainingState& state) const {
    return Tuning(state) && state.phase_epoch == EpochsOf(/*tuning=*/true);
  }
  // With patience there may be fewer.
  int EpochsLeft(const TrainingState& state) const;
  // False for numbers that no run of this recipe reaches.
  bool Accepts(const TrainingState& state) const;
  // Ends a teacher's phase: `average` becomes a teacher.
  void EndTeacher(const Values& average, TrainingState* state) const;

  // One epoch: every clip once as the first of a sequence. Returns the mean loss.
  double RunEpoch(TrainingState* state);

 private:
  struct Shard {
    Batch features;
    Matrix targets;
    FloatNetwork float_network;
    QuantisedNetwork quantised_network;
    Batch distillation_targets;
    Batch dlogits;
    Values gradient;
    double loss = 0;
  };

  size_t StepsAnEpoch() const;
  // Of a teacher or the tuning: the recipe's, or as many as its minimum of steps takes.
  int EpochsOf(bool tuning) const;
  std::vector<size_t> OrderOf(int epoch) const;
  void BeginPhase(TrainingState* state) const;
  // The mean logits of all teachers.
  void SetDistillationTargets(const TrainingState& state, Shard* shard) const;
  void RunShard(const TrainingState& state, const QuantisedParameters* quantised,
                const std::vector<size_t>& order, size_t first, uint64_t step, size_t index);
  double RunStep(TrainingState* state, const std::vector<size_t>& order, size_t first,
                 uint64_t step);
  float RateAt(const TrainingState& state) const;

  const Recipe& recipe_;
  uint64_t seed_;
  int threads_;
  const std::vector<Clip>& clips_;
  Augmentation augmentation_;
  LossShape loss_shape_;
  std::vector<Shard> shards_;
};

}  // namespace qz::train
