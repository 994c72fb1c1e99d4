// SPDX-License-Identifier: Apache-2.0
// The checker's findings, the model tool's commands, the synthetic model, and the reference network
// at the ends of its ranges; its ordinary results are compared with the module's network.

#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <iterator>
#include <map>
#include <sstream>
#include <stdexcept>

#include "base/digest.h"
#include "base/error.h"
#include "model/check_weights.h"
#include "model/model_commands.h"
#include "model/model_files.h"
#include "model/reference_network.h"
#include "model/synthetic_features.h"
#include "model/synthetic_model.h"
#include "tests/support/temporary_folder.h"

namespace qz::model {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

// Each made once: that takes half a second.
const PackedModel& Synthetic(uint64_t seed) {
  static std::map<uint64_t, PackedModel> models;
  PackedModel& model = models[seed];
  if (model.empty()) model = MakeSyntheticModel(seed);
  return model;
}

template <typename T>
std::vector<std::string> FindingsWith(size_t offset, T value) {
  PackedModel model = Synthetic(1);
  Store(model, offset, value);
  return CheckWeights(model);
}

TEST(CheckWeights, NamesTheTableAndLocationOfEveryKindOfDefect) {
  const auto& [w0, w1, w3, w4, w6, w8, w10, w12, w13, w15, w17, w18] = kTables;
  const std::string classes = std::to_string(config::kClasses);
  const size_t weight = w6.WeightOffset(1, 14, 27), scale = w4.ScaleOffset(9);
  const std::pair<std::vector<std::string>, std::string> kCases[] = {
      {FindingsWith<int8_t>(weight, -128),
       "w6, block 3: the weight of column 27, tap 1, input channel 14 is -128; expected -127 to"},
      {FindingsWith<int8_t>(w3.WeightOffset(2, 0, 63), -128),
       "w3, group 3: the weight of channel 63, tap 2 is -128; expected 0: channel 63 is padding "
       "(60"},
      {FindingsWith<int8_t>(w18.WeightOffset(0, 63, 7), 1),
       "w18, block 0: the weight of column 7, input channel 63 is 1; expected 0: column 7 is "
       "padding (" +
           classes + " are real)"},
      {FindingsWith(w1.BiasOffset(60), -7),
       "w1, block 7: the bias of column 60 is -7; expected 0: column"},
      {FindingsWith(w15.ScaleOffset(63), -0.0f), "w15, block 7: the scale of column 63 is -0; exp"},
      {FindingsWith(scale, -0.5f), "w4, block 1: the scale of column 9 is -0.5; expected finite"},
      {FindingsWith(scale, INFINITY), "w4, block 1: the scale of column 9 is inf; expected"},
      {FindingsWith(scale, NAN), "w4, block 1: the scale of column 9 is nan; expected"},
      {FindingsWith(w0.ScaleOffset(17), std::nextafter(w0.fixed_scale, 1.0f)),
       "w0, group 1: the scale of channel 17 is 0.00764179928; expected 0.00764179882."}};
  for (const auto& [findings, start] : kCases) {
    EXPECT_THAT(findings, ElementsAre(StartsWith(start)));
  }
  EXPECT_THAT(FindingsWith<int8_t>(weight, -127), ElementsAre());
  EXPECT_THAT(FindingsWith(scale, 0.0f), ElementsAre());

  PackedModel model = Synthetic(1);
  for (int tap : {0, 1, 2}) Store<int8_t>(model, w3.WeightOffset(tap, 0, 16), 60 - 55 * tap);
  Store<int32_t>(model, w3.BiasOffset(16), 128 * (60 + 5 - 50) + 1);
  EXPECT_THAT(CheckWeights(model),
              ElementsAre("w3, group 1: the bias of channel 16 is 1921; expected 1920, 128 x the "
                          "sum of its weights."));
  model.push_back(0);
  EXPECT_THAT(CheckWeights(model),
              ElementsAre(StartsWith("The packed model has " + std::to_string(kModelBytes + 1) +
                                     " bytes; expected ")));
}

TEST(CheckWeights, PrintsSomeFindingsAndCountsTheRest) {
  EXPECT_EQ(FormatFindings("f", {"a", "b", "c"}, 1), "f: a\nf: and 2 more findings.\n");
  EXPECT_EQ(FormatFindings("f", {"a", "b"}, 2), "f: a\nf: b\n");
}

// A folder of its own, and what the program prints to standard error.
class ModelTool : public testing::Test {
 protected:
  int Run(const std::string& line) {
    std::istringstream words(line);
    testing::internal::CaptureStderr();
    const int result = RunModelCommand({std::istream_iterator<std::string>(words), {}});
    errors_ = testing::internal::GetCapturedStderr();
    return result;
  }

