// Entry points, dispatch, the microphone and the client nanoapps.

#include <gmock/gmock.h>

#include "app_manager.h"
#include "chre/singleton.h"
#include "linked_nanoapp.h"

namespace qz::test {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using Nanoapp = LinkedNanoapp;

const std::vector<std::string> kAudioOn = {"I Start", "I Found suitable audio source",
                                           "I Enabling audio",
                                           "I Requested audio from handle 0, status: 1",
                                           "I audio sampling change for handle 0, suspended: 0"};

TEST_F(Nanoapp, StartsOnceAndAgainAfterItsEnd) {
  Start();
  EXPECT_TRUE(nanoappStart());
  EXPECT_THAT(TakeLog(), IsEmpty());
  hub().End();
  EXPECT_THAT(TakeLog(), ElementsAre("I Stop"));
  LinkedNanoapp::Start();
  EXPECT_TRUE(chre::Singleton<tarn::contexthub::sound::AppManager>::isInitialized());
}

TEST_F(Nanoapp, LogsUnknownEventsAndNothingElse) {
  Start();
  hub().DeliverToNanoapp(0, CHRE_EVENT_NANOAPP_STARTED, nullptr);
  EXPECT_THAT(TakeLog(), IsEmpty());
  for (const uint16_t type : {0x0000, 0x8204, 0x8206, 0x8207, 0xFFFF}) {
    hub().DeliverToNanoapp(0, type, nullptr);
  }
  EXPECT_THAT(TakeLog(),
              ElementsAre("W unknown event: 0", "W unknown event: 33284", "W unknown event: 33286",
                          "W unknown event: 33287", "W unknown event: 65535"));
}

TEST_F(Nanoapp, TakesTheFirstSuitableSource) {
  hub::AudioSource fast;
  fast.sample_rate_hz = 48000;
  hub::AudioSource short_buffers;
  short_buffers.max_buffer_ns = 1'999'999'999;
  hub::AudioSource long_buffers;
  long_buffers.min_buffer_ns = 2'000'000'001;
  hub::AudioSource exact;
  exact.min_buffer_ns = exact.max_buffer_ns = 2'000'000'000;
  hub().sources() = {fast, short_buffers, long_buffers, exact, {}};
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
  // A refused release counts as one.
  hub().sources()[0].refuses = true;
  hub().SendFromClientNanoapp(client, hub::kUnregisterEvent);
  TakeLog();
  hub().SendFromClientNanoapp(client, hub::kRegisterEvent);
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 257", "I Start",
                                     "I Found suitable audio source", "I Enabling audio",
                                     "I Requested audio from handle 0, status: 0"));
}

TEST_F(Nanoapp, HoldsTheMicrophoneFromTheFirstClientToTheLast) {
  Start();
  const uint32_t first = RegisterClientNanoapp();
  std::vector<std::string> expected = {"I SoundService: registerClient 257"};
  expected.insert(expected.end(), kAudioOn.begin(), kAudioOn.end());
  EXPECT_EQ(TakeLog(), expected);
  const uint32_t second = RegisterClientNanoapp();
  EXPECT_THAT(TakeLog(), ElementsAre("I SoundService: registerClient 258"));
  hub().SetAudioSuspended(true);
  EXPECT_THAT(TakeLog(), ElementsAre("I audio sampling change for handle 0, suspended: 1"));
  hub().SendFromClientNanoapp(first, hub::kUnregisterEvent);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I SoundService: unregisterClient 257",
                          "I is_audio_enabled_ = 1; HostCount = 0; hasInternalClient = 1"));
  hub().SendFromClientNanoapp(second, hub::kUnregisterEvent);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I SoundService: unregisterClient 258",
                          "I is_audio_enabled_ = 1; HostCount = 0; hasInternalClient = 0", "I Stop",
                          "I Disabling audio"));
  EXPECT_FALSE(audio());
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
  PlayBuffer();
  EXPECT_THAT(events, IsEmpty());
  hub().StopClientNanoapp(0xBAD);
  EXPECT_EQ(TakeLog().back(), "E SoundService: not registered");
}

TEST_F(Nanoapp, DropsAudioOfAnotherLength) {
  Start();
  RegisterClientNanoapp();
  TakeLog();
  const std::vector<int16_t> samples(32001);
  hub().PlayAudio(samples.data(), 31999);
  hub().PlayAudio(samples.data(), 32001);
  hub().PlayAudio(samples.data(), 0);
  const std::string warning = "W Audio data is not fully populated in chreAudioDataEvent.";
  EXPECT_THAT(TakeLog(), ElementsAre(warning, warning, warning));
  EXPECT_THAT(events, IsEmpty());
  PlayBuffer();
  EXPECT_EQ(events.size(), 1u);
}

TEST_F(Nanoapp, PublishesToEachClientInOrderOfRegistration) {
  Start();
  const uint32_t first = RegisterClientNanoapp();
  const uint32_t second = RegisterClientNanoapp();
  const uint32_t third = RegisterClientNanoapp();
  hub().SendFromClientNanoapp(second, hub::kUnregisterEvent);
  stub_network.scores = [](int) { return Scores{0, 0.5f, 0, 0.25f, 0}; };
  while (stub_network.runs == 0) PlayBuffer();
  ASSERT_GE(events.size(), 2u);
  const Received& to_first = events[events.size() - 2];
  const Received& to_third = events.back();
  EXPECT_EQ(to_first.receiver, first);
  EXPECT_EQ(to_third.receiver, third);
  EXPECT_EQ(to_first.type, hub::kReportEvent);
  EXPECT_EQ(to_first.bytes, to_third.bytes);
  const auto report = hub::DecodeFramedSoundReport(to_first.bytes.data(), to_first.bytes.size());
  ASSERT_TRUE(report.has_value());
  EXPECT_EQ(report->model_version, 202208270u);
  EXPECT_EQ(report->response_time_ns, hub().TimeNs());
  EXPECT_EQ(report->timestamp_ns, hub().TimeNs() + 500);
  ASSERT_EQ(report->results.size(), 2u);
  EXPECT_EQ(report->results[0].category, 6u);
  EXPECT_EQ(report->results[0].confidence, stub_network.runs * 0.5f / 5.0f);
  EXPECT_EQ(report->results[1].category, 15u);
  EXPECT_EQ(report->results[1].confidence, stub_network.runs * 0.25f / 16.0f);
}

}  // namespace
}  // namespace qz::test
