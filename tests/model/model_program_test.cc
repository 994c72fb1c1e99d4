// SPDX-License-Identifier: Apache-2.0
// qz model, run from a shell, and what it shows of tensors.

#include <gmock/gmock.h>

#include <algorithm>
#include <filesystem>

#include "base/digest.h"
#include "dataset/clip_features.h"
#include "detector/window.h"
#include "model/synthetic_features.h"
#include "model/synthetic_model.h"
#include "tests/tools/qz_program.h"
#include "tools/model/model_info.h"

namespace qz::tools {
namespace {

using model::PackedModel;
using testing::HasSubstr;

const PackedModel& Good() {
  static const PackedModel model = model::MakeSyntheticModel(1);
  return model;
}

class ModelProgram : public test::QzProgram {
 protected:
  std::string Write(const std::string& name, const PackedModel& model) const {
    return WriteBytes(name, std::string(model.begin(), model.end()));
  }
  bool Exists(const std::string& name) const { return std::filesystem::exists(Path(name)); }
};

TEST_F(ModelProgram, ChecksTableByTable) {
  const std::string file = Write("m.bin", Good());
  EXPECT_EQ(Run("$QZ model check " + file), 0);
  EXPECT_THAT(out_, HasSubstr("\nw6    12032 bytes  valid\n"));
  EXPECT_THAT(out_, HasSubstr("\n" + file + ": valid\n"));

  PackedModel bad = Good();
  const auto& w4 = *model::FindTable(4);
  model::Store(bad, w4.ScaleOffset(9), -1.0f);
  model::Store<int8_t>(bad, w4.WeightOffset(0, 3, 59), -128);
  EXPECT_EQ(Run("$QZ model check " + Write("m.bin", bad)), 1);
  EXPECT_THAT(out_, HasSubstr("\nw4     4352 bytes  2 findings\n" + file +
                              ": w4, block 1: the scale of column 9 is -1; "));
  EXPECT_THAT(out_, HasSubstr("\n" + file + ": not valid: 2 findings\n"));
  bad.pop_back();
  EXPECT_EQ(Run("$QZ model check " + Write("m.bin", bad)), 1);
  EXPECT_EQ(out_, file + ": The packed model has 85999 bytes; expected 86000.\n");
  EXPECT_EQ(Run("$QZ model check " + Path("none")), 3);
  EXPECT_EQ(Run("$QZ model"), 2);
}

TEST_F(ModelProgram, ExportsAndImportsToTheByte) {
  const std::string file = Write("m.bin", Good());
  ASSERT_EQ(Run("$QZ model export " + file + " -o " + Path("a.npz")), 0) << err_;
  ASSERT_EQ(Run("$QZ model import " + Path("a.npz") + " -o " + Path("b.bin")), 0) << err_;
  ASSERT_EQ(Run("$QZ model export " + Path("b.bin") + " -o " + Path("b.npz")), 0) << err_;
  EXPECT_TRUE(Contents("b.bin") == Contents("m.bin"));
  EXPECT_TRUE(Contents("b.npz") == Contents("a.npz"));

  std::string archive = Contents("a.npz");
  archive.resize(archive.size() / 2);
  EXPECT_EQ(Run("$QZ model import " + WriteBytes("half.npz", archive) + " -o " + Path("x")), 3);
  EXPECT_EQ(err_, "qz: " + Path("half.npz") + ": not an archive of arrays (.npz)\n");
  PackedModel bad = Good();
  model::Store(bad, model::FindTable(1)->ScaleOffset(0), NAN);
  EXPECT_EQ(Run("$QZ model export " + Write("bad.bin", bad) + " -o " + Path("x")), 1);
  EXPECT_THAT(err_, HasSubstr("w1, block 0: the scale of column 0 is nan"));
  EXPECT_FALSE(Exists("x"));
  EXPECT_EQ(Run("$QZ model import " + Path("a.npz") + " -o " + Path("none/x")), 5);
  EXPECT_THAT(err_, HasSubstr(Path("none/x") + ": can't be written"));
}

TEST_F(ModelProgram, ShowsTablesAndTensors) {
  const std::string file = Write("m.bin", Good());
  const std::string sound =
      WriteSound("a.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_16, 16000, 1,
                 test::Random(1).Fill<int16_t>(5 * test::kSecond, -9000, 9000));
  EXPECT_EQ(Run("$QZ model info " + file + " --clip " + sound), 0) << err_;
  EXPECT_THAT(out_, HasSubstr("\nw3      3 depthwise  3 x 60          704  "));
  EXPECT_THAT(out_, HasSubstr(" frames with the silence behind it, "));
  EXPECT_THAT(out_, HasSubstr("\n19 logistic     1 x 5 "));
  EXPECT_EQ(Run("$QZ model info " + file + " --clip " + Path("none.wav")), 3);
  EXPECT_EQ(out_, "");
  EXPECT_EQ(Run("$QZ model info " + WriteBytes("m.bin", "x")), 1);
}

// On every machine, compiler and optimisation level.
TEST(SyntheticModel, FollowsItsSeedAndNothingElse) {
  EXPECT_EQ(base::Digest(Good().data(), Good().size()), 5163167844880385850u);
  EXPECT_NE(model::MakeSyntheticModel(UINT64_MAX), Good());
}

// By the reference evaluation of the network, over two windows.
TEST(ModelInfo, SummarisesTensorsAsTheyAre) {
  std::vector<uint16_t> features;
  for (const uint64_t seed : {1, 2}) {
    for (const int8_t value : model::SyntheticWindow(seed).values) {
      features.push_back(static_cast<uint16_t>(value + 128));
    }
  }
  constexpr size_t kStep = config::kFramesBetweenRuns * config::kFeatureChannels;
  features.resize(config::kWindow.Values() + kStep);
  const TensorSummaries tensors = TensorsOf(Good(), features);
  ASSERT_EQ(tensors.runs, 2u);
  std::vector<int8_t> values[model::kOperators - 1];
  std::array<float, config::kClasses> scores{};
  for (const size_t first : {size_t{0}, kStep}) {
    model::Tensor window(model::kInputRows, model::kInputChannels);
    std::transform(features.data() + first, features.data() + first + config::kWindow.Values(),
                   window.values.begin(), detector::NetworkInput);
    const model::NetworkRun run = model::RunNetwork(Good(), window);
    for (size_t op = 0; op < std::size(values); ++op) {
      const std::vector<int8_t>& out = run.outputs[op].values;
      values[op].insert(values[op].end(), out.begin(), out.end());
    }
    for (size_t i = 0; i < scores.size(); ++i) scores[i] = std::max(scores[i], run.scores[i]);
  }
  EXPECT_EQ(tensors.max_scores, scores);
  for (size_t op = 0; op < std::size(values); ++op) {
    const TensorSummary& summary = tensors.outputs[op];
    const auto count = [&](int value) {
      return std::count(values[op].begin(), values[op].end(), value);
    };
    EXPECT_EQ(summary.values, values[op].size()) << op;
    EXPECT_EQ(summary.min, *std::min_element(values[op].begin(), values[op].end())) << op;
    EXPECT_EQ(summary.max, *std::max_element(values[op].begin(), values[op].end())) << op;
    EXPECT_EQ(summary.at_min_int8, static_cast<uint64_t>(count(-128))) << op;
    EXPECT_EQ(summary.at_max_int8, static_cast<uint64_t>(count(127))) << op;
  }
}

}  // namespace
}  // namespace qz::tools
