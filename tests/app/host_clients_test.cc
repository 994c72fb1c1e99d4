// SPDX-License-Identifier: Apache-2.0
// Host clients: requests, answers, the map of clients, and broadcasts.

#include <set>

#include "app/app_manager.h"
#include "chre/singleton.h"
#include "tests/app/linked_nanoapp.h"
#include "tests/support/random.h"

namespace qz::test {
namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::MatchesRegex;
using Bytes = std::vector<uint8_t>;

class HostClients : public LinkedNanoapp {
 protected:
  HostClients() {
    for (uint16_t endpoint = 0x10; endpoint < 0x20; ++endpoint) Connect(endpoint);
  }
};

// Detected for outputs 0 and 4.
constexpr Scores kDetected = {0.75f, 0, 0, 0, 0.625f};

TEST_F(HostClients, AQueryIsAnsweredAlwaysTheSame) {
  for (const Bytes& payload : {Bytes{}, Bytes{0xFF, 0x00, 0xAB}}) {
    Query(0x1F, payload);
    EXPECT_EQ(messages.back().bytes,
              (Bytes{0x08, 0x00, 0x08, 0x06, 0x08, 0x11, 0x08, 0x0F, 0x08, 0x12}));
  }
  EXPECT_THAT(TakeMessages(), ElementsAre("2@31", "2@31"));
  const std::string result = "I Result of sending query response: 1";
  EXPECT_THAT(TakeLog(), ElementsAre(result, result));
  for (const uint32_t type : {0u, 2u, 7u}) hub.SendFromHost(0x1F, type, {1, 2, 3});
  EXPECT_THAT(messages, IsEmpty());
  EXPECT_EQ(log.size(), 3u);
  EXPECT_THAT(log.back(), MatchesRegex("I Got message from host with type 7 size 3 data @ "
                                       "0x[0-9a-f]+ hostEndpoint 0x1f"));
}

TEST_F(HostClients, TheMicrophoneIsHeldFromTheFirstClientOfAnyKindToTheLast) {
  const uint32_t nanoapp = RegisterClientNanoapp();
  Enable(0x10, 5);
  Enable(0x11, 6);
  hub.SetAudioSuspended(true);
  Unregister(nanoapp);
  // From another endpoint than its own: the answer goes where the request came from.
  Disable(0x1F, 5);
  EXPECT_TRUE(audio());
  Disable(0x11, 6);
  EXPECT_FALSE(audio());
  EXPECT_EQ(hub.sources()[0].buffer_ns + hub.sources()[0].interval_ns, 0u);
  Disable(0x11, 6);
  EXPECT_THAT(TakeMessages(), ElementsAre("4@16", "4@17", "6@31", "6@17"));
  EXPECT_THAT(
      TakeLog(),
      ElementsAre("I SoundService: registerClient 257", "I Start", "I Found suitable audio source",
                  "I Enabling audio", "I Requested audio from handle 0, status: 1",
                  "I audio sampling change for handle 0, suspended: 0", "I Add host end point: 16",
                  "I Result of sending enable response: 1", "I Add host end point: 17",
                  "I Result of sending enable response: 1",
                  "I audio sampling change for handle 0, suspended: 1",
                  "I SoundService: unregisterClient 257",
                  "I is_audio_enabled_ = 1; HostCount = 2; hasInternalClient = 0",
                  "I is_audio_enabled_ = 1; HostCount = 1; hasInternalClient = 0",
                  "I Result of sending disable respones: 1",
                  "I is_audio_enabled_ = 1; HostCount = 0; hasInternalClient = 0", "I Stop",
                  "I Disabling audio", "I Result of sending disable respones: 1",
                  "W Unregistered client ID for disable request: 6"));
}

TEST_F(HostClients, AClientNanoappKeepsTheAudioUntilItLeaves) {
  Enable(0x10, 1);
  const uint32_t first = RegisterClientNanoapp();
  const uint32_t second = RegisterClientNanoapp();
  Disable(0x10, 1);
  Unregister(first);
  EXPECT_EQ(TakeLog().back(), "I is_audio_enabled_ = 1; HostCount = 0; hasInternalClient = 1");
  // One that is stopped is forgotten, but the audio goes on.
  hub.StopClientNanoapp(second);
  EXPECT_EQ(TakeLog().back(), "I SoundService: unregisterClient 258");
  EXPECT_TRUE(audio());
  Unregister(second);
  EXPECT_FALSE(audio());
  EXPECT_THAT(TakeLog(), Contains("E SoundService: not registered"));
}

TEST_F(HostClients, TheMapServesEightAndRefusesWhatWouldNotBeUnique) {
  for (uint16_t i = 0; i < 8; ++i) Enable(static_cast<uint16_t>(0x10 + i), 100u + i);
  TakeLog();
  Enable(0x18, 108);
  Enable(0x11, 100);
  Enable(0xFFFF, 102);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I Add host end point: 24", "W Client id and host endpoint map is full!",
                          "W Unable to serve new host endpoint 24",
                          "I Duplicate enable request received from client ID: 100",
                          "I Add host end point: 17", "W Host endpoint 17 is already used.",
                          "W Unable to serve new host endpoint 17",
                          "I Duplicate enable request received from client ID: 102",
                          "I Add host end point: 65535", "W Invalid host endpoint: 65535",
                          "W Unable to serve new host endpoint 65535"));
  // The old pairing of client 100 stays removed: its endpoint is free.
  Enable(0x10, 109);
  Enable(0x1A, 101);  // moves to the end, to a new endpoint
  Enable(0x1B, 110);
  Enable(0x1C, 111);  // one too many
  EXPECT_EQ(TakeLog().back(), "W Unable to serve new host endpoint 28");
  hub.DisconnectHostEndpoint(0x13);
  RegisterClientNanoapp();
  TakeMessages();
  PlayRun(kDetected);
  ASSERT_EQ(messages.size(), 7u);
  const Bytes bytes = messages[0].bytes;
  for (const Received& message : messages) EXPECT_EQ(message.bytes, bytes);
  EXPECT_THAT(TakeMessages(), ElementsAre("7@20", "7@21", "7@22", "7@23", "7@16", "7@26", "7@27"));
  const auto report = hub::DecodeSoundReport(bytes.data(), bytes.size());
  ASSERT_TRUE(report.has_value());
  EXPECT_EQ(report->model_version, 202208271u);
  EXPECT_EQ(report->timestamp_ns, hub.TimeNs() + 500);
  ASSERT_EQ(report->results.size(), 2u);
  EXPECT_EQ(report->results[1].category, 18u);
  EXPECT_EQ(report->results[1].confidence, 0.625f);
  // A client nanoapp receives no detection.
  for (const Received& event : events) EXPECT_EQ(event.type, hub::kReportEvent);
}

