// SPDX-License-Identifier: Apache-2.0
// Runs a frame, a run of the network, a pass and a whole audio event, each between two marks, for
// the emulator's instruction counter on the device's processor; scripts/footprint makes averages of
// them. Prints a line for each kind, in the order of the marks: its name and how many pairs of
// marks it has. On a PC scripts/instruction-counts.py runs it under callgrind, which needs no
// marks.
//
// The module's components are linked in, over a runtime that does next to nothing, so that its own
// instructions hardly count.

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <vector>

#include "app/nanoapp.h"
#include "app/sound_service.h"
#include "bench/minimal_runtime.h"
#include "chre.h"
#include "classifier/audio_classifier.h"
#include "config/detector.h"
#include "frontend/audio_frontend.h"
#ifdef QZ_MEASURES_stream
#include "network/stream_backend.h"
#else
#include "network/mobilenet_backend.h"
#endif
#include "tests/support/instruction_mark.h"
#include "tests/support/random.h"

namespace {

using qz::config::kBufferSamples;
using qz::config::kFeatureChannels;
using qz::config::kFrameSamples;
using qz::config::kHopSamples;
using qz::config::kWindowFrames;
using qz::test::Mark;

// Whole periods of the cadence: 200 frames a pass and a run every 64 frames make 25 runs in 8.
constexpr int kPasses = 8;
constexpr int kFrames = 200;
constexpr int kRuns = 8;

// Noise that swells from silence to full scale and drops again twice a second, always the same:
// what a frame costs depends a little on how loud it is.
std::vector<int16_t> Sound() {
  constexpr size_t kPeriod = 8000;
  qz::test::Random random(1);
  std::vector<int16_t> samples(kBufferSamples * kPasses);
  for (size_t i = 0; i < samples.size(); ++i) {
    const int64_t peak = static_cast<int64_t>(i % kPeriod) * 32767 / kPeriod;
    samples[i] = static_cast<int16_t>(random.Between(-peak, peak));
  }
  return samples;
}

template <typename Prepare, typename Work>
void Count(const char* name, int times, Prepare prepare, Work work) {
  for (int i = 0; i < times; ++i) {
    prepare(i);
    Mark();
    work(i);
    Mark();
  }
  std::printf("%s %d\n", name, times);
}

#ifdef QZ_MEASURES_stream
using qz::config::kFramesBetweenRuns;

// What the frames from one run to the next cost; then what each of them does.
void CountNetwork() {
  const size_t frames = kWindowFrames + kRuns * kFramesBetweenRuns;
  const auto values =
      qz::test::Random(2).Fill<int8_t>((frames + kFramesBetweenRuns) * kFeatureChannels, -128, 127);
  const int8_t* next = values.data();
  const auto push = [&](int) {
    stream_backend_push(next);
    next += kFeatureChannels;
  };
  for (size_t i = 0; i < kWindowFrames; ++i) push(0);
  const auto run = [&](int) {
    for (size_t i = 0; i < kFramesBetweenRuns; ++i) push(0);
  };
  Count(
      "network_run", kRuns, [](int) {}, run);
  Count(
      "network_frame", kFramesBetweenRuns, [](int) {}, push);
}
#else
void CountNetwork() {
  const auto window = qz::test::Random(2).Fill<int8_t>(kWindowFrames * kFeatureChannels, -128, 127);
  const auto fill_window = [&](int) {
    std::memcpy(mobilenet_backend_input_ptr, window.data(), window.size());
  };
  const auto run = [](int) { mobilenet_backend_invoke(); };
  fill_window(0);
  run(0);
  Count("network_run", kRuns, fill_window, run);
  Count("network_frame", 1, fill_window, run);
}
#endif

}  // namespace

int main() {
  const std::vector<int16_t> sound = Sound();
  const auto nothing = [](int) {};
  Mark();
  Mark();  // the first marks pay for what is looked up once
  Count("nothing", 1, nothing, nothing);

  const auto fill_frame = [&](int i) {
    std::memcpy(audio_frontend_input_ptr, sound.data() + i * kHopSamples,
                kFrameSamples * sizeof(int16_t));
  };
  const auto frame = [](int) { audio_frontend_invoke(); };
  for (int i = 0; i < kFrames; ++i) {
    fill_frame(i);
    frame(i);
  }
  Count("frame", kFrames, fill_frame, frame);

  CountNetwork();

  tarn::contexthub::sound::AudioClassifier classifier;
  const auto pass = [&](int i) {
    tarn::contexthub::sound::ConfidenceEvent report[2] = {};
    uint32_t version = 0;
    classifier.Classify(sound.data() + i * kBufferSamples, report, 2, &version);
  };
  for (int i = 0; i < kPasses; ++i) pass(i);
  Count("pass", kPasses, nothing, pass);

  // One client nanoapp, which gets a report an event.
  nanoappStart();
  nanoappHandleEvent(1, tarn::contexthub::sound::kSoundServiceRegisterEvent, nullptr);
  const auto event = [&](int i) {
    chreAudioDataEvent data = {};
    data.sampleCount = kBufferSamples;
    data.samplesS16 = sound.data() + i * kBufferSamples;
    nanoappHandleEvent(0, CHRE_EVENT_AUDIO_DATA, &data);
  };
  for (int i = 0; i < kPasses; ++i) event(i);
  qz::bench::sent = {};
  Count("event", kPasses, nothing, event);
  nanoappEnd();
  if (qz::bench::sent.events != kPasses) {
    std::fprintf(stderr, "counts: %u reports, expected %d\n", qz::bench::sent.events, kPasses);
    return 1;
  }
  return 0;
}
