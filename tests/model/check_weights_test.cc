#include "check_weights.h"

#include <gmock/gmock.h>

#include <cmath>
#include <limits>

#include "standin_model.h"

namespace qz::model {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

const PackedModel& GoodModel() {
  static const PackedModel model = MakeStandinModel(1);
  return model;
}

template <typename T>
std::vector<std::string> FindingsWith(size_t offset, T value) {
  PackedModel model = GoodModel();
  Store(model, offset, value);
  return CheckWeights(model);
}

TEST(CheckWeights, RefusesOtherSizes) {
  EXPECT_THAT(CheckWeights({}), ElementsAre("The packed model has 0 bytes; 86000 would be right."));
  PackedModel model = GoodModel();
  model.pop_back();
  EXPECT_THAT(CheckWeights(model), ElementsAre(HasSubstr("has 85999 bytes")));
  model.resize(86001);
  EXPECT_THAT(CheckWeights(model), ElementsAre(HasSubstr("has 86001 bytes")));
}

TEST(CheckWeights, NamesAWeightOfMinus128) {
  EXPECT_THAT(FindingsWith<int8_t>(FindTable(6)->WeightOffset(1, 14, 27), -128),
              ElementsAre("w6, block 3: the weight of column 27, tap 1, input channel 14 is -128; "
                          "weights lie from -127 to 127."));
  EXPECT_THAT(FindingsWith<int8_t>(FindTable(6)->WeightOffset(1, 14, 27), -127), ElementsAre());
}

TEST(CheckWeights, NamesWhatStandsInThePadding) {
  EXPECT_THAT(FindingsWith<int32_t>(FindTable(1)->BiasOffset(60), -7),
              ElementsAre("w1, block 7: the bias of column 60 is -7; column 60 is padding (60 are "
                          "real) and holds 0."));
  EXPECT_THAT(FindingsWith<int8_t>(FindTable(18)->WeightOffset(0, 63, 7), 1),
              ElementsAre("w18, block 0: the weight of column 7, input channel 63 is 1; column 7 "
                          "is padding (5 are real) and holds 0."));
  EXPECT_THAT(FindingsWith<int8_t>(FindTable(3)->WeightOffset(2, 0, 63), -128),
              ElementsAre("w3, group 3: the weight of channel 63, tap 2 is -128; channel 63 is "
                          "padding (60 are real) and holds 0."));
  EXPECT_THAT(FindingsWith<float>(FindTable(15)->ScaleOffset(63), -0.0f),
              ElementsAre(HasSubstr("w15, block 7: the scale of column 63 is -0;")));
}

TEST(CheckWeights, NamesAScaleThatIsNone) {
  EXPECT_THAT(FindingsWith<float>(FindTable(4)->ScaleOffset(9), -0.5f),
              ElementsAre("w4, block 1: the scale of column 9 is -0.5; scales are finite and not "
                          "negative."));
  constexpr float kInfinity = std::numeric_limits<float>::infinity();
  EXPECT_THAT(FindingsWith<float>(FindTable(13)->ScaleOffset(0), kInfinity),
              ElementsAre(HasSubstr("w13, block 0: the scale of column 0 is inf;")));
  EXPECT_THAT(FindingsWith<float>(FindTable(0)->ScaleOffset(47), std::nanf("")),
              ElementsAre(HasSubstr("w0, group 2: the scale of channel 47 is nan;")));
  EXPECT_THAT(FindingsWith<float>(FindTable(4)->ScaleOffset(9), 0.0f), ElementsAre());
}

TEST(CheckWeights, HoldsTheDepthwiseTablesToScaleAndBias) {
  EXPECT_THAT(
      FindingsWith<float>(FindTable(0)->ScaleOffset(17), std::nextafter(0.0076417988f, 1.0f)),
      ElementsAre("w0, group 1: the scale of channel 17 is 0.00764179928; 0.00764179882 "
                  "would be right."));
  EXPECT_THAT(FindingsWith<float>(FindTable(3)->ScaleOffset(59), 0.0076417988f),
              ElementsAre(HasSubstr("0.00582244154 would be right")));

  PackedModel model = GoodModel();
  const TableLayout& w3 = *FindTable(3);
  for (const int tap : {0, 1, 2}) Store<int8_t>(model, w3.WeightOffset(tap, 0, 16), 60 - 55 * tap);
  Store<int32_t>(model, w3.BiasOffset(16), 128 * (60 + 5 - 50));
  EXPECT_THAT(CheckWeights(model), ElementsAre());
  Store<int32_t>(model, w3.BiasOffset(16), 1921);
  EXPECT_THAT(CheckWeights(model),
              ElementsAre("w3, group 1: the bias of channel 16 is 1921; 128 x the sum of its "
                          "weights, 1920, would be right."));
}

TEST(CheckWeights, CollectsAllAndPrintsSome) {
  PackedModel model = GoodModel();
  for (int column = 0; column < 60; ++column) Store(model, FindTable(8)->ScaleOffset(column), -1.f);
  const std::vector<std::string> findings = CheckWeights(model);
  EXPECT_EQ(findings.size(), 60u);
  EXPECT_EQ(FormatFindings("f", findings, 1),
            "f: w8, block 0: the scale of column 0 is -1; scales are finite and not negative.\n"
            "f: and 59 more findings.\n");
  EXPECT_THAT(FormatFindings("f", findings, 60), testing::Not(HasSubstr("more findings")));
}

}  // namespace
}  // namespace qz::model
