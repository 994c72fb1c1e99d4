// What the lists of kernels are made of: the texts that run in this build are held against the
// plain ones, byte for byte, and their instructions are counted side by side.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <limits>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "random.h"

namespace qz::test {

struct Kernel {
  std::string_view name;
  std::string_view text;  // its row in the room's CMakeLists.txt
  // One comparison with arguments drawn from `random`: empty, or what differs and with what
  // arguments.
  std::string (*compare)(Random& random);
  // One call as the graphs make it, always on the same data.
  void (*run)();
  void (*run_plain)();
};

// `run` is a template over the function that it calls. The plain text has to be declared:
// extern "C" { decltype(name) name__plain; }
#define QZ_KERNEL(name, text, compare, run) \
  { #name, text, compare, run < (name)>, run < (name##__plain)> }

std::vector<Kernel> SignalKernels();
std::vector<Kernel> QuantisedKernels();

// `count` values of [low, high] in one of six shapes: random, all lowest, all highest, both in
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

// A readable copy of values and of `readable` random bytes behind them. The page after those can't
// be read: a text that reads further ends the program, which names the kernel and the seed.
class GuardedBytes {
 public:
  GuardedBytes(Random& random, const void* values, size_t bytes, size_t readable);
  GuardedBytes(const GuardedBytes&) = delete;
  GuardedBytes& operator=(const GuardedBytes&) = delete;
  ~GuardedBytes();
  const uint8_t* data() const { return data_; }

 private:
  uint8_t* page_end_;
  uint8_t* data_;
};

// A kernel's input; `readable_bytes` is how far beyond the last value the kernel may read.
template <typename T>
class Input {
 public:
  Input(Random& random, const std::vector<T>& values, size_t readable_bytes)
      : bytes_(random, values.data(), values.size() * sizeof(T), readable_bytes) {}
  const T* data() const { return reinterpret_cast<const T*>(bytes_.data()); }

 private:
  GuardedBytes bytes_;
};

// Two equal buffers with guards around, one for each text. They start with the given contents, or
// with random ones, so that whatever one text alone writes shows.
template <typename T>
class Outputs {
 public:
  Outputs(Random& random, size_t count)
      : count_(count),
        running_(random.Fill<uint8_t>(Bytes() + 2 * kGuard, 0, 255)),
        plain_(running_) {}
  Outputs(Random& random, const std::vector<T>& contents) : Outputs(random, contents.size()) {
    std::copy(contents.begin(), contents.end(), running());
    std::copy(contents.begin(), contents.end(), plain());
  }

  T* running() { return reinterpret_cast<T*>(running_.data() + kGuard); }
  T* plain() { return reinterpret_cast<T*>(plain_.data() + kGuard); }

  // Empty, or the first byte that differs, counted from the output's first.
  std::string Difference() const {
    for (size_t i = 0; i < running_.size(); ++i) {
      if (running_[i] == plain_[i]) continue;
      const auto place = static_cast<ptrdiff_t>(i) - static_cast<ptrdiff_t>(kGuard);
      return "byte " + std::to_string(place) + " of the output's " + std::to_string(Bytes()) +
             " is " + std::to_string(running_[i]) + ", by the plain text " +
             std::to_string(plain_[i]);
    }
    return "";
  }

 private:
  static constexpr size_t kGuard = 64;  // keeps the alignment that vectors have
  size_t Bytes() const { return count_ * sizeof(T); }

  size_t count_;
  std::vector<uint8_t> running_;
  std::vector<uint8_t> plain_;
};

// A difference with the arguments behind it; empty when there is none.
inline std::string WithArguments(std::string difference,
                                 std::initializer_list<std::pair<const char*, int64_t>> arguments) {
  if (difference.empty()) return difference;
  const char* separator = "; ";
  for (const auto& [name, value] : arguments) {
    difference += std::exchange(separator, ", ") + std::string(name) + " " + std::to_string(value);
  }
  return difference;
}

}  // namespace qz::test
