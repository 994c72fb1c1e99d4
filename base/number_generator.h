// SPDX-License-Identifier: Apache-2.0
// Reproducible random numbers: integers and +, -, x only, so that a seed gives the same sequence on
// every machine.
#pragma once

#include <cstdint>

namespace qz::base {

// SplitMix64.
class NumberGenerator {
 public:
  explicit NumberGenerator(uint64_t seed) : state_(seed) {}

  uint64_t Next() {
    uint64_t z = (state_ += 0x9E3779B97F4A7C15u);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9u;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBu;
    return z ^ (z >> 31);
  }

  // Integer of [low, high].
  int Between(int low, int high) {
    return low + static_cast<int>(Next() % static_cast<uint64_t>(high - low + 1));
  }

  // Uniform in [0, 1).
  double Unit() { return static_cast<double>(Next() >> 11) * 0x1p-53; }

  double Uniform(double low, double high) { return low + (high - low) * Unit(); }

  // Bell-shaped in (-1, 1): the mean of three uniforms, deviation 1/3.
  double Bell() {
    double sum = 0;  // in turns: the order of calls within one sum is the compiler's choice
    for (int i = 0; i < 3; ++i) sum += Unit();
    return sum * (2.0 / 3.0) - 1.0;
  }

 private:
  uint64_t state_;
};

}  // namespace qz::base
