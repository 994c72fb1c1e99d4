// Host clients: requests, answers, the map of clients, and broadcasts.

#include <gmock/gmock.h>

#include "app_manager.h"
#include "chre/singleton.h"
#include "linked_nanoapp.h"
#include "random.h"

namespace qz::test {
namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::IsSupersetOf;
using ::testing::MatchesRegex;
using ::testing::StartsWith;
using Bytes = std::vector<uint8_t>;

class HostClients : public LinkedNanoapp {
 protected:
  HostClients() {
    for (uint16_t endpoint = 0x10; endpoint < 0x20; ++endpoint) Connect(endpoint);
  }

  // "type@endpoint" of what arrived since the last call.
  std::vector<std::string> TakeMessages() {
    std::vector<std::string> list;
    for (const Received& message : std::exchange(messages, {})) {
      list.push_back(std::to_string(message.type) + "@" + std::to_string(message.receiver));
    }
    return list;
  }

  // Plays until the network has run, with scores that are detected for outputs 0 and 4.
  void PlayDetection() {
    stub_network.scores = [](int) { return Scores{0.75f, 0, 0, 0, 0.625f}; };
    const int before = stub_network.runs;
    while (stub_network.runs == before) PlayBuffer();
  }
};

TEST_F(HostClients, AQueryIsAnsweredAlwaysTheSame) {
  Start();
  const Bytes expected = {0x08, 0x00, 0x08, 0x06, 0x08, 0x11, 0x08, 0x0F, 0x08, 0x12};
  for (const Bytes& payload : {Bytes{}, Bytes{0xFF, 0x00, 0xAB}}) {
    Send(0x1F, hub::kQueryRequest, payload);
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].bytes, expected);
    EXPECT_THAT(TakeMessages(), ElementsAre("2@31"));
  }
  EXPECT_FALSE(audio());
  EXPECT_THAT(TakeLog(), ElementsAre("I Result of sending query response: 1",
                                     "I Result of sending query response: 1"));
  for (const uint32_t type : {0u, 2u, 7u}) Send(0x1F, type, {1, 2, 3});
  EXPECT_THAT(messages, IsEmpty());
  EXPECT_THAT(runtime.log, ElementsAre(StartsWith("I Got message"), StartsWith("I Got message"),
                                       MatchesRegex("I Got message from host with type 7 size 3 "
                                                    "data @ 0x[0-9a-f]+ hostEndpoint 0x1f")));
}

TEST_F(HostClients, EnableStartsAndTheLastDisableStops) {
  Start();
  Enable(0x10, 5);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I Add host end point: 16", "I Start", "I Found suitable audio source",
                          "I Enabling audio", "I Requested audio from handle 0, status: 1",
                          "I Result of sending enable response: 1",
                          "I audio sampling change for handle 0, suspended: 0"));
  Enable(0x11, 6);
  EXPECT_THAT(TakeMessages(), ElementsAre("4@16", "4@17"));
  // From another endpoint than its own: the answer goes where the request came from.
  Disable(0x1F, 5);
  EXPECT_THAT(TakeMessages(), ElementsAre("6@31"));
  EXPECT_TRUE(audio());
  TakeLog();
  Disable(0x11, 6);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I is_audio_enabled_ = 1; HostCount = 0; hasInternalClient = 0", "I Stop",
                          "I Disabling audio", "I Result of sending disable respones: 1"));
  EXPECT_THAT(TakeMessages(), ElementsAre("6@17"));
  EXPECT_FALSE(audio());
  Disable(0x11, 6);
  EXPECT_THAT(TakeLog(), ElementsAre("W Unregistered client ID for disable request: 6"));
}

TEST_F(HostClients, AClientNanoappKeepsTheAudioOfTheLastHostClient) {
  Start();
  Enable(0x10, 1);
  const uint32_t client = RegisterClientNanoapp();
  Disable(0x10, 1);
  EXPECT_TRUE(audio());
  Enable(0x10, 1);
  hub().SendFromClientNanoapp(client, hub::kUnregisterEvent);
  EXPECT_TRUE(audio());
}

TEST_F(HostClients, TheMapRefusesWhatWouldNotBeUnique) {
  Start();
  Enable(0x11, 3);
  TakeLog();
  Enable(0x10, 3);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I Duplicate enable request received from client ID: 3",
                          "I Add host end point: 16", "I Result of sending enable response: 1"));
  EXPECT_THAT(TakeMessages(), ElementsAre("4@17", "4@16"));
  Enable(0x10, 4);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I Add host end point: 16", "W Host endpoint 16 is already used.",
                          "W Unable to serve new host endpoint 16"));
  Enable(0xFFFF, 3);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I Duplicate enable request received from client ID: 3",
                          "I Add host end point: 65535", "W Invalid host endpoint: 65535",
                          "W Unable to serve new host endpoint 65535"));
  EXPECT_THAT(TakeMessages(), IsEmpty());
  // The old pairing of client 3 stays removed: its endpoint is free.
  Enable(0x10, 4);
  EXPECT_THAT(TakeMessages(), ElementsAre("4@16"));
}

