// SPDX-License-Identifier: Apache-2.0
// qz eval as a whole, run from a shell on a small set of noises.

#include <gmock/gmock.h>

#include <algorithm>
#include <filesystem>
#include <sstream>

#include "evaluation/clip_scores.h"
#include "model/model_files.h"
#include "model/synthetic_model.h"
#include "tests/tools/qz_program.h"

namespace qz::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::StartsWith;

class EvalCommand : public QzProgram {
 protected:
  EvalCommand() {
    for (int fold = 0; fold <= 2; ++fold) {
      for (const std::string name :
           {"dog_bark", "baby_cry", "rooster", "clock_tick", "person_sneeze", "rain"}) {
        const std::string file = std::to_string(fold) + name + ".wav";
        lines_.append(file).append(1, '\t').append(name).append(1, '\t');
        lines_.append(std::to_string(fold)).append(1, '\n');
        WriteSound(file, SF_FORMAT_WAV | SF_FORMAT_PCM_16, 16000, 1, Sound(file));
      }
    }
    WriteBytes("list.tsv", lines_);
  }

  // A noise of its own for each file.
  static std::vector<int16_t> Sound(const std::string& file) {
    uint64_t seed = 0;
    for (const char c : file) seed = 31 * seed + static_cast<uint64_t>(c);
    Random random(seed);
    return random.Fill<int16_t>(4 * kSecond, -20000 / (1 + random.Between(0, 99)), 3000);
  }

  int Eval(const std::string& words) { return Run("cd " + Path("") + " && $QZ eval " + words); }

  // The list without the lines that hold `part`.
  std::string LinesWithout(const std::string& part) const {
    std::istringstream all(lines_);
    std::string kept;
    for (std::string line; std::getline(all, line);) {
      if (line.find(part) == std::string::npos) kept += line + '\n';
    }
    return kept;
  }

  // The line of --scores-out.
  std::string ExpectedScores(const std::string& name, int fold,
                             const model::PackedModel& packed) const {
    const std::string file = std::to_string(fold) + name + ".wav";
    std::string line = file + '\t' + name + '\t' + std::to_string(fold);
    for (const float score : evaluation::ScoreClip(packed, Sound(file)).max) {
      char text[32];
      std::snprintf(text, sizeof text, "\t%.8f", static_cast<double>(score));
      line += text;
    }
    return '\n' + line + '\n';
  }

  std::string lines_ = "file\tclass\tfold\n";
};

TEST_F(EvalCommand, MeasuresTheModuleModelOnAllFoldsButTheNoughth) {
  ASSERT_EQ(Eval("list.tsv --scores-out scores.tsv"), 0) << err_;
  EXPECT_EQ(err_, "");
  EXPECT_THAT(out_, StartsWith("list.tsv: 12 clips, 48.0 s of audio\nmodel "));
  EXPECT_THAT(out_, HasSubstr("\nperson sneeze      2  "));
  EXPECT_THAT(out_, HasSubstr("\nRecall: at 0 false alarms of the class, one per 300 s"));
  const std::string scores = Contents("scores.tsv");
  EXPECT_THAT(scores, StartsWith("file\tclass\tfold\tdog_bark\tbaby_cry\trooster\t"));
  EXPECT_EQ(std::count(scores.begin(), scores.end(), '\n'), 13);
  const model::PackedModel packed = model::ReadModelFile(QZ_MODEL);
  EXPECT_THAT(scores, HasSubstr(ExpectedScores("rain", 1, packed)));
  EXPECT_THAT(scores, HasSubstr(ExpectedScores("baby_cry", 2, packed)));

  ASSERT_EQ(Eval("list.tsv --fold 2 --json"), 0) << err_;
  EXPECT_THAT(out_, StartsWith(R"({"type":"evaluation","manifest":"list.tsv","skipped":0,)"
                               R"("clips":6,"audio_s":24.0,"false_alarms_allowed":0,)"));
  EXPECT_THAT(out_, HasSubstr(R"("fold":2,"clips":6)"));
  EXPECT_EQ(std::count(out_.begin(), out_.end(), '\n'), 1);
}

