// Reproducible fills for tests: the same numbers on every machine and library.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace qz::test {

// SplitMix64: 64 well-mixed bits a step from any seed.
class Random {
 public:
  explicit Random(uint64_t seed) : state_(seed) {}

  uint64_t Next() {
    uint64_t z = (state_ += 0x9E3779B97F4A7C15u);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9u;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBu;
    return z ^ (z >> 31);
  }

  // Uniform over [low, high], both included.
  int64_t Between(int64_t low, int64_t high) {
    return low + static_cast<int64_t>(Next() % static_cast<uint64_t>(high - low + 1));
  }

  template <typename T>
  std::vector<T> Fill(size_t count, int64_t low, int64_t high) {
    std::vector<T> values(count);
    for (T& value : values) value = static_cast<T>(Between(low, high));
    return values;
  }

 private:
  uint64_t state_;
};

}  // namespace qz::test