TEST_F(HostClients, RawAudioReachesEveryHost) {
  Enable(0x10, 1);
  Enable(0x11, 2);
  const uint8_t audio_bytes[] = {0xAA, 0xBB, 0xCC};
  tarn::contexthub::sound::RawAudioInfo info{3, audio_bytes};
  auto* manager = chre::Singleton<tarn::contexthub::sound::AppManager>::get();
  manager->OnRawAudioTransmissibleSegment(1, 2, &info);
  hub.DeliverToNanoapp(0, CHRE_EVENT_NANOAPP_STARTED, nullptr);
  EXPECT_EQ(messages.back().bytes, (Bytes{0x08, 1, 0x10, 2, 0x1A, 3, 0xAA, 0xBB, 0xCC}));
  EXPECT_THAT(TakeMessages(), ElementsAre("4@16", "4@17", "8@16", "8@17"));
  TakeLog();

  // No memory for the segment, then for the first host's copy alone.
  hub.heap().RefuseNth(1);
  manager->OnRawAudioTransmissibleSegment(1, 2, &info);
  hub.heap().RefuseNth(2);
  manager->OnRawAudioTransmissibleSegment(1, 2, &info);
  hub.DeliverToNanoapp(0, CHRE_EVENT_NANOAPP_STARTED, nullptr);
  EXPECT_THAT(TakeMessages(), ElementsAre("8@17"));
  const std::string raw_failed = "E Failed to send RAW_AUDIO_SEGMENT message to host client.";
  EXPECT_THAT(TakeLog(), ElementsAre("E OOM at sound_detection_proto_helper.cc:124",
                                     "E Failed to encode raw audio segment.", raw_failed));

  // Every way to send fails, is logged, and changes nothing else.
  hub.fault_plan().refuse_host_messages = true;
  manager->OnRawAudioTransmissibleSegment(1, 2, &info);
  Query(0x12);
  Enable(0x12, 3);
  Disable(0x12, 3);
  PlayRun(kDetected);
  const std::string failed = "E Failed to send SOUND_EVENT_DETECTION message to host.";
  EXPECT_THAT(TakeLog(),
              ElementsAre(raw_failed, raw_failed, "I Result of sending query response: 0",
                          "I Add host end point: 18", "I Result of sending enable response: 0",
                          "I is_audio_enabled_ = 1; HostCount = 2; hasInternalClient = 0",
                          "I Result of sending disable respones: 0", failed, failed));
}

