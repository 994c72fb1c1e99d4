// Holds every kernel that has a vector text in this build against its plain text.
//
//   kernel_comparison_test [--seed N]   compares; N is where the seeds of the comparisons start
//   kernel_comparison_test --count      one call of each kernel between marks, plain then running;
//                                       prints the kernels in the order of the marks

#include <sys/mman.h>
#include <unistd.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <iterator>
#include <random>
#include <set>
#include <sstream>

#include "comparison.h"
#include "instruction_mark.h"

namespace qz::test {
namespace {

constexpr uint64_t kComparisons = 10000;  // of each kernel

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

// Each comparison has a seed of its own: given as the first, it comes first.
bool CompareKernel(const Kernel& kernel, uint64_t first_seed) {
  for (uint64_t seed = first_seed; seed < first_seed + kComparisons; ++seed) {
    std::snprintf(comparison, sizeof comparison, "%s, --seed %llu\n", kernel.name.data(),
                  static_cast<unsigned long long>(seed));
    CaseRandom random(seed);
    ends_in_use = 0;
    const std::string difference = kernel.compare(random);
    if (difference.empty()) continue;
    std::printf("%s%s%s\n", comparison, difference.c_str(), random.Picked().c_str());
    return false;
  }
  std::printf("%llu comparisons: %s\n", static_cast<unsigned long long>(kComparisons),
              kernel.name.data());
  return true;
}

int CompareAll(uint64_t first_seed) {
  std::printf("--seed %llu\n", static_cast<unsigned long long>(first_seed));
  std::signal(SIGSEGV, OnFault);
  std::signal(SIGBUS, OnFault);
  std::istringstream words(QZ_VECTOR_TEXTS);
  const std::set<std::string> vector_texts(std::istream_iterator<std::string>(words), {});
  std::set<std::string> unlisted_texts = vector_texts;
  const std::vector<Kernel> kernels = AllKernels();
  bool passed = kernels.size() == QZ_KERNEL_COUNT;
  size_t compared = 0;
  for (const Kernel& kernel : kernels) {
    const std::string text(kernel.text);
    unlisted_texts.erase(text);
    if (vector_texts.count(text) == 0) {
      std::printf("plain text, not compared: %s\n", kernel.name.data());
    } else if (kernel.compare == nullptr) {
      std::printf("vector text, but no comparison: %s\n", kernel.name.data());
      passed = false;
    } else {
      passed &= CompareKernel(kernel, first_seed);
      ++compared;
    }
  }
  for (const std::string& text : unlisted_texts) {
    std::printf("the vector text %s has no kernel in the lists\n", text.c_str());
  }
  if (kernels.size() != QZ_KERNEL_COUNT) {
    std::printf("the lists hold %zu kernels, should be %d\n", kernels.size(), QZ_KERNEL_COUNT);
  }
  std::printf("%zu of %d kernels compared\n", compared, QZ_KERNEL_COUNT);
  return passed && unlisted_texts.empty() && compared > 0 ? EXIT_SUCCESS : EXIT_FAILURE;
}

// Two marks in a row first, for what a mark itself costs. Each text has run once before it counts.
void CountAll() {
  Mark();
  Mark();
  for (const Kernel& kernel : AllKernels()) {
    if (kernel.run == nullptr) continue;
    kernel.run_plain({});
    kernel.run({});
    Mark();
    kernel.run_plain({});
    Mark();
    kernel.run({});
    Mark();
    std::printf("%s %s\n", kernel.text.data(), kernel.name.data());
  }
}

}  // namespace

uint8_t* EndOfFreePages(size_t bytes) {
  constexpr size_t kFreeBytes = 65536;
  if (bytes > kFreeBytes) std::abort();
  if (ends_in_use == ends_of_pages.size()) {
    const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
    void* pages = mmap(nullptr, kFreeBytes + page, PROT_READ | PROT_WRITE,
                       MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (pages == MAP_FAILED) std::abort();
    ends_of_pages.push_back(static_cast<uint8_t*>(pages) + kFreeBytes);
    if (mprotect(ends_of_pages.back(), page, PROT_NONE) != 0) std::abort();
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
  if (arguments.size() != 1 || arguments[0] != "--count") {
    std::fprintf(stderr, "arguments should be none, --seed N or --count\n");
    return EXIT_FAILURE;
  }
  qz::test::CountAll();
  return EXIT_SUCCESS;
}
