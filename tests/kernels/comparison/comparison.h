// SPDX-License-Identifier: Apache-2.0
// What the lists of kernels are made of: variants for some processors are compared with the
// references, byte for byte, and what they cost is measured side by side.
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
#ifdef QZ_KERNELS_X86_64
#include "kernels/x86_64/implementations.h"
#endif

namespace qz::test {

// The implementations of a kernel that are beside each other in this build, named as
// kernels/kernel_table.h names them.
#ifdef QZ_KERNELS_X86_64
enum Side { kReference, kReferenceForAvx2, kAvx2, kAvx512Vnni, kReferenceUserFlags, kSides };
constexpr const char* kSideNames[kSides] = {"reference", "reference_avx2", "avx2", "avx512vnni",
                                            "reference_user_flags"};
#else
enum Side { kReference, kRunning, kSides };
constexpr const char* kSideNames[kSides] = {"reference", QZ_KERNELS};
#endif

template <typename Function>
struct Implementations {
  std::string_view name;
  Function* of[kSides];
};

// Defines a kernel's Implementations. Where a kernel has no variant for a set of instructions, the
// table gives what runs instead.
// NOLINTBEGIN(bugprone-macro-parentheses): names can't be in parentheses.
#ifdef QZ_KERNELS_X86_64
#define QZ_IMPLEMENTATIONS(variable, component, kernel)                         \
  extern "C" decltype(kernel) kernel##__reference_user_flags;                   \
  constexpr Implementations<decltype(kernel)> variable {                        \
#kernel, {                                                                  \
      kernel##__reference, kernel##__reference_avx2, k##component##Avx2.kernel, \
          k##component##Avx512Vnni.kernel, kernel##__reference_user_flags       \
    }                                                                           \
  }
#else
#define QZ_IMPLEMENTATIONS(variable, component, kernel)  \
  extern "C" decltype(kernel) kernel##__reference;       \
  constexpr Implementations<decltype(kernel)> variable { \
#kernel, { kernel##__reference, kernel }             \
  }
#endif
// NOLINTEND(bugprone-macro-parentheses)

// Random numbers of one comparison of an implementation with the reference; a failure names those
// that were picked.
class CaseRandom : public Random {
 public:
  CaseRandom(uint64_t seed, Side compared) : Random(seed), side(compared) {}
  size_t Pick(const char* name, size_t low, size_t high) {
    picked_.emplace_back(name, Random::Pick(low, high));
    return picked_.back().second;
  }
  std::string Picked() const {
    std::string list;
    for (const auto& [name, value] : picked_) list += ", " + (name + (" " + std::to_string(value)));
    return list;
  }

  const Side side;

 private:
  std::vector<std::pair<const char*, size_t>> picked_;
};

struct Kernel {
  std::string_view name;
  // Null where no build has a variant. A comparison gives what differs, or
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
// or else right before the values, is a page that can't be read: what reads it ends the program,
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

// Calls both implementations with an output each that holds `contents` between random values, so
// that whatever one of them alone writes shows. Empty, or the first value that differs, counted
// from the output's first.
template <typename Function, typename T, typename Call>
std::string Difference(CaseRandom& random, const Implementations<Function>& implementations,
                       const std::vector<T>& contents, const Call& call) {
  constexpr ptrdiff_t kGuard = 64 / sizeof(T);
  std::vector<T> compared = RandomValues<T>(random, contents.size() + 2 * kGuard);
  std::copy(contents.begin(), contents.end(), compared.begin() + kGuard);
  std::vector<T> reference = compared;
  call(implementations.of[random.side], compared.data() + kGuard);
  call(implementations.of[kReference], reference.data() + kGuard);
  const auto [at, reference_at] =
      std::mismatch(compared.begin(), compared.end(), reference.begin());
  if (at == compared.end()) return "";
  return "value " + std::to_string(at - compared.begin() - kGuard) + " of the output's " +
         std::to_string(contents.size()) + " is " + std::to_string(*at) + ", by the reference " +
         std::to_string(*reference_at);
}

}  // namespace qz::test
