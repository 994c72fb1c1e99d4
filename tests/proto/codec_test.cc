#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "messages.h"
#include "sound_detection_proto_helper.h"
#include "test_hub.h"

namespace tarn::contexthub::sound {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::StartsWith;
using Bytes = std::vector<uint8_t>;

ConfidenceEvents Events(const std::vector<ConfidenceEvent>& list) {
  ConfidenceEvents events;
  for (const ConfidenceEvent& event : list) events.push_back(event);
  return events;
}

Bytes EncodeReport(const ConfidenceEvents& events, uint32_t model_version, bool prefix) {
  uint32_t size = 0;
  const ChreBuffer buffer = EncodeDetectionResponseMessage(
      GetDetectionEventResponse(&events, model_version, 1'000'000'000), prefix, &size);
  return buffer ? Bytes(buffer.get(), buffer.get() + size) : Bytes();
}

TEST(Codec, AReportHasTheKnownBytes) {
  qz::test::TestHub runtime;
  runtime.hub.AdvanceTime(2'000'000'000);
  const ConfidenceEvents events = Events({{6, 0.25f}, {15, 0.5f}});
  const Bytes expected = {0x23, 0,    0,    0,    0x08, 0x80, 0x94, 0xEB, 0xDC, 0x03,
                          0x12, 0x07, 0x08, 0x06, 0x15, 0x00, 0x00, 0x80, 0x3E, 0x12,
                          0x07, 0x08, 0x0F, 0x15, 0x00, 0x00, 0x00, 0x3F, 0x18, 0x80,
                          0xA8, 0xD6, 0xB9, 0x07, 0x20, 0x8E, 0xE8, 0xB5, 0x60};
  EXPECT_EQ(EncodeReport(events, 202208270, true), expected);
  EXPECT_EQ(EncodeReport(events, 202208270, false), Bytes(expected.begin() + 4, expected.end()));
  EXPECT_EQ(runtime.hub.heap().live_blocks(), 0u);
}

TEST(Codec, ReportsOfEverySizeReachTheOtherImplementation) {
  qz::test::TestHub runtime;
  std::vector<ConfidenceEvent> list;
  for (size_t count = 0; count <= kSoundCategoryCount; ++count) {
    const Bytes bytes = EncodeReport(Events(list), 202208271, true);
    const auto report = qz::hub::DecodeFramedSoundReport(bytes.data(), bytes.size());
    ASSERT_TRUE(report.has_value()) << count;
    EXPECT_EQ(report->timestamp_ns, 1'000'000'000u);
    EXPECT_EQ(report->model_version, 202208271u);
    ASSERT_EQ(report->results.size(), count);
    for (size_t i = 0; i < count; ++i) {
      EXPECT_EQ(report->results[i].category, list[i].category);
      EXPECT_EQ(report->results[i].confidence, list[i].confidence);
    }
    // Zero values stay present, and a category uses its eight bits.
    list.push_back({static_cast<uint8_t>(count == 0 ? 0 : 250 + count), 0.125f * count});
  }
}

TEST(Codec, ARawAudioSegmentHasTheKnownBytes) {
  qz::test::TestHub runtime;
  const uint8_t audio[] = {0xAA, 0xBB, 0xCC};
  RawAudioInfo info{3, audio};
  uint32_t size = 0;
  ChreBuffer buffer = EncodeRawAudioSegment(GetRawAudioSegment(1, 2, &info), &size);
  ASSERT_TRUE(buffer);
  EXPECT_EQ(Bytes(buffer.get(), buffer.get() + size),
            (Bytes{0x08, 0x01, 0x10, 0x02, 0x1A, 0x03, 0xAA, 0xBB, 0xCC}));
  info.size = 0;
  buffer = EncodeRawAudioSegment(GetRawAudioSegment(1, 2, &info), &size);
  EXPECT_EQ(Bytes(buffer.get(), buffer.get() + size), (Bytes{0x08, 0x01, 0x10, 0x02, 0x1A, 0x00}));
  const Bytes longest(65535, 0x5A);
  info = {65535, longest.data()};
  buffer = EncodeRawAudioSegment(GetRawAudioSegment(1, 2, &info), &size);
  ASSERT_EQ(size, 4u + 4u + 65535u);
  EXPECT_EQ(Bytes(buffer.get() + 8, buffer.get() + size), longest);
}

TEST(Codec, TheQueryResponseHasTheKnownBytes) {
  qz::test::TestHub runtime;
  Bytes buffer(16, 0xEE);
  for (uint32_t capacity = 0; capacity < 10; ++capacity) {
    uint32_t size = capacity;
    EXPECT_FALSE(EncodeQueryResponseMessage(buffer.data(), size));
    EXPECT_EQ(size, capacity);
    EXPECT_THAT(runtime.TakeLog(), ElementsAre("E Failed to encode query response message."));
  }
  uint32_t size = 16;
  ASSERT_TRUE(EncodeQueryResponseMessage(buffer.data(), size));
  buffer.resize(size);
  EXPECT_EQ(buffer, (Bytes{0x08, 0x00, 0x08, 0x06, 0x08, 0x11, 0x08, 0x0F, 0x08, 0x12}));
  EXPECT_FALSE(EncodeQueryResponseMessage(nullptr, size));
  EXPECT_THAT(runtime.TakeLog(), ElementsAre("E OOM at sound_detection_proto_helper.cc:175"));
}

TEST(Codec, ARefusedBufferIsLoggedWithItsSite) {
  qz::test::TestHub runtime;
  const ConfidenceEvents events = Events({{6, 0.25f}});
  uint32_t size = 0;
  runtime.hub.heap().RefuseNth(1);
  EXPECT_FALSE(
      EncodeDetectionResponseMessage(GetDetectionEventResponse(&events, 1, 1), true, &size));
  EXPECT_EQ(size, 4u + 2u + 9u + 2u + 2u);
  EXPECT_THAT(runtime.TakeLog(), ElementsAre("E OOM at sound_detection_proto_helper.cc:155"));
  RawAudioInfo info{0, nullptr};
  runtime.hub.heap().RefuseNth(1);
  EXPECT_FALSE(EncodeRawAudioSegment(GetRawAudioSegment(1, 2, &info), &size));
  EXPECT_THAT(runtime.TakeLog(), ElementsAre("E OOM at sound_detection_proto_helper.cc:124"));
}

// Decodes as both kinds of request; the client ID, or -1.
int DecodeEnable(const Bytes& bytes) {
  sound_detection_SoundDetectionEnableRequest request = {};
  const bool fine = DecodeSoundDetectionEnableRequestMessage(
      bytes.data(), static_cast<uint32_t>(bytes.size()), &request);
  return fine ? request.client_id : -1;
}
int DecodeDisable(const Bytes& bytes) {
  sound_detection_SoundDetectionDisableRequest request = {};
  const bool fine = DecodeSoundDetectionDisableRequestMessage(
      bytes.data(), static_cast<uint32_t>(bytes.size()), &request);
  return fine ? request.client_id : -1;
}

TEST(Codec, RequestsOfTheOtherImplementationAreRead) {
  qz::test::TestHub runtime;
  for (const uint32_t id : {0u, 1u, 127u, 128u, 255u}) {
    EXPECT_EQ(DecodeEnable(qz::hub::EncodeEnableRequest(id)), static_cast<int>(id));
    EXPECT_EQ(DecodeEnable(qz::hub::EncodeEnableRequest(id, {6, 300, 15})), static_cast<int>(id));
    EXPECT_EQ(DecodeDisable(qz::hub::EncodeDisableRequest(id)), static_cast<int>(id));
  }
  EXPECT_EQ(DecodeEnable({}), 0);
  EXPECT_EQ(DecodeDisable({}), 0);
  // An unknown field, before and behind the known one.
  EXPECT_EQ(DecodeEnable({0x1A, 0x02, 0xFF, 0xFF, 0x10, 0x07, 0x20, 0x01}), 7);
  EXPECT_THAT(runtime.log, IsEmpty());
}

TEST(Codec, UndecodableRequestsAreLoggedWithTheReason) {
  qz::test::TestHub runtime;
  EXPECT_EQ(DecodeEnable(qz::hub::EncodeEnableRequest(256)), -1);
  EXPECT_EQ(DecodeEnable({0x10}), -1);
  EXPECT_EQ(DecodeEnable({0x10, 0x80}), -1);
  EXPECT_THAT(
      runtime.TakeLog(),
      ElementsAre("E Unable to decode message SoundDetectionEnableRequest, error integer too large",
                  "E Unable to decode message SoundDetectionEnableRequest, error end-of-stream",
                  "E Unable to decode message SoundDetectionEnableRequest, error end-of-stream"));
  EXPECT_EQ(DecodeDisable(qz::hub::EncodeDisableRequest(256)), -1);
  EXPECT_EQ(DecodeDisable({0x00}), -1);
  EXPECT_THAT(runtime.TakeLog(), ElementsAre("E Unable to decode message, error integer too large",
                                             StartsWith("E Unable to decode message, error ")));
}

}  // namespace
}  // namespace tarn::contexthub::sound
