// SPDX-License-Identifier: Apache-2.0
// Compares every variant of a kernel for some instruction set with the kernel's reference.
//
//   kernel_comparison_test [--seed N]   compares; N is the seed of the first comparison
//   kernel_comparison_test --user-flags compares the references as a user's flags compile them
//   kernel_comparison_test --count      calls implementations between marks; prints a line for each
//                                       kernel: its source, its name and what was called
//   kernel_comparison_test --time       times calls of all implementations, in interleaved rounds

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <iterator>
#include <random>
#include <set>
#include <sstream>

#include "kernels/kernel_table.h"
#include "tests/kernels/comparison/comparison.h"
#include "tests/support/instruction_mark.h"
#ifdef QZ_KERNELS_X86_64
#include "kernels/x86_64/processor.h"
#endif

namespace qz::test {
namespace {

constexpr uint64_t kComparisons = 10000;  // of each variant
constexpr int kNothingToCompareHere =
    77;  // an exit code that CTest takes for a test that was skipped

// What EndOfFreePages returns.
std::vector<uint8_t*> ends_of_pages;
size_t ends_in_use = 0;

// The message of a fault; filled in before each comparison.
char comparison[256];

void OnFault(int signal) {
  const char reason[] = "memory that may not be accessed: ";
  [[maybe_unused]] ssize_t written = write(STDERR_FILENO, reason, sizeof reason - 1);
  written = write(STDERR_FILENO, comparison, strnlen(comparison, sizeof comparison));
  std::signal(signal, SIG_DFL);
  std::raise(signal);
}

std::vector<Kernel> AllKernels() {
  std::vector<Kernel> kernels = SignalKernels();
  for (const Kernel& kernel : QuantisedKernels()) kernels.push_back(kernel);
  return kernels;
}

bool ProcessorRuns([[maybe_unused]] Side side) {
#ifdef QZ_KERNELS_X86_64
  const InstructionSet best = BestInstructionSet();
  if (side == kAvx512Vnni || side == kReferenceUserFlags)
    return best == InstructionSet::kAvx512Vnni;
  if (side != kReference) return best != InstructionSet::kBaseline;
#endif
  return true;
}

// Each comparison has a seed of its own: given as the first, it comes first.
bool CompareVariant(const Kernel& kernel, Side side, uint64_t first_seed) {
  for (uint64_t seed = first_seed; seed < first_seed + kComparisons; ++seed) {
    std::snprintf(comparison, sizeof comparison, "%s of %s, --seed %llu\n", kSideNames[side],
                  kernel.name.data(), static_cast<unsigned long long>(seed));
    CaseRandom random(seed, side);
    ends_in_use = 0;
    const std::string difference = kernel.compare(random);
    if (difference.empty()) continue;
    std::printf("%s%s%s\n", comparison, difference.c_str(), random.Picked().c_str());
    return false;
  }
  std::printf("%llu comparisons: %s of %s\n", static_cast<unsigned long long>(kComparisons),
              kSideNames[side], kernel.name.data());
  return true;
}

const KernelRow& RowOf(const Kernel& kernel) {
  for (const KernelRow& row : kKernelTable) {
    if (kernel.name == row.kernel) return row;
  }
  std::fprintf(stderr, "kernels/kernel_table.h has no row for %s\n", kernel.name.data());
  std::exit(EXIT_FAILURE);
}

// Whether this implementation of a kernel is a variant, not what runs instead of one.
bool IsVariant(const KernelRow& row, Side side) {
  const std::string_view name = kSideNames[side];
  if (name.rfind("reference", 0) == 0) return false;
  return name == row.neon || name == row.avx2 || name == row.avx512vnni;
}

// The variants of this build, as SET/SOURCE: by its folders, and by the table of kernels.
std::set<std::string> VariantsByFolders() {
  std::istringstream words(QZ_VECTOR_VARIANTS);
  return {std::istream_iterator<std::string>(words), {}};
}
std::set<std::string> VariantsByTable() {
  std::set<std::string> variants;
  for (const KernelRow& row : kKernelTable) {
    for (int i = kReference + 1; i < kSides; ++i) {
      const auto side = static_cast<Side>(i);
      if (IsVariant(row, side)) variants.insert(std::string(kSideNames[side]) + "/" + row.source);
    }
  }
  return variants;
}

struct Tally {
  size_t compared = 0;
  size_t not_run_here = 0;
  bool passed = true;
};

// The variants of one kernel.
void CompareKernel(const Kernel& kernel, uint64_t first_seed, Tally* tally) {
  size_t variants = 0;
  for (int i = kReference + 1; i < kSides; ++i) {
    const auto side = static_cast<Side>(i);
    if (!IsVariant(RowOf(kernel), side)) continue;
    ++variants;
    if (kernel.compare == nullptr) {
      std::printf("%s of %s: no comparison\n", kSideNames[side], kernel.name.data());
      tally->passed = false;
    } else if (!ProcessorRuns(side)) {
      std::printf("not run by this processor, not compared: %s of %s\n", kSideNames[side],
                  kernel.name.data());
      ++tally->not_run_here;
    } else {
      tally->passed &= CompareVariant(kernel, side, first_seed);
      ++tally->compared;
    }
  }
  if (variants == 0) std::printf("reference, not compared: %s\n", kernel.name.data());
}

int CompareAll(uint64_t first_seed) {
  std::printf("--seed %llu\n", static_cast<unsigned long long>(first_seed));
  std::signal(SIGSEGV, OnFault);
  std::signal(SIGBUS, OnFault);
  const std::vector<Kernel> kernels = AllKernels();
  Tally tally;
  for (const Kernel& kernel : kernels) CompareKernel(kernel, first_seed, &tally);
  if (kernels.size() != std::size(kKernelTable)) {
    std::printf("the lists hold %zu kernels, expected %zu\n", kernels.size(),
                std::size(kKernelTable));
    tally.passed = false;
  }
  if (VariantsByFolders() != VariantsByTable()) {
    std::printf("kernels/kernel_table.h names other variants than the folders hold\n");
    tally.passed = false;
  }
  std::printf("%zu variants of %zu kernels compared, %zu not run by this processor\n",
              tally.compared, kernels.size(), tally.not_run_here);
  if (!tally.passed) return EXIT_FAILURE;
  if (tally.compared > 0) return EXIT_SUCCESS;
  return tally.not_run_here > 0 ? kNothingToCompareHere : EXIT_FAILURE;
}

#ifdef QZ_KERNELS_X86_64
int CompareUserFlags(uint64_t first_seed) {
  if (!ProcessorRuns(kReferenceUserFlags)) {
    std::printf("not compared: this processor has no AVX512-VNNI\n");
    return kNothingToCompareHere;
  }
  size_t compared = 0;
  bool passed = true;
  for (const Kernel& kernel : AllKernels()) {
    if (kernel.compare == nullptr) continue;
    ++compared;
    passed &= CompareVariant(kernel, kReferenceUserFlags, first_seed);
  }
  return passed && compared > 0 ? EXIT_SUCCESS : EXIT_FAILURE;
}
#endif

// The sides of a kernel that are variants, or are what such a variant has to beat.
std::vector<Side> SidesToMeasure(const Kernel& kernel) {
  if (kernel.run == nullptr) return {};
  std::vector<Side> sides = {kReference};
  for (int i = kReference + 1; i < kSides; ++i) {
    const auto side = static_cast<Side>(i);
    bool measured = IsVariant(RowOf(kernel), side);
#ifdef QZ_KERNELS_X86_64
    measured = measured || side == kReferenceForAvx2;
#endif
    if (measured && ProcessorRuns(side)) sides.push_back(side);
  }
  return sides;
}

// Two marks in a row first, for what a mark itself costs. Each has run once before it counts.
void CountAll() {
  Mark();
  Mark();
  for (const Kernel& kernel : AllKernels()) {
    const std::vector<Side> sides = SidesToMeasure(kernel);
    if (sides.size() < 2) continue;
    for (const Side side : sides) kernel.run(side);
    Mark();
    for (const Side side : sides) {
      kernel.run(side);
      Mark();
    }
    std::printf("%s %s", RowOf(kernel).source, kernel.name.data());
    for (const Side side : sides) std::printf(" %s", kSideNames[side]);
    std::printf("\n");
  }
}

double Nanoseconds(const Kernel& kernel, Side side, int calls) {
  const auto start = std::chrono::steady_clock::now();
  for (int i = 0; i < calls; ++i) kernel.run(side);
  const std::chrono::duration<double, std::nano> time = std::chrono::steady_clock::now() - start;
  return time.count() / calls;
}

// Of many short measurements the 10th percentile: other programs only ever make them longer.
void TimeAll() {
  constexpr size_t kRounds = 200;
  constexpr double kRoundNs = 50000;
  for (const Kernel& kernel : AllKernels()) {
    const std::vector<Side> sides = SidesToMeasure(kernel);
    std::array<std::vector<double>, kSides> times;
    for (size_t round = 0; round < kRounds; ++round) {
      for (const Side side : sides) {
        const int calls = static_cast<int>(kRoundNs / Nanoseconds(kernel, side, 1)) + 1;
        times[side].push_back(Nanoseconds(kernel, side, calls));
      }
    }
    if (sides.empty()) continue;
    std::printf("%s %s", RowOf(kernel).source, kernel.name.data());
    for (int side = kReference; side < kSides; ++side) {
      std::sort(times[side].begin(), times[side].end());
      std::printf(" %.1f", times[side].empty() ? 0 : times[side][kRounds / 10]);
    }
    std::printf("\n");
  }
}

}  // namespace

uint8_t* EndOfFreePages(size_t bytes) {
  if (bytes > kFreeBytes) std::abort();
  if (ends_in_use == ends_of_pages.size()) {
    const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
    void* pages =
        mmap(nullptr, page + kFreeBytes + page, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (pages == MAP_FAILED) std::abort();
    uint8_t* const begin = static_cast<uint8_t*>(pages) + page;
    if (mprotect(begin, kFreeBytes, PROT_READ | PROT_WRITE) != 0) std::abort();
    ends_of_pages.push_back(begin + kFreeBytes);
  }
  return ends_of_pages[ends_in_use++];
}

}  // namespace qz::test

int main(int argc, char** argv) {
  const std::vector<std::string> arguments(argv + 1, argv + argc);
  if (arguments.empty()) return qz::test::CompareAll(std::random_device{}());
  if (arguments.size() == 2 && arguments[0] == "--seed") {
    return qz::test::CompareAll(std::strtoull(arguments[1].c_str(), nullptr, 10));
  }
#ifdef QZ_KERNELS_X86_64
  if (arguments.size() == 1 && arguments[0] == "--user-flags") {
    return qz::test::CompareUserFlags(std::random_device{}());
  }
#endif
  if (arguments.size() == 1 && arguments[0] == "--count") {
    qz::test::CountAll();
  } else if (arguments.size() == 1 && arguments[0] == "--time") {
    qz::test::TimeAll();
  } else {
    std::fprintf(stderr, "expected no arguments, --seed N, --user-flags, --count or --time\n");
    return EXIT_FAILURE;
  }
  return EXIT_SUCCESS;
}
