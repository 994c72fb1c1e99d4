// SPDX-License-Identifier: Apache-2.0
// How long a piece of work takes on a machine that others use too: many short samples, of which the
// 10th percentile is the work's own time.
#pragma once

#include <sched.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <vector>

namespace qz::bench {

inline int FromEnvironment(const char* name, int otherwise) {
  const char* text = std::getenv(name);
  return text == nullptr ? otherwise : std::atoi(text);
}

// On processor BENCH_CPU, else the second if there is one.
inline void StayOnOneProcessor() {
  const int processors = static_cast<int>(sysconf(_SC_NPROCESSORS_ONLN));
  cpu_set_t set;
  CPU_ZERO(&set);
  CPU_SET(FromEnvironment("BENCH_CPU", processors > 1 ? 1 : 0) % processors, &set);
  sched_setaffinity(0, sizeof set, &set);
}

// In microseconds.
struct Times {
  double median, least, most, quiet, p90;
  size_t samples;
  long repetitions;  // in a sample
};

template <typename Work>
double Microseconds(long repetitions, const Work& work) {
  const auto start = std::chrono::steady_clock::now();
  for (long i = 0; i < repetitions; ++i) work();
  const std::chrono::duration<double, std::micro> time = std::chrono::steady_clock::now() - start;
  return time.count();
}

// Warms up for BENCH_WARM_MS (150), then samples for BENCH_MAX_MS (1500) at most, or until there
// are BENCH_SAMPLES (1500). A sample repeats the work for some 20 us or once.
template <typename Work>
Times Measure(const Work& work) {
  const double warm_us = FromEnvironment("BENCH_WARM_MS", 150) * 1e3;
  const double max_us = FromEnvironment("BENCH_MAX_MS", 1500) * 1e3;
  const auto wanted = static_cast<size_t>(FromEnvironment("BENCH_SAMPLES", 1500));
  double shortest = Microseconds(1, work);
  for (double spent = shortest; spent < warm_us;) {
    const double time = Microseconds(1, work);
    shortest = std::min(shortest, time);
    spent += time;
  }
  const long repetitions = std::max(1L, static_cast<long>(20 / std::max(shortest, 0.01)) + 1);

  std::vector<double> samples;
  for (double spent = 0; samples.size() < 30 || (samples.size() < wanted && spent < max_us);) {
    const double time = Microseconds(repetitions, work);
    samples.push_back(time / static_cast<double>(repetitions));
    spent += time;
  }
  std::sort(samples.begin(), samples.end());
  const size_t n = samples.size();
  return {samples[n / 2],      samples[0], samples[n - 1], samples[n / 10],
          samples[n * 9 / 10], n,          repetitions};
}

}  // namespace qz::bench
