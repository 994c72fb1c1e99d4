// SPDX-License-Identifier: Apache-2.0
#include "tests/support/stub_network.h"

#include <algorithm>

#include "config/network.h"
#include "network/mobilenet_backend.h"

namespace {

int8_t input[qz::config::kWindow.Bytes()];
float output[qz::config::kClasses];

}  // namespace

int8_t* const mobilenet_backend_input_ptr = input;
const float* const mobilenet_backend_output_ptr = output;

void mobilenet_backend_invoke() {
  auto& network = qz::test::stub_network;
  network.windows.emplace_back(std::begin(input), std::end(input));
  const auto scores = network.scores ? network.scores(network.runs) : qz::test::Scores{};
  ++network.runs;
  std::copy(scores.begin(), scores.end(), output);
}
