// SPDX-License-Identifier: Apache-2.0
// One run of the network, input included: a run overwrites its input, so that every run needs it
// anew.

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include "config/network.h"
#include "network/mobilenet_backend.h"
#include "tests/support/random.h"

namespace {

void NetworkRun(benchmark::State& state) {
  constexpr size_t kInputBytes = qz::config::kWindow.Bytes();
  const std::vector<int8_t> input = qz::test::Random(1).Fill<int8_t>(kInputBytes, -128, 127);
  for (auto _ : state) {
    std::memcpy(mobilenet_backend_input_ptr, input.data(), kInputBytes);
    mobilenet_backend_invoke();
    benchmark::DoNotOptimize(mobilenet_backend_output_ptr[0]);
  }
}
BENCHMARK(NetworkRun)->Unit(benchmark::kMicrosecond);

}  // namespace