  std::ptrdiff_t FilesInFolder() const {
    return std::distance(std::filesystem::directory_iterator(folder_), {});
  }

  const test::TemporaryFolder own_folder_;
  const std::string folder_ = own_folder_.Path("");
  const std::string model_ = folder_ + "model.bin";
  std::string errors_;
};

TEST_F(ModelTool, MakesChecksAndEmbeds) {
  EXPECT_EQ(Run("synthetic --seed 18446744073709551615 -o " + model_), base::kSuccess);
  EXPECT_EQ(ReadModelFile(model_), Synthetic(UINT64_MAX));
  EXPECT_EQ(Run("check " + model_), base::kSuccess);
  EXPECT_EQ(Run("embed " + model_ + " -o " + folder_ + "a.h"), base::kSuccess);
  EXPECT_EQ(FilesInFolder(), 2);
}

TEST_F(ModelTool, NamesInvalidAndUnreadableModelsAndWritesNothing) {
  own_folder_.WriteBytes("model.bin", "four");
  EXPECT_EQ(Run("embed " + model_ + " -o " + folder_ + "a.h"), base::kFaultFound);
  EXPECT_THAT(errors_, StartsWith(model_ + ": The packed model has 4 bytes; "));
  EXPECT_THROW(RunModelCommand({"check", folder_ + "absent.bin"}), base::InputError);
  EXPECT_THROW(RunModelCommand({"check", folder_}), base::InputError);
  EXPECT_THROW(RunModelCommand({"labels", model_}), base::InputError);
  EXPECT_THROW(RunModelCommand({"embed", model_, "-o", model_}), base::OutputError);
  EXPECT_EQ(FilesInFolder(), 1);
}

TEST_F(ModelTool, ExplainsItsUsage) {
  for (const char* line :
       {"", "melt", "check", "check a b", "check --fast", "labels", "embed a", "embed a -o",
        "synthetic -o a", "synthetic --seed 1x -o a", "synthetic --seed 18446744073709551616 -o a",
        "synthetic --seed 1 --seed 2 -o a"}) {
    EXPECT_EQ(Run(line), base::kUsage) << line;
    EXPECT_THAT(errors_, HasSubstr("usage: qz-model-tool")) << line;
  }
}

TEST(ReferenceNetwork, SaturatesWrapsAndRefuses) {
  EXPECT_EQ(RequantiseFloat(INT32_MAX, 1e6f, -128), 127);
  EXPECT_EQ(RequantiseFloat(INT32_MIN, 1e6f, 127), -128);
  // Exactly 0.5 + 2^-25; single precision holds 2^24 there.
  EXPECT_EQ(RequantiseFloat((1 << 24) + 1, 0x1p-25f, 0), 0);
  EXPECT_EQ(RequantiseFixed(INT32_MAX, {-128, INT32_MAX, 1}), 127);
  EXPECT_EQ(RequantiseFixed(INT32_MIN, {0, INT32_MIN, 25}), 64) << "2^31 saturates, then rounds";

  PackedModel model(kModelBytes);
  Store(model, FindTable(17)->BiasOffset(63), INT32_MAX);
  Store<int8_t>(model, FindTable(17)->WeightOffset(0, 0, 63), 1);
  Tensor in(1, 60);
  in.values[0] = 1;
  EXPECT_EQ(Accumulate(model, *FindTable(17), in)[63], INT32_MIN);
  EXPECT_THROW(RunNetwork(model, Tensor(kInputRows - 1, kInputChannels)), std::invalid_argument);
  model.pop_back();
  EXPECT_THROW(RunNetwork(model, Tensor(kInputRows, kInputChannels)), std::invalid_argument);
}

TEST(SyntheticModel, IsValidAndItsScoresVary) {
  for (uint64_t seed : {uint64_t{1}, UINT64_MAX}) {
    SCOPED_TRACE(seed);
    const PackedModel& model = Synthetic(seed);
    EXPECT_THAT(CheckWeights(model), ElementsAre());
    std::vector<NetworkRun> runs;  // on windows that the calibration did not see
    for (uint64_t s = 0; s < 40; ++s) runs.push_back(RunNetwork(model, SyntheticWindow(s)));
    for (size_t i = 0; i < kClasses; ++i) {
      int low = 0, middle = 0, high = 0;
      for (const NetworkRun& run : runs) {
        ++(run.scores[i] < 0.2f ? low : run.scores[i] > 0.8f ? high : middle);
      }
      EXPECT_GE(std::min({low, middle, high}), 3) << "class " << i;
    }
  }
}

}  // namespace
}  // namespace qz::model
