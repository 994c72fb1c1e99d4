// SPDX-License-Identifier: Apache-2.0
// One classification pass: two seconds of audio through the front end and the network.

#include <benchmark/benchmark.h>

#include <cstdint>

#include "classifier/audio_classifier.h"
#include "config/detector.h"
#include "hub/hub.h"
#include "tests/support/random.h"

namespace {

using tarn::contexthub::sound::AudioClassifier;
using tarn::contexthub::sound::ConfidenceEvent;

void Pass(benchmark::State& state) {
  qz::hub::Hub runtime;
  AudioClassifier classifier;
  const auto samples = qz::test::Random(1).Fill<int16_t>(qz::config::kBufferSamples, -2000, 2000);
  ConfidenceEvent report[2] = {};
  uint32_t version = 0;
  for (auto _ : state) classifier.Classify(samples.data(), report, 2, &version);
  // Two seconds of audio a pass.
  state.counters["x_real_time"] = benchmark::Counter(2.0 * static_cast<double>(state.iterations()),
                                                     benchmark::Counter::kIsRate);
}
BENCHMARK(Pass)->Unit(benchmark::kMicrosecond);

}  // namespace