TEST_F(HostClients, ANinthClientIsRefusedAndTheEightAreServedInOrder) {
  Start();
  for (uint16_t i = 0; i < 8; ++i) Enable(static_cast<uint16_t>(0x10 + i), 100u + i);
  TakeLog();
  Enable(0x18, 108);
  EXPECT_THAT(TakeLog(),
              ElementsAre("I Add host end point: 24", "W Client id and host endpoint map is full!",
                          "W Unable to serve new host endpoint 24"));
  Enable(0x1A, 100);  // moves to the end, to a new endpoint
  TakeMessages();
  PlayDetection();
  EXPECT_THAT(TakeMessages(),
              ElementsAre("7@17", "7@18", "7@19", "7@20", "7@21", "7@22", "7@23", "7@26"));
}

TEST_F(HostClients, ADetectionReachesEveryHostAndNoNanoapp) {
  Start();
  for (uint16_t i = 0; i < 3; ++i) Enable(static_cast<uint16_t>(0x10 + i), i);
  RegisterClientNanoapp();
  hub().DisconnectHostEndpoint(0x11);
  TakeMessages();
  PlayDetection();
  ASSERT_EQ(messages.size(), 2u);
  EXPECT_EQ(messages[0].bytes, messages[1].bytes);
  const auto report = hub::DecodeSoundReport(messages[0].bytes.data(), messages[0].bytes.size());
  ASSERT_TRUE(report.has_value());
  EXPECT_EQ(report->model_version, 202208271u);
  EXPECT_EQ(report->timestamp_ns, hub().TimeNs() + 500);
  ASSERT_EQ(report->results.size(), 2u);
  EXPECT_EQ(report->results[1].category, 18u);
  EXPECT_EQ(report->results[1].confidence, 0.625f);
  for (const Received& event : events) EXPECT_EQ(event.type, hub::kReportEvent);
}

TEST_F(HostClients, RawAudioReachesEveryHost) {
  Start();
  Enable(0x10, 1);
  Enable(0x11, 2);
  TakeMessages();
  const uint8_t audio_bytes[] = {0xAA, 0xBB, 0xCC};
  tarn::contexthub::sound::RawAudioInfo info{3, audio_bytes};
  auto* manager = chre::Singleton<tarn::contexthub::sound::AppManager>::get();
  manager->OnRawAudioTransmissibleSegment(1, 2, &info);
  hub().DeliverToNanoapp(0, CHRE_EVENT_NANOAPP_STARTED, nullptr);
  ASSERT_EQ(messages.size(), 2u);
  EXPECT_EQ(messages[1].type, hub::kRawAudioSegment);
  EXPECT_EQ(messages[1].bytes, (Bytes{0x08, 1, 0x10, 2, 0x1A, 3, 0xAA, 0xBB, 0xCC}));
  TakeLog();
  hub().fault_plan().refuse_host_messages = true;
  manager->OnRawAudioTransmissibleSegment(1, 2, &info);
  const std::string failed = "E Failed to send RAW_AUDIO_SEGMENT message to host client.";
  EXPECT_THAT(TakeLog(), ElementsAre(failed, failed));
}

TEST_F(HostClients, FailedSendsAreLoggedAndNothingElseChanges) {
  Start();
  Enable(0x10, 1);
  Enable(0x11, 2);
  hub().fault_plan().refuse_host_messages = true;
  TakeLog();
  Send(0x12, hub::kQueryRequest, {});
  Enable(0x12, 3);
  Disable(0x12, 3);
  EXPECT_THAT(TakeLog(), IsSupersetOf({"I Result of sending query response: 0",
                                       "I Result of sending enable response: 0",
                                       "I Result of sending disable respones: 0"}));
  PlayDetection();
  const std::string failed = "E Failed to send SOUND_EVENT_DETECTION message to host.";
  EXPECT_THAT(TakeLog(), ElementsAre(failed, failed));
}

TEST_F(HostClients, HostilePayloadsEndInALogLine) {
  Start();
  Random random(20220827);
  int refused = 0;
  for (int i = 0; i < 20000; ++i) {
    const Bytes payload = random.Fill<uint8_t>(static_cast<size_t>(random.Between(0, 40)), 0, 255);
    const auto type = static_cast<uint32_t>(random.Between(0, 9));
    Send(static_cast<uint16_t>(random.Between(0x10, 0x1F)), type, payload);
    for (const std::string& line : TakeLog())
      refused += line.find("Unable to decode") != std::string::npos;
  }
  EXPECT_GT(refused, 1000);
  const Bytes oversized(100'000, 0x08);
  Send(0x10, hub::kEnableRequest, oversized);
  Send(0x10, hub::kDisableRequest, oversized);
  for (uint32_t id = 0; id < 256; ++id) Disable(0x10, id);
  EXPECT_FALSE(audio());
  TakeMessages();
  Enable(0x10, 1);
  EXPECT_THAT(TakeMessages(), ElementsAre("4@16"));
  PlayDetection();
  EXPECT_THAT(TakeMessages(), Contains("7@16"));
}

}  // namespace
}  // namespace qz::test
