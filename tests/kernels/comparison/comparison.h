// What the lists of kernels are made of: the texts for some processors are held against the plain
// ones, byte for byte, and what they cost is measured side by side.
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

#include "tests/support/random.h"

namespace qz::test {

// The texts of a kernel that stand beside each other in this build.
#ifdef QZ_KERNELS_X86_64
enum Side { kPlain, kPlainForAvx2, kAvx2, kAvx512Vnni, kSides };
// As rows in kernels/*/CMakeLists.txt name them; the second is the plain text, compiled for AVX2.
constexpr const char* kSets[kSides] = {"", "", "avx2", "avx512vnni"};
#else
enum Side { kPlain, kRunning, kSides };
constexpr const char* kSets[kSides] = {"", QZ_KERNELS};
#endif

template <typename Function>
struct Texts {
  std::string_view name;
  Function* text[kSides];  // null where there is none
};

// Defines a kernel's Texts and declares those that have a name of their own.
// NOLINTBEGIN(bugprone-macro-parentheses): what is declared stands in none.
#ifdef QZ_KERNELS_X86_64
#define QZ_TEXTS(texts, kernel)                                                      \
  extern "C" decltype(kernel) kernel##__plain, kernel##__avx2_plain, kernel##__avx2; \
  constexpr Texts<decltype(kernel)> texts {                                          \
#kernel, { kernel##__plain, kernel##__avx2_plain, kernel##__avx2, nullptr }      \
  }
#define QZ_TEXTS_AND_AVX512VNNI(texts, kernel)                                               \
  extern "C" decltype(kernel) kernel##__plain, kernel##__avx2_plain, kernel##__avx2,         \
      kernel##__avx512vnni;                                                                  \
  constexpr Texts<decltype(kernel)> texts {                                                  \
#kernel, { kernel##__plain, kernel##__avx2_plain, kernel##__avx2, kernel##__avx512vnni } \
  }
#else
#define QZ_TEXTS(texts, kernel)                \
  extern "C" decltype(kernel) kernel##__plain; \
  constexpr Texts<decltype(kernel)> texts {    \
#kernel, { kernel##__plain, kernel }       \
  }
#define QZ_TEXTS_AND_AVX512VNNI(texts, kernel) QZ_TEXTS(texts, kernel)
#endif
// NOLINTEND(bugprone-macro-parentheses)

// Random numbers of one comparison of a text with the plain one; a failure names those that were
// picked.
class CaseRandom : public Random {
 public:
  CaseRandom(uint64_t seed, Side compared) : Random(seed), side(compared) {}
  size_t Pick(const char* name, size_t low, size_t high) {
    picked_.emplace_back(name, Random::Pick(low, high));
    return picked_.back().second;
  }
  std::string Picked() const {
    std::string text;
    for (const auto& [name, value] : picked_) text += ", " + (name + (" " + std::to_string(value)));
    return text;
  }

  const Side side;

 private:
  std::vector<std::pair<const char*, size_t>> picked_;
};

struct Kernel {
  std::string_view name;
  std::string_view text;  // its row in the room's CMakeLists.txt
  // Null where no build has another text than the plain one. A comparison gives what differs, or
  // nothing; a run is one call as the graphs make it, always on the same data.
  std::string (*compare)(CaseRandom& random) = nullptr;
  void (*run)(Side side) = nullptr;
};

std::vector<Kernel> SignalKernels();
std::vector<Kernel> QuantisedKernels();

// Where kFreeBytes end that nothing else uses until the next comparison, `bytes` at most of them
// wanted, with pages before and behind that can't be accessed.
constexpr size_t kFreeBytes = 131072;
uint8_t* EndOfFreePages(size_t bytes);

// A kernel's input: a copy of values, with `readable` random bytes behind them. Right behind those,
// or else right before the values, is a page that can't be read: a text that does ends the program,
// which names kernel and seed. (qemu 7.2's x86 processors trip there over masked loads of AVX2 that
// read nothing of that page.)
template <typename T>
const T* Location(Random& random, const std::vector<T>& values, size_t readable = 0) {
  const size_t bytes = values.size() * sizeof(T);
  uint8_t* const end = EndOfFreePages(bytes + readable);
  uint8_t* const behind = random.Next() % 2 ? end - readable : end - kFreeBytes + bytes;
  T* const location = reinterpret_cast<T*>(behind - bytes);
  std::copy(values.begin(), values.end(), location);
  std::generate_n(behind, readable, [&] { return static_cast<uint8_t>(random.Next()); });
  return location;
}

// Calls both texts with an output each that holds `contents` between random values, so that
// whatever one text alone writes shows. Empty, or the first value that differs, counted from the
// output's first.
template <typename Function, typename T, typename Call>
std::string Difference(CaseRandom& random, const Texts<Function>& texts,
                       const std::vector<T>& contents, const Call& call) {
  constexpr ptrdiff_t kGuard = 64 / sizeof(T);
  std::vector<T> compared = RandomValues<T>(random, contents.size() + 2 * kGuard);
  std::copy(contents.begin(), contents.end(), compared.begin() + kGuard);
  std::vector<T> plain = compared;
  call(texts.text[random.side], compared.data() + kGuard);
  call(texts.text[kPlain], plain.data() + kGuard);
  const auto [at, plain_at] = std::mismatch(compared.begin(), compared.end(), plain.begin());
  if (at == compared.end()) return "";
  return "value " + std::to_string(at - compared.begin() - kGuard) + " of the output's " +
         std::to_string(contents.size()) + " is " + std::to_string(*at) + ", by the plain text " +
         std::to_string(*plain_at);
}

}  // namespace qz::test
