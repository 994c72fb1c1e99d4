// SPDX-License-Identifier: Apache-2.0
// The front end and the network of the linked nanoapp, observed: the linker hands the nanoapp's
// calls of NAME to __wrap_NAME, and __real_NAME is the function itself.

#include <cstring>

#include "frontend/audio_frontend.h"
#include "network/network.h"
#include "trace/recorder.h"

namespace qz::trace {
namespace {

Recorder* recorder = nullptr;

std::vector<uint8_t> ScoreBytes() {
  std::vector<uint8_t> bytes;
  for (size_t i = 0; i < config::kClasses; ++i) {
    uint32_t bits = 0;
    std::memcpy(&bits, network::ScoresOf(network::arena) + i, sizeof bits);
    AppendLittleEndian(bits, sizeof bits, &bytes);
  }
  return bytes;
}

void RunOperators() {
  for (uint32_t op = 0; op < kOperatorsPerRun; ++op) {
    network::RunOperator(op, network::arena, network::module_weights);
    const config::Tensor& out = config::kOperators[op].output;
    if (op == kScoresOperator) {
      recorder->OnOutput(op, config::kClasses, ScoreBytes());
    } else {
      const int8_t* values = network::BytesOf(network::arena, out);
      recorder->OnOutput(op, static_cast<uint32_t>(out.channels), {values, values + out.Bytes()});
    }
  }
}

}  // namespace

void ObserveLinkedNanoapp(Recorder* observer) { recorder = observer; }

}  // namespace qz::trace

extern "C" {

void __real_audio_frontend_invoke(void);

void __wrap_audio_frontend_invoke(void);
void __wrap_audio_frontend_invoke(void) {
  __real_audio_frontend_invoke();
  qz::trace::recorder->OnFeatures(audio_frontend_output_ptr, qz::frontend::kFeatureChannels);
}

void __wrap_mobilenet_backend_invoke(void);
void __wrap_mobilenet_backend_invoke(void) { qz::trace::RunOperators(); }

}  // extern "C"