TEST_F(EvalCommand, ScoresEachFoldByItsOwnModel) {
  for (const uint64_t seed : {1, 2}) {
    const model::PackedModel packed = model::MakeSyntheticModel(seed);
    WriteBytes("model" + std::to_string(seed), {packed.begin(), packed.end()});
  }
  ASSERT_EQ(Eval("list.tsv --fold-model 2=model2 --fold-model 1=model1 --scores-out s"), 0) << err_;
  EXPECT_THAT(out_, HasSubstr("\nfold 1: model model1\nfold 2: model model2\n"));
  EXPECT_THAT(out_, HasSubstr("\nMeans over the folds:\n"));
  EXPECT_THAT(Contents("s"), HasSubstr(ExpectedScores("rooster", 1, model::MakeSyntheticModel(1))));
  EXPECT_THAT(Contents("s"), HasSubstr(ExpectedScores("rooster", 2, model::MakeSyntheticModel(2))));
}

TEST_F(EvalCommand, NamesSkipsAndCountsWhatCannotBeRead) {
  std::filesystem::remove(Path("1rain.wav"));
  WriteBytes("2rain.wav", "no sound");
  WriteSound("2rooster.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_16, 16000, 1, std::vector<int16_t>());
  EXPECT_EQ(Eval("list.tsv"), 3);
  EXPECT_EQ(std::count(err_.begin(), err_.end(), '\n'), 4) << err_;
  for (const char* message : {"qz: skipped: 1rain.wav: ", "qz: skipped: 2rain.wav: ",
                              "qz: skipped: 2rooster.wav: ", "qz: skipped 3 of 12 clips\n"}) {
    EXPECT_THAT(err_, HasSubstr(message));
  }
  EXPECT_THAT(out_, StartsWith("list.tsv: 9 clips, 36.0 s of audio, 3 skipped\n"));

  std::filesystem::remove(Path("1rooster.wav"));
  EXPECT_EQ(Eval("list.tsv --scores-out s"), 3);
  EXPECT_THAT(err_, HasSubstr("qz: list.tsv: no clip of rooster that can be read"));
  EXPECT_EQ(out_, "");
  EXPECT_FALSE(std::filesystem::exists(Path("s")));
}

TEST_F(EvalCommand, PrintsInOneLineWhyItMeasuresNothing) {
  WriteBytes("no_tick.tsv", LinesWithout("clock_tick\t2"));
  WriteBytes("short.tsv", lines_ + "a.wav\train\n");
  model::PackedModel invalid = model::MakeSyntheticModel(1);
  model::Store<int8_t>(invalid, model::kTables[4].WeightOffset(0, 0, 0), -128);
  WriteBytes("invalid", {invalid.begin(), invalid.end()});
  const std::tuple<std::string, int, std::string> cases[] = {
      {"no_tick.tsv --fold 2", 3, "no_tick.tsv: fold 2: no clip of clock_tick, should be"},
      {"list.tsv --fold 3", 3, "list.tsv: fold 3: no clip of dog_bark, baby_cry, rooster, clock"},
      {"short.tsv", 3, "short.tsv: line 20: 2 fields, should be 3"},
      {"absent.tsv", 3, "absent.tsv: can't be opened"},
      {"list.tsv --model list.tsv", 3, "list.tsv: The packed model has "},
      {"list.tsv --fold-model 1=invalid", 3, "invalid: w6, block 0: the weight of column 0"},
      {"list.tsv --labels list.tsv", 3,
       "list.tsv: line 1: the first line should be: output, category"},
      {"list.tsv --fold-model 1", 2, "--fold-model: 1 should be FOLD=FILE"},
      {"list.tsv --fold-model 08=a --fold-model 8=b", 2, "--fold-model: 8=b is a second model"},
      {"list.tsv --fold 1 --fold-model 1=a", 2, "--fold"}};
  for (const auto& [words, exit_code, message] : cases) {
    EXPECT_EQ(Eval(words + " --scores-out s"), exit_code) << words;
    EXPECT_EQ(out_, "") << words;
    EXPECT_THAT(err_, AllOf(StartsWith("qz: "), HasSubstr(message)));
    EXPECT_EQ(std::count(err_.begin(), err_.end(), '\n'), 1) << err_;
    EXPECT_FALSE(std::filesystem::exists(Path("s")));
  }
  EXPECT_EQ(Eval("list.tsv --scores-out absent/s"), 5);
  EXPECT_THAT(err_, HasSubstr("qz: absent/s"));
}

}  // namespace
}  // namespace qz::test
