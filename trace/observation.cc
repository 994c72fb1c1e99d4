// SPDX-License-Identifier: Apache-2.0
// The front end and the network of the linked nanoapp, observed: the linker hands the nanoapp's
// calls of NAME to __wrap_NAME, and __real_NAME is the function itself.

#include <cstring>

#include "frontend/audio_frontend.h"
#include "network/network.h"
#include "network/stream_backend.h"
#include "network/stream_engine.h"
#include "trace/recorder.h"

namespace qz::trace {
namespace {

Recorder* recorder = nullptr;

std::vector<uint8_t> ScoreBytes(const float* scores) {
  std::vector<uint8_t> bytes;
  for (size_t i = 0; i < config::kClasses; ++i) {
    uint32_t bits = 0;
    std::memcpy(&bits, scores + i, sizeof bits);
    AppendLittleEndian(bits, sizeof bits, &bytes);
  }
  return bytes;
}

void RunOperators() {
  for (uint32_t op = 0; op < kOperatorsPerRun; ++op) {
    network::RunOperator(op, network::arena, network::module_weights);
    const config::Tensor& out = config::kOperators[op].output;
    if (op == kScoresOperator) {
      recorder->OnOutput(op, config::kClasses, ScoreBytes(network::ScoresOf(network::arena)));
    } else {
      const int8_t* values = network::BytesOf(network::arena, out);
      recorder->OnOutput(op, static_cast<uint32_t>(out.channels), {values, values + out.Bytes()});
    }
  }
}

// The newest rows of each operator: as many as a window has. Of the last one the scores.
std::vector<uint8_t> newest[kOperatorsPerRun];

void KeepRows(size_t op, const int8_t* rows, size_t count) {
  const config::Tensor& window = config::kOperators[op].output;
  std::vector<uint8_t>& kept = newest[op];
  kept.insert(kept.end(), rows, rows + count * window.channels);
  if (kept.size() <= window.Bytes()) return;
  kept.erase(kept.begin(), kept.end() - static_cast<ptrdiff_t>(window.Bytes()));
}
void KeepRows(size_t op, const float* scores, size_t) { newest[op] = ScoreBytes(scores); }

bool PushObserved(const int8_t* frame) {
  const auto keep = [](size_t op, const auto* rows, size_t count) { KeepRows(op, rows, count); };
  const bool scored =
      network::StreamEngine(network::module_weights, &network::module_stream, keep).Push(frame);
  for (uint32_t op = 0; scored && op < kOperatorsPerRun; ++op) {
    recorder->OnOutput(op, static_cast<uint32_t>(config::kOperators[op].channels), newest[op]);
  }
  return scored;
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

bool __wrap_stream_backend_push(const int8_t* frame);
bool __wrap_stream_backend_push(const int8_t* frame) { return qz::trace::PushObserved(frame); }

}  // extern "C"
