// Holds every text of a kernel for some instruction set against the kernel's plain text.
//
//   kernel_comparison_test [--seed N]   compares; N is where the seeds of the comparisons start
//   kernel_comparison_test --count      one call of each text between marks; prints their kernels
//   kernel_comparison_test --time       the time of a call of each text, in interleaved rounds

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

#include "tests/kernels/comparison/comparison.h"
#include "tests/support/instruction_mark.h"
#ifdef QZ_KERNELS_X86_64
#include "kernels/x86_64/choices.h"
#include "kernels/x86_64/processor.h"
#endif

namespace qz::test {
namespace {

constexpr uint64_t kComparisons = 10000;  // of each text
constexpr int kNothingToCompareHere =
    77;  // an exit code that CTest takes for a test that was skipped

// Of the places that EndOfFreePages gives.
std::vector<uint8_t*> ends_of_pages;
size_t ends_in_use = 0;

// What a fault's message says; filled in before each comparison.
char comparison[256];

void OnFault(int signal) {
  const char reason[] = "a text read or wrote where it may not: ";
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
  if (side == kAvx512Vnni) return best == InstructionSet::kAvx512Vnni;
  if (side != kPlain) return best != InstructionSet::kBaseline;
#endif
  return true;
}

// Each comparison has a seed of its own: given as the first, it comes first.
bool CompareText(const Kernel& kernel, Side side, uint64_t first_seed) {
  for (uint64_t seed = first_seed; seed < first_seed + kComparisons; ++seed) {
    std::snprintf(comparison, sizeof comparison, "%s of %s, --seed %llu\n", kSets[side],
                  kernel.name.data(), static_cast<unsigned long long>(seed));
    CaseRandom random(seed, side);
    ends_in_use = 0;
    const std::string difference = kernel.compare(random);
    if (difference.empty()) continue;
    std::printf("%s%s%s\n", comparison, difference.c_str(), random.Picked().c_str());
    return false;
  }
  std::printf("%llu comparisons: %s of %s\n", static_cast<unsigned long long>(kComparisons),
              kSets[side], kernel.name.data());
  return true;
}

// The texts of this build, as SET/NAME, that are not plain.
std::set<std::string> VectorTexts() {
  std::istringstream words(QZ_VECTOR_TEXTS);
  return {std::istream_iterator<std::string>(words), {}};
}

// Whether the table of choices says the same of a kernel as the rooms' rows do.
bool ChoiceAgrees([[maybe_unused]] const Kernel& kernel,
                  [[maybe_unused]] const std::set<std::string>& vector_texts) {
#ifdef QZ_KERNELS_X86_64
  const bool has_avx2 = vector_texts.count("avx2/" + std::string(kernel.text)) > 0;
  const bool has_vnni = vector_texts.count("avx512vnni/" + std::string(kernel.text)) > 0;
  const ChoiceRow row = has_vnni ? avx512vnni : has_avx2 ? avx2 : avx2_plain;
  for (const Choice& choice : kChoices) {
    if (choice.kernel == kernel.name && choice.row == row) return true;
  }
  std::printf("kernels/x86_64/choices.h does not say of %s what the rooms' tables do\n",
              kernel.name.data());
  return false;
#else
  return true;
#endif
}

struct Tally {
  size_t compared = 0;
  size_t not_run_here = 0;
  bool passed = true;
};

// The texts of one kernel; takes those that it finds off `unlisted`.
void CompareKernel(const Kernel& kernel, uint64_t first_seed, std::set<std::string>* unlisted,
                   Tally* tally) {
  const std::set<std::string> vector_texts = VectorTexts();
  tally->passed &= ChoiceAgrees(kernel, vector_texts);
  size_t own_texts = 0;
  for (int side = kPlain + 1; side < kSides; ++side) {
    const std::string text = std::string(kSets[side]) + "/" + std::string(kernel.text);
    if (vector_texts.count(text) == 0) continue;
    ++own_texts;
    unlisted->erase(text);
    if (kernel.compare == nullptr) {
      std::printf("%s of %s: no comparison\n", kSets[side], kernel.name.data());
      tally->passed = false;
    } else if (!ProcessorRuns(static_cast<Side>(side))) {
      std::printf("not run by this processor, not compared: %s of %s\n", kSets[side],
                  kernel.name.data());
      ++tally->not_run_here;
    } else {
      tally->passed &= CompareText(kernel, static_cast<Side>(side), first_seed);
      ++tally->compared;
    }
  }
  if (own_texts == 0) std::printf("plain text, not compared: %s\n", kernel.name.data());
}

int CompareAll(uint64_t first_seed) {
  std::printf("--seed %llu\n", static_cast<unsigned long long>(first_seed));
  std::signal(SIGSEGV, OnFault);
  std::signal(SIGBUS, OnFault);
  std::set<std::string> unlisted = VectorTexts();
  const std::vector<Kernel> kernels = AllKernels();
  Tally tally;
  for (const Kernel& kernel : kernels) CompareKernel(kernel, first_seed, &unlisted, &tally);
  for (const std::string& text : unlisted) {
    std::printf("the text %s has no kernel in the lists\n", text.c_str());
  }
  if (kernels.size() != QZ_KERNEL_COUNT) {
    std::printf("the lists hold %zu kernels, should be %d\n", kernels.size(), QZ_KERNEL_COUNT);
  }
  std::printf("%zu texts of %d kernels compared, %zu not run by this processor\n", tally.compared,
              QZ_KERNEL_COUNT, tally.not_run_here);
  const bool complete = kernels.size() == QZ_KERNEL_COUNT && unlisted.empty();
  if (!tally.passed || !complete) return EXIT_FAILURE;
  if (tally.compared > 0) return EXIT_SUCCESS;
  return tally.not_run_here > 0 ? kNothingToCompareHere : EXIT_FAILURE;
}

// The sides of a kernel that have a text of their own, or are what such a text has to beat.
std::vector<Side> SidesToMeasure(const Kernel& kernel) {
  const std::set<std::string> vector_texts = VectorTexts();
  std::vector<Side> sides = {kPlain};
  for (int i = kPlain + 1; i < kSides; ++i) {
    const auto side = static_cast<Side>(i);
    const std::string set = kSets[side];
    const bool present =
        set.empty() || vector_texts.count(set + "/" + std::string(kernel.text)) > 0;
    if (present && ProcessorRuns(side)) sides.push_back(side);
  }
  return kernel.run == nullptr ? std::vector<Side>() : sides;
}

// Two marks in a row first, for what a mark itself costs. Each text has run once before it counts.
void CountAll() {
  Mark();
  Mark();
  for (const Kernel& kernel : AllKernels()) {
    const std::vector<Side> sides = SidesToMeasure(kernel);
    if (sides.empty()) continue;
    for (const Side side : sides) kernel.run(side);
    Mark();
    for (const Side side : sides) {
      kernel.run(side);
      Mark();
    }
    std::printf("%s %s\n", kernel.text.data(), kernel.name.data());
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
    std::printf("%s %s", kernel.text.data(), kernel.name.data());
    for (int side = kPlain; side < kSides; ++side) {
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
  if (arguments.size() == 1 && arguments[0] == "--count") {
    qz::test::CountAll();
  } else if (arguments.size() == 1 && arguments[0] == "--time") {
    qz::test::TimeAll();
  } else {
    std::fprintf(stderr, "arguments should be none, --seed N, --count or --time\n");
    return EXIT_FAILURE;
  }
  return EXIT_SUCCESS;
}