TEST_F(HostClients, HostilePayloadsEndInALogLine) {
  Random random(20220827);
  for (int i = 0; i < 20000; ++i) {
    const Bytes payload = random.Fill<uint8_t>(static_cast<size_t>(random.Between(0, 40)), 0, 255);
    const auto type = static_cast<uint32_t>(random.Between(0, 9));
    hub.SendFromHost(static_cast<uint16_t>(random.Between(0x10, 0x1F)), type, payload);
  }
  const std::vector<std::string> lines = TakeLog();
  EXPECT_THAT(lines, Contains(HasSubstr("Unable to decode message SoundDetectionEnableRequest,")));
  EXPECT_THAT(lines, Contains(HasSubstr("Unable to decode message, ")));
  const Bytes oversized(100'000, 0x08);
  hub.SendFromHost(0x10, hub::kEnableRequest, oversized);
  hub.SendFromHost(0x10, hub::kDisableRequest, oversized);
  for (uint32_t id = 0; id < 256; ++id) Disable(0x10, id);
  EXPECT_FALSE(audio());
  TakeMessages();
  Enable(0x10, 1);
  PlayRun(kDetected);
  EXPECT_THAT(TakeMessages(), ElementsAre("4@16", "7@16"));
}

// Nothing leaks, nothing is freed twice, the log reports which work was dropped, and the next good
// request works.
TEST_F(HostClients, EveryRefusedAllocationDropsItsWorkAlone) {
  std::set<std::string> errors;
  uint64_t refusals = 0;
  for (bool refused = true; refused; ++refusals) {
    ASSERT_LT(refusals, 100u);
    Start();
    hub.heap().RefuseNth(refusals + 1);
    Query(0x10);
    Enable(0x10, 1);
    Enable(0x11, 2);
    uint32_t clients[3];
    for (uint32_t& client : clients) client = RegisterClientNanoapp();
    PlayRun(kDetected);
    for (const uint32_t client : clients) Unregister(client);
    Disable(0x10, 1);
    Disable(0x11, 2);
    refused = hub.heap().refused();
    hub.heap().RefuseNth(0);
    size_t lines = 0;
    for (const std::string& line : TakeLog()) {
      if (line[0] != 'E' || line.find("not registered") != std::string::npos) continue;
      errors.insert(line.substr(0, line.find('#')));
      ++lines;
    }
    EXPECT_EQ(lines > 0, refused) << "refusal " << refusals;
    messages.clear();
    Query(0x10);
    EXPECT_EQ(messages.size(), 1u);
    hub.End();
    EXPECT_EQ(hub.heap().live_blocks(), 0u) << "refusal " << refusals;
  }
  EXPECT_THAT(
      errors,
      testing::IsSupersetOf(
          {"E OOM at app_manager.cc:174", "E SoundService: failed to register",
           "E OOM at sound_detection_proto_helper.cc:155",
           "E Failed to encode detection response message.", "E Unable to encode response message",
           "E Failed to send SOUND_EVENT_DETECTION message to host.",
           "E Failed to allocate output buffer of size 39h for publishing eventto client "}));
}

}  // namespace
}  // namespace qz::test
