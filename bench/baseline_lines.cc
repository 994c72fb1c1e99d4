// SPDX-License-Identifier: Apache-2.0
// Our own lines of the table of baselines (make bench-baselines): one run of the network, one FFT,
// one frame of the front end, in the format that the baselines' programs print. `--parts` prints
// each operator of the network instead.

#include <array>
#include <cstdio>
#include <cstring>

#include "bench/quiet_time.h"
#include "frontend/audio_frontend.h"
#include "frontend/real_fft.h"
#include "kernels/x86_64/processor.h"
#include "network/mobilenet_backend.h"
#include "network/network.h"
#include "tests/support/random.h"

namespace {

using qz::InstructionSet;
using qz::bench::Times;
using qz::frontend::kFrameSamples;

constexpr double kNetworkProducts = 3710720;

const char* Name() {
  switch (qz::BestInstructionSet()) {
    case InstructionSet::kBaseline:
      return "QZ, exact, SSE2";
    case InstructionSet::kAvx2:
      return "QZ, exact, AVX2";
    case InstructionSet::kAvx512Vnni:
      return "QZ, exact, AVX512-VNNI";
  }
  return "";
}

void Print(const char* group, const Times& t, double products) {
  std::printf("PEER|%s|%s|%.4f|%.4f|%.4f|%.4f|%.4f|%zu|%ld|%.0f|exact\n", group, Name(), t.median,
              t.least, t.most, t.quiet, t.p90, t.samples, t.repetitions, products);
}

void PrintBaselineLines() {
  Print("A", qz::bench::Measure(mobilenet_backend_invoke), kNetworkProducts);
  // No front-end kernel has a variant for more than AVX2.
  if (qz::BestInstructionSet() == InstructionSet::kAvx512Vnni) return;

  constexpr size_t kFrames = 100;
  qz::test::Random random(1);
  static std::array<std::array<int16_t, kFrameSamples>, kFrames> frames;
  for (auto& frame : frames) {
    for (int16_t& sample : frame) sample = static_cast<int16_t>(random.Between(-9000, 9000));
  }
  size_t next = 0;
  static int16_t spectrum[2 * (qz::frontend::kFftEntries + 1)];
  Print("B-fft", qz::bench::Measure([&] {
          qz::frontend::RealFft(frames[next = (next + 1) % kFrames].data(), spectrum);
        }),
        0);
  Print("B", qz::bench::Measure([&] {
          std::memcpy(audio_frontend_input_ptr, frames[next = (next + 1) % kFrames].data(),
                      sizeof frames[0]);
          audio_frontend_invoke();
        }),
        0);
}

// PART|operator|quiet microseconds
void PrintParts() {
  using qz::network::arena;
  using qz::network::module_weights;
  for (size_t i = 0; i < qz::config::kOperatorCount; ++i) {
    const auto run = [&] { qz::network::RunOperator(i, arena, module_weights); };
    std::printf("PART|%s|%zu|%.4f\n", Name(), i, qz::bench::Measure(run).quiet);
  }
}

}  // namespace

int main(int argc, char** argv) {
  qz::bench::StayOnOneProcessor();
  if (argc == 2 && std::strcmp(argv[1], "--parts") == 0) {
    PrintParts();
  } else {
    PrintBaselineLines();
  }
  return 0;
}
