// SPDX-License-Identifier: Apache-2.0
#include "hub/messages.h"
#include "proto/sound_detection_proto_helper.h"
#include "tests/support/test_hub.h"

namespace tarn::contexthub::sound {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using Bytes = std::vector<uint8_t>;

class Codec : public testing::Test {
 protected:
  // Encoders; empty when there is no buffer.
  Bytes EncodeReport(bool prefix) {
    ConfidenceEvents events;
    events.push_back({6, 0.25f});
    events.push_back({15, 0.5f});
    return Contents(EncodeDetectionResponseMessage(
        GetDetectionEventResponse(&events, 202208270, 1'000'000'000), prefix, &size_));
  }
  Bytes EncodeRaw(const Bytes& audio) {
    RawAudioInfo info{static_cast<uint16_t>(audio.size()), audio.data()};
    return Contents(EncodeRawAudioSegment(GetRawAudioSegment(1, 2, &info), &size_));
  }
  Bytes Contents(const ChreBuffer& buffer) {
    EXPECT_EQ(runtime_.hub.heap().SizeOf(buffer.get()), buffer ? size_ : 0);
    return buffer ? Bytes(buffer.get(), buffer.get() + size_) : Bytes();
  }
  // The client ID of a request, or -1.
  template <typename Request>
  static int ClientId(bool (*decode)(const uint8_t*, uint32_t, Request*), const Bytes& bytes) {
    Request request = {};
    const bool success = decode(bytes.data(), static_cast<uint32_t>(bytes.size()), &request);
    return success ? request.client_id : -1;
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
  EXPECT_EQ(EncodeReport(/*prefix=*/true), expected);
  EXPECT_EQ(EncodeReport(/*prefix=*/false), Bytes(expected.begin() + 4, expected.end()));
}

TEST_F(Codec, ARawAudioSegmentHasTheKnownBytes) {
  EXPECT_EQ(EncodeRaw({0xAA, 0xBB, 0xCC}), (Bytes{0x08, 1, 0x10, 2, 0x1A, 3, 0xAA, 0xBB, 0xCC}));
  EXPECT_EQ(EncodeRaw(Bytes(65535, 0x5A)).size(), 4u + 4u + 65535u);
}

TEST_F(Codec, ValuesOfZeroAreWritten) {
  ConfidenceEvents events;
  events.push_back({0, 0.0f});
  EXPECT_EQ(Contents(EncodeDetectionResponseMessage(GetDetectionEventResponse(&events, 0, 0),
                                                    /*with_length_prefix=*/false, &size_)),
            (Bytes{0x08, 0, 0x12, 0x07, 0x08, 0, 0x15, 0, 0, 0, 0, 0x18, 0, 0x20, 0}));
  RawAudioInfo info{0, nullptr};
  EXPECT_EQ(Contents(EncodeRawAudioSegment(GetRawAudioSegment(0, 0, &info), &size_)),
            (Bytes{0x08, 0, 0x10, 0, 0x1A, 0}));
}

TEST_F(Codec, AMissingOrSmallBufferIsLogged) {
  runtime_.hub.heap().RefuseNth(1);
  EXPECT_THAT(EncodeReport(/*prefix=*/true), IsEmpty());
  EXPECT_EQ(size_, 4u + 6u + 9u + 9u + 5u + 2u);
  runtime_.hub.heap().RefuseNth(1);
  EXPECT_THAT(EncodeRaw({}), IsEmpty());
  uint8_t small[9];
  size_ = sizeof(small);
  EXPECT_FALSE(EncodeQueryResponseMessage(nullptr, size_));
  EXPECT_FALSE(EncodeQueryResponseMessage(small, size_));
  EXPECT_EQ(size_, 9u);
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre("E OOM at sound_detection_proto_helper.cc:155",
                                              "E OOM at sound_detection_proto_helper.cc:124",
                                              "E OOM at sound_detection_proto_helper.cc:175",
                                              "E Failed to encode query response message."));
}

TEST_F(Codec, RequestsOfTheOtherImplementationAreRead) {
  const auto enable = DecodeSoundDetectionEnableRequestMessage;
  const auto disable = DecodeSoundDetectionDisableRequestMessage;
  for (const int id : {0, 127, 128, 255}) {
    const auto number = static_cast<uint32_t>(id);
    EXPECT_EQ(ClientId(enable, qz::hub::EncodeEnableRequest(number, {6, 300, 15})), id);
    EXPECT_EQ(ClientId(disable, qz::hub::EncodeDisableRequest(number)), id);
  }
  EXPECT_EQ(ClientId(enable, {}) + ClientId(disable, {}), 0);
  // An unknown field, before and behind the known one.
  EXPECT_EQ(ClientId(enable, {0x1A, 0x02, 0xFF, 0xFF, 0x10, 0x07, 0x20, 0x01}), 7);
  EXPECT_THAT(runtime_.log, IsEmpty());

  EXPECT_EQ(ClientId(enable, qz::hub::EncodeEnableRequest(256)), -1);
  EXPECT_EQ(ClientId(enable, {0x10, 0x80}), -1);
  EXPECT_EQ(ClientId(disable, qz::hub::EncodeDisableRequest(256)), -1);
  EXPECT_THAT(
      runtime_.TakeLog(),
      ElementsAre("E Unable to decode message SoundDetectionEnableRequest, error integer too large",
                  "E Unable to decode message SoundDetectionEnableRequest, error end-of-stream",
                  "E Unable to decode message, error integer too large"));
}

TEST_F(Codec, AZeroTagEndsARequestAndAnotherWireTypeFailsIt) {
  const auto enable = DecodeSoundDetectionEnableRequestMessage;
  const auto disable = DecodeSoundDetectionDisableRequestMessage;
  // What follows is not read, whatever it is.
  EXPECT_EQ(ClientId(enable, {0x10, 0x07, 0x00, 0xFF, 0xFF}), 7);
  EXPECT_EQ(ClientId(disable, {0x08, 0x09, 0x00, 0x08, 0x0A}), 9);
  EXPECT_EQ(ClientId(enable, {0x00}) + ClientId(disable, {0x00, 0x08, 0x01}), 0);
  EXPECT_THAT(runtime_.log, IsEmpty());

  // client_id as 4 bytes, and behind a length.
  EXPECT_EQ(ClientId(enable, {0x15, 0x07, 0x00, 0x00, 0x00}), -1);
  EXPECT_EQ(ClientId(disable, {0x0A, 0x01, 0x07}), -1);
  EXPECT_THAT(
      runtime_.TakeLog(),
      ElementsAre("E Unable to decode message SoundDetectionEnableRequest, error wrong wire type",
                  "E Unable to decode message, error wrong wire type"));
}

}  // namespace
}  // namespace tarn::contexthub::sound
