// SPDX-License-Identifier: Apache-2.0
// Reproducible fills for tests: the same numbers on every machine and library.
#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <vector>

#include "base/number_generator.h"

namespace qz::test {

class Random : public base::NumberGenerator {
 public:
  using NumberGenerator::NumberGenerator;

  // Uniform over [low, high], both included.
  int64_t Between(int64_t low, int64_t high) {
    return low + static_cast<int64_t>(Next() % static_cast<uint64_t>(high - low + 1));
  }

  size_t Pick(size_t low, size_t high) { return low + Next() % (high - low + 1); }

  template <typename T>
  std::vector<T> Fill(size_t count, int64_t low, int64_t high) {
    std::vector<T> values(count);
    for (T& value : values) value = static_cast<T>(Between(low, high));
    return values;
  }
};

template <typename T>
std::vector<T> RandomValues(Random& random, size_t count) {
  std::vector<T> values(count);
  for (T& value : values) value = static_cast<T>(random.Next());
  return values;
}

// `count` values of [low, high] in one of six shapes: random, all minimum, all maximum, both in
// turn, a ramp (that wraps around), or all the value nearest to 0 but one extreme.
template <typename T>
std::vector<T> ShapedFill(Random& random, size_t count, int64_t low = std::numeric_limits<T>::min(),
                          int64_t high = std::numeric_limits<T>::max()) {
  const auto width = static_cast<uint64_t>(high - low) + 1;
  const uint64_t shape = random.Next() % 6, start = random.Next() % width;
  const uint64_t step = 1 + random.Next() % 9;
  if (shape == 0) return random.Fill<T>(count, low, high);
  std::vector<T> values(count);
  for (size_t i = 0; i < count; ++i) {
    const bool is_high = shape == 2 || (shape == 3 && (start + i) % 2 == 0);
    values[i] = static_cast<T>(is_high ? high : low);
    if (shape == 4) {
      values[i] = static_cast<T>(low + static_cast<int64_t>((start + i * step) % width));
    } else if (shape == 5) {
      values[i] = static_cast<T>(low > 0 ? low : (high < 0 ? high : 0));
    }
  }
  if (shape == 5 && count > 0) {
    values[random.Next() % count] = static_cast<T>(start % 2 ? low : high);
  }
  return values;
}

}  // namespace qz::test
