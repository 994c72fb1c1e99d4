// SPDX-License-Identifier: Apache-2.0
// The whole system: the module, loaded as on a device, on a hub with several clients of both kinds.

#include <set>

#include "base/digest.h"
#include "hub/messages.h"
#include "tests/support/random.h"
#include "tests/support/test_hub.h"

namespace qz::test {
namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::Not;
using Bytes = std::vector<uint8_t>;

constexpr uint32_t kBufferSamples = 32000;

// Sound with something in it: bursts of tones and noise of changing loudness, the same on every
// machine.
std::vector<int16_t> Recording(size_t buffers) {
  Random random(7);
  std::vector<int16_t> samples;
  int64_t period = 0;
  int64_t loudness = 0;
  for (size_t i = 0; i < buffers * kBufferSamples; ++i) {
    if (i % 4000 == 0) {
      period = random.Between(8, 120);
      loudness = random.Between(0, 3) == 0 ? 0 : int64_t{1} << random.Between(4, 12);
    }
    const int64_t square = static_cast<int64_t>(i) / period % 2 * 2 - 1;
    samples.push_back(static_cast<int16_t>(square * loudness + random.Between(-20, 20)));
  }
  return samples;
}

struct Detected {
  std::vector<std::string> messages;  // to host endpoints
  std::vector<Bytes> reports;         // to the client nanoapps, in turn
};

// Three host clients and two client nanoapps are connected for the whole recording.
Detected Listen(const std::vector<int16_t>& samples) {
  TestHub runtime(/*host_time_offset_ns=*/-1000);
  hub::Hub& hub = runtime.hub;
  hub.sources().emplace_back();
  hub::LoadFailure failure;
  EXPECT_TRUE(hub.Start(QZ_MODULE, &failure)) << failure.message;
  const uint32_t nanoapps[] = {runtime.RegisterClientNanoapp(), runtime.RegisterClientNanoapp()};
  for (uint16_t host = 1; host <= 3; ++host) {
    runtime.Connect(host);
    runtime.Query(host);
    runtime.Enable(host, host);
  }
  for (size_t at = 0; at < samples.size(); at += kBufferSamples) {
    hub.PlayAudio(samples.data() + at, kBufferSamples);
  }
  for (uint16_t host = 1; host <= 3; ++host) runtime.Disable(host, host);
  for (const uint32_t id : nanoapps) runtime.Unregister(id);
  EXPECT_FALSE(hub.audio_enabled());
  hub.End();
  Detected detected = {runtime.TakeMessages(), {}};
  for (const Received& event : runtime.events) {
    EXPECT_EQ(event.receiver, nanoapps[detected.reports.size() % 2]);
    detected.reports.push_back(event.bytes);
  }
  return detected;
}

TEST(LoadedModule, ServesHostsAndNanoappsFromOneRecording) {
  constexpr size_t kBuffers = 10;
  const Detected detected = Listen(Recording(kBuffers));
  EXPECT_THAT(detected.messages,
              ElementsAre("2@1", "4@1", "2@2", "4@2", "2@3", "4@3", "6@1", "6@2", "6@3"));
  ASSERT_EQ(detected.reports.size(), 2 * kBuffers);
  std::set<float> seen;
  uint64_t digest = base::kEmptyDigest;
  for (size_t pass = 0; pass < kBuffers; ++pass) {
    const Bytes& bytes = detected.reports[2 * pass];
    EXPECT_EQ(detected.reports[2 * pass + 1], bytes);
    digest = base::Digest(bytes.data(), bytes.size(), digest);
    const auto report = hub::DecodeFramedSoundReport(bytes.data(), bytes.size());
    ASSERT_TRUE(report.has_value());
    EXPECT_EQ(report->model_version, 202208270u);
    EXPECT_EQ(report->response_time_ns, uint64_t{pass + 1} * 2'000'000'000);
    EXPECT_EQ(report->timestamp_ns, report->response_time_ns - 1000);
    for (const hub::SoundResult& result : report->results) seen.insert(result.confidence);
    // The window is not full in the first pass.
    EXPECT_EQ(seen == std::set<float>{0.0f}, pass == 0);
  }
  EXPECT_GT(seen.size(), kBuffers) << "the scores don't depend on the sound";
  // Recorded: the same on every machine and in every build.
  EXPECT_EQ(digest, 0x6F9AA3DA2058A843u);
  // Every load starts from the same state.
  EXPECT_EQ(Listen(Recording(kBuffers)).reports, detected.reports);
}

TEST(LoadedModule, RunsWithoutAudioWhereTheRuntimeLacksAFunction) {
  const std::pair<const char*, const char*> kModules[] = {
      {QZ_MODULE_WITHOUT_AUDIO, "W Found no suitable audio source"},
      {QZ_MODULE_WITHOUT_CONFIGURE, "I Requested audio from handle 0, status: 0"}};
  for (const auto& [module, line] : kModules) {
    TestHub runtime;
    hub::Hub& hub = runtime.hub;
    hub.sources().emplace_back();
    hub::LoadFailure failure;
    ASSERT_TRUE(hub.Start(module, &failure)) << failure.message;
    runtime.Connect(1);
    for (int visit = 0; visit < 2; ++visit) {
      runtime.Enable(1, 1);
      runtime.Disable(1, 1);
      const std::vector<std::string> log = runtime.TakeLog();
      EXPECT_THAT(log, Contains(line));
      EXPECT_THAT(log, Not(Contains("I Stop")));
    }
    EXPECT_THAT(runtime.TakeMessages(), ElementsAre("4@1", "6@1", "4@1", "6@1"));
  }
}

}  // namespace
}  // namespace qz::test
