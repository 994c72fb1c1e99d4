// Holds every kernel that has a vector text in this build against its plain text.
//
//   kernel_comparison_test [--seed N]   compares; N is where the seeds of the comparisons start
//   kernel_comparison_test --count      one call of each kernel between marks, plain then running;
//                                       prints the kernels in the order of the marks

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <sstream>

#include "comparison.h"
#include "instruction_mark.h"

namespace qz::test {
namespace {

constexpr uint64_t kComparisons = 10000;  // of each kernel
constexpr size_t kSlotBytes = size_t{1} << 20;

// Slots that end at a page without access, kept for the next input.
std::vector<uint8_t*> free_slot_ends;

uint8_t* TakeSlot() {
  if (free_slot_ends.empty()) {
    const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
    void* slot = mmap(nullptr, kSlotBytes + page, PROT_READ | PROT_WRITE,
                      MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (slot == MAP_FAILED) std::abort();
    uint8_t* end = static_cast<uint8_t*>(slot) + kSlotBytes;
    if (mprotect(end, page, PROT_NONE) != 0) std::abort();
    free_slot_ends.push_back(end);
  }
  uint8_t* end = free_slot_ends.back();
  free_slot_ends.pop_back();
  return end;
}

// What a fault's message says; filled in before each comparison.
char comparison[256];

void OnFault(int signal) {
  const char reason[] = "a text read or wrote where it may not: ";
  [[maybe_unused]] ssize_t written = write(STDERR_FILENO, reason, sizeof reason - 1);
  written = write(STDERR_FILENO, comparison, strnlen(comparison, sizeof comparison));
  std::signal(signal, SIG_DFL);
  std::raise(signal);
}

std::vector<std::string> VectorTexts() {
  std::istringstream words(QZ_VECTOR_TEXTS);
  std::vector<std::string> texts;
  for (std::string text; words >> text;) texts.push_back(text);
  return texts;
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
    Random random(seed);
    const std::string difference = kernel.compare(random);
    if (difference.empty()) continue;
    std::printf("differs: %s --seed %llu: %s\n", kernel.name.data(),
                static_cast<unsigned long long>(seed), difference.c_str());
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
  const std::vector<std::string> vector_texts = VectorTexts();
  const std::vector<Kernel> kernels = AllKernels();
  bool passed = true;
  for (const std::string& text : vector_texts) {
    if (std::any_of(kernels.begin(), kernels.end(), [&](auto& k) { return k.text == text; })) {
      continue;
    }
    std::printf("the vector text %s has no kernel in the lists: it would not be compared\n",
                text.c_str());
    passed = false;
  }
  size_t compared = 0;
  for (const Kernel& kernel : kernels) {
    if (std::find(vector_texts.begin(), vector_texts.end(), kernel.text) == vector_texts.end()) {
      std::printf("plain text: nothing to compare: %s\n", kernel.name.data());
      continue;
    }
    passed &= CompareKernel(kernel, first_seed);
    ++compared;
  }
  std::printf("%zu of %zu kernels compared\n", compared, kernels.size());
  return passed && compared > 0 ? EXIT_SUCCESS : EXIT_FAILURE;
}

// Two marks in a row first, for what a mark itself costs. Each text has run once before it counts.
void CountAll() {
  const std::vector<Kernel> kernels = AllKernels();
  Mark();
  Mark();
  for (const Kernel& kernel : kernels) {
    kernel.run_plain();
    kernel.run();
    Mark();
    kernel.run_plain();
    Mark();
    kernel.run();
    Mark();
    std::printf("%s %s\n", kernel.text.data(), kernel.name.data());
  }
}

}  // namespace

GuardedBytes::GuardedBytes(Random& random, const void* values, size_t bytes, size_t readable)
    : page_end_(TakeSlot()), data_(page_end_ - readable - bytes) {
  if (bytes + readable > kSlotBytes) std::abort();
  if (bytes > 0) std::memcpy(data_, values, bytes);
  for (size_t i = 0; i < readable; ++i) data_[bytes + i] = static_cast<uint8_t>(random.Next());
}

GuardedBytes::~GuardedBytes() { free_slot_ends.push_back(page_end_); }

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
