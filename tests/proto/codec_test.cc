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
using Bytes = std::vector<uint8_t>;

class Codec : public testing::Test {
 protected:
  // Empty when there is no buffer.
  Bytes EncodeReport(const std::vector<ConfidenceEvent>& list, uint32_t model_version,
                     bool prefix) {
    ConfidenceEvents events;
    for (const ConfidenceEvent& event : list) events.push_back(event);
    const ChreBuffer buffer = EncodeDetectionResponseMessage(
        GetDetectionEventResponse(&events, model_version, 1'000'000'000), prefix, &size_);
    return buffer ? Bytes(buffer.get(), buffer.get() + size_) : Bytes();
  }
  Bytes EncodeRaw(const Bytes& audio) {
    RawAudioInfo info{static_cast<uint16_t>(audio.size()), audio.data()};
    const ChreBuffer buffer = EncodeRawAudioSegment(GetRawAudioSegment(1, 2, &info), &size_);
    return buffer ? Bytes(buffer.get(), buffer.get() + size_) : Bytes();
  }
  // The client ID of a request, or -1.
  int DecodeEnable(const Bytes& bytes) {
    sound_detection_SoundDetectionEnableRequest request = {};
    const auto size = static_cast<uint32_t>(bytes.size());
    const bool fine = DecodeSoundDetectionEnableRequestMessage(bytes.data(), size, &request);
    return fine ? request.client_id : -1;
  }
  int DecodeDisable(const Bytes& bytes) {
    sound_detection_SoundDetectionDisableRequest request = {};
    const auto size = static_cast<uint32_t>(bytes.size());
    const bool fine = DecodeSoundDetectionDisableRequestMessage(bytes.data(), size, &request);
    return fine ? request.client_id : -1;
  }

  qz::test::TestHub runtime_;
  uint32_t size_ = 0;
};

TEST_F(Codec, AReportHasTheKnownBytes) {
  runtime_.hub.AdvanceTime(2'000'000'000);
  const Bytes expected = {0x23, 0,    0,    0,    0x08, 0x80, 0x94, 0xEB, 0xDC, 0x03,
                          0x12, 0x07, 0x08, 0x06, 0x15, 0x00, 0x00, 0x80, 0x3E, 0x12,
                          0x07, 0x08, 0x0F, 0x15, 0x00, 0x00, 0x00, 0x3F, 0x18, 0x80,
                          0xA8, 0xD6, 0xB9, 0x07, 0x20, 0x8E, 0xE8, 0xB5, 0x60};
  EXPECT_EQ(EncodeReport({{6, 0.25f}, {15, 0.5f}}, 202208270, true), expected);
  EXPECT_EQ(EncodeReport({{6, 0.25f}, {15, 0.5f}}, 202208270, false),
            Bytes(expected.begin() + 4, expected.end()));
  EXPECT_EQ(runtime_.hub.heap().live_blocks(), 0u);
}

TEST_F(Codec, ReportsOfEverySizeReachTheOtherImplementation) {
  std::vector<ConfidenceEvent> list;
  for (size_t count = 0; count <= kSoundCategoryCount; ++count) {
    const Bytes bytes = EncodeReport(list, 202208271, true);
    const auto report = qz::hub::DecodeFramedSoundReport(bytes.data(), bytes.size());
    ASSERT_TRUE(report.has_value()) << count;
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

TEST_F(Codec, ARawAudioSegmentHasTheKnownBytes) {
  EXPECT_EQ(EncodeRaw({0xAA, 0xBB, 0xCC}), (Bytes{0x08, 1, 0x10, 2, 0x1A, 3, 0xAA, 0xBB, 0xCC}));
  EXPECT_EQ(EncodeRaw({}), (Bytes{0x08, 1, 0x10, 2, 0x1A, 0}));
  EXPECT_EQ(EncodeRaw(Bytes(65535, 0x5A)).size(), 4u + 4u + 65535u);
}

TEST_F(Codec, TheQueryResponseHasTheKnownBytesAndNeedsThemAll) {
  Bytes buffer(16, 0xEE);
  size_ = 9;
  EXPECT_FALSE(EncodeQueryResponseMessage(buffer.data(), size_));
  EXPECT_EQ(size_, 9u);
  EXPECT_FALSE(EncodeQueryResponseMessage(nullptr, size_));
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre("E Failed to encode query response message.",
                                              "E OOM at sound_detection_proto_helper.cc:175"));
  size_ = 10;
  ASSERT_TRUE(EncodeQueryResponseMessage(buffer.data(), size_));
  buffer.resize(size_);
  EXPECT_EQ(buffer, (Bytes{0x08, 0x00, 0x08, 0x06, 0x08, 0x11, 0x08, 0x0F, 0x08, 0x12}));
}

TEST_F(Codec, ARefusedBufferIsLoggedWithItsSite) {
  runtime_.hub.heap().RefuseNth(1);
  EXPECT_THAT(EncodeReport({{6, 0.25f}}, 1, true), IsEmpty());
  EXPECT_EQ(size_, 4u + 6u + 9u + 2u + 2u);
  runtime_.hub.heap().RefuseNth(1);
  EXPECT_THAT(EncodeRaw({}), IsEmpty());
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre("E OOM at sound_detection_proto_helper.cc:155",
                                              "E OOM at sound_detection_proto_helper.cc:124"));
}

TEST_F(Codec, RequestsOfTheOtherImplementationAreRead) {
  for (const uint32_t id : {0u, 127u, 128u, 255u}) {
    EXPECT_EQ(DecodeEnable(qz::hub::EncodeEnableRequest(id, {6, 300, 15})), static_cast<int>(id));
    EXPECT_EQ(DecodeDisable(qz::hub::EncodeDisableRequest(id)), static_cast<int>(id));
  }
  EXPECT_EQ(DecodeEnable({}), 0);
  EXPECT_EQ(DecodeDisable({}), 0);
  // An unknown field, before and behind the known one.
  EXPECT_EQ(DecodeEnable({0x1A, 0x02, 0xFF, 0xFF, 0x10, 0x07, 0x20, 0x01}), 7);
  EXPECT_THAT(runtime_.log, IsEmpty());

  EXPECT_EQ(DecodeEnable(qz::hub::EncodeEnableRequest(256)), -1);
  EXPECT_EQ(DecodeEnable({0x10, 0x80}), -1);
  EXPECT_EQ(DecodeDisable(qz::hub::EncodeDisableRequest(256)), -1);
  EXPECT_THAT(
      runtime_.TakeLog(),
      ElementsAre("E Unable to decode message SoundDetectionEnableRequest, error integer too large",
                  "E Unable to decode message SoundDetectionEnableRequest, error end-of-stream",
                  "E Unable to decode message, error integer too large"));
}

}  // namespace
}  // namespace tarn::contexthub::sound
