// SPDX-License-Identifier: Apache-2.0
// Entry points, dispatch, the microphone and the client nanoapps.

#include "tests/app/linked_nanoapp.h"

namespace qz::test {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using Nanoapp = LinkedNanoapp;

TEST_F(Nanoapp, StartsOnceAndLogsUnknownEvents) {
  EXPECT_TRUE(nanoappStart());
  hub.DeliverToNanoapp(0, CHRE_EVENT_NANOAPP_STARTED, nullptr);
  EXPECT_THAT(TakeLog(), IsEmpty());
  for (const uint16_t type : {0x0000, 0x8204, 0x8206, 0x8207}) {
    hub.DeliverToNanoapp(0, type, nullptr);
  }
  hub.End();
  EXPECT_TRUE(nanoappStart());
  EXPECT_THAT(TakeLog(),
              ElementsAre("W unknown event: 0", "W unknown event: 33284", "W unknown event: 33286",
                          "W unknown event: 33287", "I Stop", "I audio model initialization"));
  nanoappEnd();
}

TEST_F(Nanoapp, TakesTheFirstSuitableSource) {
  auto& sources = hub.sources();
  sources.resize(6);
  sources[0].sample_rate_hz = 15999;
  sources[1].max_buffer_ns = 1'999'999'999;
  sources[2].min_buffer_ns = 2'000'000'001;
  sources[3].sample_rate_hz = 48000;
  sources[4].min_buffer_ns = sources[4].max_buffer_ns = 2'000'000'000;
  RegisterClientNanoapp();
  EXPECT_EQ(sources[4].buffer_ns, 2'000'000'000u);
  EXPECT_EQ(sources[4].interval_ns, 2'000'000'000u);
  const std::vector<std::string> lines = TakeLog();
  EXPECT_EQ(lines[lines.size() - 2], "I Requested audio from handle 4, status: 1");
  EXPECT_EQ(lines.back(), "I audio sampling change for handle 4, suspended: 0");
}

TEST_F(Nanoapp, SourcesComeGoAndRefuse) {
  hub.sources().clear();
  const uint32_t client = RegisterClientNanoapp();
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 257", "I Start",
                                     "W Found no suitable audio source"));
  // A second request, also of a registered client, looks again.
  hub.sources().emplace_back().refuses = true;
  Register(client);
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 257",
                                     "E SoundService: already registered", "I Start",
                                     "I Found suitable audio source", "I Enabling audio",
                                     "I Requested audio from handle 0, status: 0"));
  // While audio is off the last client's leave stops nothing, and the end gives nothing back.
  Unregister(client);
  hub.End();
  EXPECT_THAT(
      TakeLog(),
      ElementsAre("I SoundService: unregisterClient 257",
                  "I is_audio_enabled_ = 0; HostCount = 0; hasInternalClient = 0", "I Stop"));
  Start();
  Register(client);
  // The handle that was found stays known when the source is gone: no warning, and a refusal.
  hub.sources().clear();
  Register(client);
  EXPECT_EQ(TakeLog().back(), "I Requested audio from handle 0, status: 0");
  hub.sources().emplace_back();
  Register(client);
  EXPECT_TRUE(audio());
  // A refused release counts as one: the next request asks again.
  hub.sources()[0].refuses = true;
  Unregister(client);
  Register(client);
  EXPECT_EQ(TakeLog().back(), "I Requested audio from handle 0, status: 0");
}

TEST_F(Nanoapp, SmoothedScoresAreClearedWithTheLastClient) {
  for (int visit = 0; visit < 3; ++visit) {
    const uint32_t client = RegisterClientNanoapp();
    const int before = stub_network.runs;
    PlayRun({0, 0.5f, 0, 0.5f, 0});
    const auto& bytes = events.back().bytes;
    const auto report = hub::DecodeFramedSoundReport(bytes.data(), bytes.size());
    ASSERT_TRUE(report.has_value());
    EXPECT_EQ(report->results[1].confidence, (stub_network.runs - before) * 0.5f / 16.0f) << visit;
    Unregister(client);
  }
}

TEST_F(Nanoapp, PublishesToEachClientInOrderOfRegistration) {
  const uint32_t first = RegisterClientNanoapp();
  TakeLog();
  const uint32_t second = RegisterClientNanoapp();
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 258"));
  const uint32_t third = RegisterClientNanoapp();
  Unregister(second);
  hub.fault_plan().refuse_events = true;
  PlayBuffer();
  hub.fault_plan().refuse_events = false;
  EXPECT_THAT(events, IsEmpty());
  PlayBuffer();
  ASSERT_EQ(events.size(), 2u);
  EXPECT_EQ(events[0].receiver, first);
  EXPECT_EQ(events[1].receiver, third);
  EXPECT_EQ(events[0].bytes, events[1].bytes);

  // A copy that the heap refuses costs this client and all later ones the report.
  hub.heap().RefuseNth(2);
  PlayBuffer();
  EXPECT_EQ(events.size(), 2u);

  // Audio of another length makes no report.
  TakeLog();
  const std::vector<int16_t> samples(32001);
  for (const uint32_t count : {0, 31999, 32001}) hub.PlayAudio(samples.data(), count);
  const std::string warning = "W Audio data is not fully populated in chreAudioDataEvent.";
  EXPECT_THAT(TakeLog(), ElementsAre(warning, warning, warning));
  EXPECT_EQ(events.size(), 2u);
}

}  // namespace
}  // namespace qz::test
