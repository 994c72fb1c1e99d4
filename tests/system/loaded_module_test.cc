// The whole system: the module, loaded as on a device, on a hub with several clients of both kinds.

#include <gmock/gmock.h>

#include <cmath>
#include <cstring>
#include <map>
#include <set>

#include "messages.h"
#include "random.h"
#include "test_hub.h"

namespace qz::test {
namespace {

using ::testing::ElementsAre;
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

struct Heard {
  std::map<uint32_t, std::vector<Bytes>> reports;                         // by client nanoapp
  std::map<uint16_t, std::vector<std::pair<uint32_t, Bytes>>> responses;  // by host endpoint
  hub::HubCounts counts;
};

// Three host clients and two client nanoapps listen to the recording from its first sample to its
// last.
Heard Listen(const std::vector<int16_t>& samples, const char* module) {
  Heard heard;
  TestHub runtime(/*host_time_offset_ns=*/-1000);
  hub::Hub& hub = runtime.hub;
  hub.sources().emplace_back();
  hub::LoadFailure failure;
  EXPECT_TRUE(hub.Start(module, &failure)) << failure.sentence;

  std::vector<uint32_t> nanoapps;
  for (size_t i = 0; i < 2; ++i) {
    nanoapps.push_back(
        hub.AddClientNanoapp([&heard, i](uint16_t type, const void* data, size_t size) {
          EXPECT_EQ(type, hub::kReportEvent);
          const auto* bytes = static_cast<const uint8_t*>(data);
          heard.reports[static_cast<uint32_t>(i)].emplace_back(bytes, bytes + size);
        }));
    hub.SendFromClientNanoapp(nanoapps.back(), hub::kRegisterEvent);
  }
  for (uint16_t endpoint = 1; endpoint <= 3; ++endpoint) {
    hub.ConnectHostEndpoint(endpoint,
                            [=, &heard](uint32_t type, const uint8_t* bytes, size_t size) {
                              heard.responses[endpoint].push_back({type, {bytes, bytes + size}});
                            });
    hub.SendFromHost(endpoint, hub::kQueryRequest, {});
    hub.SendFromHost(endpoint, hub::kEnableRequest, hub::EncodeEnableRequest(endpoint));
  }
  for (size_t at = 0; at < samples.size(); at += kBufferSamples) {
    EXPECT_TRUE(hub.audio_enabled());
    hub.PlayAudio(samples.data() + at, kBufferSamples);
  }
  for (uint16_t endpoint = 1; endpoint <= 3; ++endpoint) {
    hub.SendFromHost(endpoint, hub::kDisableRequest, hub::EncodeDisableRequest(endpoint));
  }
  for (const uint32_t id : nanoapps) hub.SendFromClientNanoapp(id, hub::kUnregisterEvent);
  EXPECT_FALSE(hub.audio_enabled());
  hub.End();
  EXPECT_EQ(hub.heap().live_blocks(), 0u);
  heard.counts = hub.counts();
  return heard;
}

uint64_t Fnv1a(const std::vector<Bytes>& payloads) {
  uint64_t digest = 0xCBF29CE484222325u;
  for (const Bytes& payload : payloads) {
    for (const uint8_t byte : payload) digest = (digest ^ byte) * 0x100000001B3u;
  }
  return digest;
}

TEST(LoadedModule, ServesHostsAndNanoappsFromOneRecording) {
  constexpr size_t kBuffers = 10;
  const Heard heard = Listen(Recording(kBuffers), QZ_MODULE);

  ASSERT_EQ(heard.responses.size(), 3u);
  for (const auto& [endpoint, responses] : heard.responses) {
    ASSERT_EQ(responses.size(), 3u);
    EXPECT_EQ(responses[0].first, hub::kQueryResponse);
    const auto categories =
        hub::DecodeQueryResponse(responses[0].second.data(), responses[0].second.size());
    ASSERT_TRUE(categories.has_value());
    EXPECT_THAT(*categories, ElementsAre(0, 6, 17, 15, 18));
    EXPECT_EQ(responses[1], std::make_pair(uint32_t{hub::kEnableResponse}, Bytes{}));
    EXPECT_EQ(responses[2], std::make_pair(uint32_t{hub::kDisableResponse}, Bytes{}));
  }

  ASSERT_EQ(heard.reports.size(), 2u);
  EXPECT_EQ(heard.reports.at(0), heard.reports.at(1));
  ASSERT_EQ(heard.reports.at(0).size(), kBuffers);
  std::set<float> seen;
  for (size_t pass = 0; pass < kBuffers; ++pass) {
    const Bytes& bytes = heard.reports.at(0)[pass];
    const auto report = hub::DecodeFramedSoundReport(bytes.data(), bytes.size());
    ASSERT_TRUE(report.has_value());
    EXPECT_EQ(report->model_version, 202208270u);
    EXPECT_EQ(report->response_time_ns, (pass + 1) * 2'000'000'000u);
    EXPECT_EQ(report->timestamp_ns, (pass + 1) * 2'000'000'000u - 1000);
    ASSERT_EQ(report->results.size(), 2u);
    EXPECT_EQ(report->results[0].category, 6u);
    EXPECT_EQ(report->results[1].category, 15u);
    for (const hub::SoundResult& result : report->results) {
      // The window is not full in the first pass.
      if (pass == 0) {
        EXPECT_EQ(result.confidence, 0.0f);
      }
      seen.insert(result.confidence);
    }
  }
  EXPECT_GT(seen.size(), kBuffers) << "the scores don't follow the sound";
  EXPECT_EQ(heard.counts.audio_buffers, kBuffers);
  EXPECT_EQ(heard.counts.undeliverable, 0u);

  // Every load begins anew.
  EXPECT_EQ(Listen(Recording(kBuffers), QZ_MODULE).reports, heard.reports);
#ifdef QZ_STANDIN
  // Recorded with the stand-in model: another figure on another machine or build is a broken
  // promise.
  EXPECT_EQ(Fnv1a(heard.reports.at(0)), 0x6F9AA3DA2058A843u);
#endif
}

TEST(LoadedModule, LivesOnARuntimeWithoutAudio) {
  TestHub runtime;
  runtime.hub.sources().emplace_back();
  hub::LoadFailure failure;
  ASSERT_TRUE(runtime.hub.Start(QZ_MODULE_WITHOUT_AUDIO, &failure)) << failure.sentence;
  std::vector<uint32_t> responses;
  runtime.hub.ConnectHostEndpoint(
      1, [&](uint32_t type, const uint8_t*, size_t) { responses.push_back(type); });
  for (uint32_t client = 1; client <= 2; ++client) {
    runtime.hub.SendFromHost(1, hub::kEnableRequest, hub::EncodeEnableRequest(client));
    runtime.hub.SendFromHost(1, hub::kDisableRequest, hub::EncodeDisableRequest(client));
    EXPECT_THAT(runtime.TakeLog(), testing::Contains("W Found no suitable audio source"));
  }
  EXPECT_THAT(responses, ElementsAre(hub::kEnableResponse, hub::kDisableResponse,
                                     hub::kEnableResponse, hub::kDisableResponse));
  EXPECT_FALSE(runtime.hub.audio_enabled());
}

}  // namespace
}  // namespace qz::test
