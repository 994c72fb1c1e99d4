// SPDX-License-Identifier: Apache-2.0
// Data augmentation: the same recording at another time, loudness and speed, mixed with others and
// with noise; and features with another spectral tilt and with masks.
#pragma once

#include <cstdint>
#include <vector>

#include "base/number_generator.h"
#include "train/matrix.h"
#include "train/recipe.h"
#include "train/training_set.h"

namespace qz::train {

class Augmentation {
 public:
  // The clips are not copied and outlive this; there is at least one.
  Augmentation(const Recipe& recipe, const std::vector<Clip>& clips);

  // Writes sequence `sequence` of a batch of features (0 to 255, FramesFor(recipe.windows) frames)
  // that begins with clip `first`, and its row of targets. Follows from the arguments alone; may
  // be called on several threads.
  void Make(size_t first, uint64_t seed, Eigen::Index sequence, Batch* features,
            Matrix* targets) const;

 private:
  using Sound = std::vector<float>;

  void AddClip(const Clip& clip, double gain, base::NumberGenerator* random, Sound* sound) const;
  void AddNoise(base::NumberGenerator* random, Sound* sound) const;
  void Colour(base::NumberGenerator* random, Eigen::Index sequence, Batch* features) const;
  void Mask(base::NumberGenerator* random, Eigen::Index sequence, Batch* features) const;

  const Recipe& recipe_;
  const std::vector<Clip>& clips_;
  size_t samples_;             // of a sequence
  std::vector<Sound> noises_;  // white, pink and brown, of mean square 1
};

}  // namespace qz::train
