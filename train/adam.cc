// SPDX-License-Identifier: Apache-2.0
#include "train/adam.h"

#include <cmath>

namespace qz::train {
namespace {

constexpr float kMeanMemory = 0.9f;
constexpr float kSquareMemory = 0.99f;
constexpr float kFloor = 1e-8f;

}  // namespace

void Adam::Step(const Values& gradient, float rate, float decay, Values* values) {
  ++steps;
  const double count = static_cast<double>(steps);
  const float mean_correction = static_cast<float>(1 / (1 - std::pow(0.9, count)));
  const float square_correction = static_cast<float>(1 / (1 - std::pow(0.99, count)));
  for (size_t i = 0; i < kParameters.trained; ++i) {
    const float g = gradient[i];
    mean[i] = kMeanMemory * mean[i] + (1 - kMeanMemory) * g;
    square[i] = kSquareMemory * square[i] + (1 - kSquareMemory) * g * g;
    (*values)[i] -=
        rate * mean[i] * mean_correction / (std::sqrt(square[i] * square_correction) + kFloor);
  }
  for (size_t i = 0; i < kLayers; ++i) WeightOf(*values, i) *= 1 - rate * decay;
}

}  // namespace qz::train
