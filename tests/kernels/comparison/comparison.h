// What the lists of kernels are made of: the texts that run in this build are held against the
// plain ones, byte for byte, and their instructions are counted side by side.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "random.h"

namespace qz::test {

// The two texts of a kernel: text[0], which runs in this build, and text[1], the plain one.
template <typename Function>
struct Texts {
  constexpr Texts(std::string_view kernel, Function* running, Function* plain)
      : name(kernel), text{running, plain} {}
  std::string_view name;
  Function* text[2];
};

// Defines a kernel's Texts and declares its plain text.
#define QZ_TEXTS(texts, kernel)                \
  extern "C" decltype(kernel) kernel##__plain; \
  constexpr Texts texts { #kernel, kernel, kernel##__plain }

// Random numbers of one comparison; a failure names those that were picked.
class CaseRandom : public Random {
 public:
  using Random::Random;
  size_t Pick(const char* name, size_t low, size_t high) {
    picked_.emplace_back(name, Random::Pick(low, high));
    return picked_.back().second;
  }
  std::string Picked() const {
    std::string text;
    for (const auto& [name, value] : picked_) text += ", " + (name + (" " + std::to_string(value)));
    return text;
  }

 private:
  std::vector<std::pair<const char*, size_t>> picked_;
};

struct Kernel {
  Kernel(std::string_view kernel, std::string_view row) : name(kernel), text(row) {}
  // `call` is a function of std::true_type for the plain text and std::false_type for the other,
  // so that the choice costs no instruction.
  template <typename Call>
  Kernel(std::string_view kernel, std::string_view row, std::string (*comparison)(CaseRandom&),
         Call call)
      : name(kernel), text(row), compare(comparison), run(call), run_plain(call) {}

  std::string_view name;
  std::string_view text;  // its row in the room's CMakeLists.txt
  // Null where no build has another text than the plain one. A comparison gives what differs, or
  // nothing; a run is one call as the graphs make it, always on the same data.
  std::string (*compare)(CaseRandom& random) = nullptr;
  void (*run)(std::false_type) = nullptr;
  void (*run_plain)(std::true_type) = nullptr;
};

std::vector<Kernel> SignalKernels();
std::vector<Kernel> QuantisedKernels();

// Where a page begins that can't be accessed, behind 64 KiB that nothing else uses until the next
// comparison.
uint8_t* EndOfFreePages(size_t bytes);

// A kernel's input: a copy of values, with `readable` random bytes behind them. The page after
// those can't be read: a text that reads further ends the program, which names kernel and seed.
template <typename T>
const T* Place(Random& random, const std::vector<T>& values, size_t readable = 0) {
  const size_t bytes = values.size() * sizeof(T);
  uint8_t* const behind = EndOfFreePages(bytes + readable) - readable;
  std::memcpy(behind - bytes, values.data(), bytes);
  std::generate_n(behind, readable, [&] { return static_cast<uint8_t>(random.Next()); });
  return reinterpret_cast<const T*>(behind - bytes);
}

// Calls both texts with an output each that holds `contents` between random values, so that
// whatever one text alone writes shows. Empty, or the first value that differs, counted from the
// output's first.
template <typename Function, typename T, typename Call>
std::string Difference(Random& random, const Texts<Function>& texts, const std::vector<T>& contents,
                       const Call& call) {
  constexpr ptrdiff_t kGuard = 64 / sizeof(T);
  std::vector<T> running = RandomValues<T>(random, contents.size() + 2 * kGuard);
  std::copy(contents.begin(), contents.end(), running.begin() + kGuard);
  std::vector<T> plain = running;
  call(texts.text[0], running.data() + kGuard);
  call(texts.text[1], plain.data() + kGuard);
  const auto [at, plain_at] = std::mismatch(running.begin(), running.end(), plain.begin());
  if (at == running.end()) return "";
  return "value " + std::to_string(at - running.begin() - kGuard) + " of the output's " +
         std::to_string(contents.size()) + " is " + std::to_string(*at) + ", by the plain text " +
         std::to_string(*plain_at);
}

}  // namespace qz::test
