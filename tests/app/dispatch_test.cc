// Entry points, dispatch, the microphone and the client nanoapps.

#include <gmock/gmock.h>

#include "linked_nanoapp.h"

namespace qz::test {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using Nanoapp = LinkedNanoapp;

TEST_F(Nanoapp, StartsOnceAndDispatchesWhatItKnows) {
  Start();
  EXPECT_TRUE(nanoappStart());
  hub().DeliverToNanoapp(0, CHRE_EVENT_NANOAPP_STARTED, nullptr);
  EXPECT_THAT(TakeLog(), IsEmpty());
  for (const uint16_t type : {0x0000, 0x8204, 0x8206, 0x8207}) {
    hub().DeliverToNanoapp(0, type, nullptr);
  }
  EXPECT_THAT(TakeLog(), ElementsAre("W unknown event: 0", "W unknown event: 33284",
                                     "W unknown event: 33286", "W unknown event: 33287"));
  hub().End();
  EXPECT_THAT(TakeLog(), ElementsAre("I Stop"));
  EXPECT_TRUE(nanoappStart());
  EXPECT_THAT(TakeLog(), ElementsAre("I audio model initialization"));
  nanoappEnd();
}

TEST_F(Nanoapp, TakesTheFirstSuitableSource) {
  hub().sources().resize(5);
  hub().sources()[0].sample_rate_hz = 15999;
  hub().sources()[1].max_buffer_ns = 1'999'999'999;
  hub().sources()[2].min_buffer_ns = 2'000'000'001;
  hub().sources()[3].min_buffer_ns = hub().sources()[3].max_buffer_ns = 2'000'000'000;
  Start();
  RegisterClientNanoapp();
  EXPECT_TRUE(hub().sources()[3].enabled);
  EXPECT_EQ(hub().sources()[3].buffer_ns, 2'000'000'000u);
  EXPECT_EQ(hub().sources()[3].interval_ns, 2'000'000'000u);
  EXPECT_FALSE(hub().sources()[4].enabled);
}

TEST_F(Nanoapp, SourcesComeGoAndRefuse) {
  hub().sources().clear();
  Start();
  const uint32_t client = RegisterClientNanoapp();
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 257", "I Start",
                                     "W Found no suitable audio source"));
  // A second request, also of a registered client, looks again.
  hub().sources().emplace_back().refuses = true;
  hub().SendFromClientNanoapp(client, hub::kRegisterEvent);
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 257",
                                     "E SoundService: already registered", "I Start",
                                     "I Found suitable audio source", "I Enabling audio",
                                     "I Requested audio from handle 0, status: 0"));
  // The handle that was found stays known when the source is gone: no warning, and a refusal.
  hub().sources().clear();
  hub().SendFromClientNanoapp(client, hub::kRegisterEvent);
  EXPECT_THAT(
      TakeLog(),
      ElementsAre("I SoundService: registerClient 257", "E SoundService: already registered",
                  "I Start", "I Enabling audio", "I Requested audio from handle 0, status: 0"));
  hub().sources().emplace_back();
  hub().SendFromClientNanoapp(client, hub::kRegisterEvent);
  EXPECT_TRUE(audio());
  // A refused release counts as one: the next request asks again.
  hub().sources()[0].refuses = true;
  hub().SendFromClientNanoapp(client, hub::kUnregisterEvent);
  hub().SendFromClientNanoapp(client, hub::kRegisterEvent);
  EXPECT_EQ(TakeLog().back(), "I Requested audio from handle 0, status: 0");
}

TEST_F(Nanoapp, HoldsTheMicrophoneFromTheFirstClientToTheLast) {
  Start();
  const uint32_t first = RegisterClientNanoapp();
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 257", "I Start",
                                     "I Found suitable audio source", "I Enabling audio",
                                     "I Requested audio from handle 0, status: 1",
                                     "I audio sampling change for handle 0, suspended: 0"));
  const uint32_t second = RegisterClientNanoapp();
  hub().SetAudioSuspended(true);
  hub().SendFromClientNanoapp(first, hub::kUnregisterEvent);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I SoundService: registerClient 258",
                          "I audio sampling change for handle 0, suspended: 1",
                          "I SoundService: unregisterClient 257",
                          "I is_audio_enabled_ = 1; HostCount = 0; hasInternalClient = 1"));
  hub().SendFromClientNanoapp(second, hub::kUnregisterEvent);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I SoundService: unregisterClient 258",
                          "I is_audio_enabled_ = 1; HostCount = 0; hasInternalClient = 0", "I Stop",
                          "I Disabling audio"));
  EXPECT_FALSE(audio());
  EXPECT_EQ(hub().sources()[0].buffer_ns + hub().sources()[0].interval_ns, 0u);
  hub().SendFromClientNanoapp(second, hub::kUnregisterEvent);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I SoundService: unregisterClient 258", "E SoundService: not registered",
                          "I is_audio_enabled_ = 0; HostCount = 0; hasInternalClient = 0"));
}

TEST_F(Nanoapp, AStoppedClientIsForgottenButTheAudioGoesOn) {
  Start();
  hub().StopClientNanoapp(RegisterClientNanoapp());
  EXPECT_EQ(TakeLog().back(), "I SoundService: unregisterClient 257");
  EXPECT_TRUE(audio());
  hub().StopClientNanoapp(0xBAD);
  EXPECT_EQ(TakeLog().back(), "E SoundService: not registered");
}

TEST_F(Nanoapp, TheLastClientTakesTheSmoothedScoresAlong) {
  Start();
  stub_network.scores = [](int) { return Scores{0, 0.5f, 0, 0.5f, 0}; };
  for (int visit = 0; visit < 3; ++visit) {
    const uint32_t client = RegisterClientNanoapp();
    stub_network.runs = 0;
    events.clear();
    while (stub_network.runs == 0) PlayBuffer();
    const auto& bytes = events.back().bytes;
    const auto report = hub::DecodeFramedSoundReport(bytes.data(), bytes.size());
    ASSERT_TRUE(report.has_value());
    EXPECT_EQ(report->results[1].confidence, stub_network.runs * 0.5f / 16.0f) << visit;
    hub().SendFromClientNanoapp(client, hub::kUnregisterEvent);
  }
}

TEST_F(Nanoapp, DropsAudioOfAnotherLength) {
  Start();
  RegisterClientNanoapp();
  TakeLog();
  const std::vector<int16_t> samples(32001);
  for (const uint32_t count : {0, 31999, 32001}) hub().PlayAudio(samples.data(), count);
  const std::string warning = "W Audio data is not fully populated in chreAudioDataEvent.";
  EXPECT_THAT(TakeLog(), ElementsAre(warning, warning, warning));
  EXPECT_THAT(events, IsEmpty());
}

TEST_F(Nanoapp, PublishesToEachClientInOrderOfRegistration) {
  Start();
  const uint32_t first = RegisterClientNanoapp();
  const uint32_t second = RegisterClientNanoapp();
  const uint32_t third = RegisterClientNanoapp();
  hub().SendFromClientNanoapp(second, hub::kUnregisterEvent);
  hub().fault_plan().refuse_events = true;
  PlayBuffer();
  hub().fault_plan().refuse_events = false;
  EXPECT_THAT(events, IsEmpty());
  PlayBuffer();
  ASSERT_EQ(events.size(), 2u);
  EXPECT_EQ(events[0].receiver, first);
  EXPECT_EQ(events[1].receiver, third);
  EXPECT_EQ(events[0].bytes, events[1].bytes);

  // A copy that the heap refuses costs this client and all later ones the report.
  hub().heap().RefuseNth(2);
  PlayBuffer();
  EXPECT_EQ(events.size(), 2u);
}

}  // namespace
}  // namespace qz::test
