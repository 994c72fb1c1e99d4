// SPDX-License-Identifier: Apache-2.0
// qz-train's two commands on files: what they write, what they skip, what they refuse.

#include "train/train_command.h"

#include <gmock/gmock.h>
#include <sndfile.h>

#include <cmath>
#include <filesystem>
#include <fstream>

#include "model/check_weights.h"
#include "model/model_files.h"
#include "tests/support/temporary_folder.h"
#include "train/prove_model_command.h"

namespace qz::train {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::ThrowsMessage;

// Six short sounds in each of two folds, one of which is held out, and one that is not there.
class Commands : public testing::Test {
 protected:
  void SetUp() override {
    std::ofstream(folder_.Path("recipe")) << "teachers 1\nepochs 1\ntuning_epochs 1\nmin_steps 1\n"
                                          << "min_tuning_steps 1\nbatch 4\n";
    options_.output = folder_.Path("model");
    options_.recipe_file = folder_.Path("recipe");
    options_.labels_file = QZ_LABELS;
    options_.state_file = folder_.Path("state");
    options_.hold_out = 2;
    options_.manifest = folder_.Path("list");
    std::ofstream list(options_.manifest);
    list << "file\tclass\tfold\n";
    const char* const classes[] = {"dog_bark",   "baby_cry",      "rooster",
                                   "clock_tick", "person_sneeze", "rain"};
    for (int i = 0; i < 12; ++i) {
      const std::string name = std::to_string(i) + ".wav";
      WriteTone(folder_.Path(name), 0.1 * (i + 1));
      list << name << "\t" << classes[i % 6] << "\t" << 1 + i / 6 << "\n";
    }
    list << "absent.wav\train\t1\n";
  }

  static void WriteTone(const std::string& path, double step) {
    SF_INFO info = {};
    info.samplerate = 16000;
    info.channels = 1;
    info.format = SF_FORMAT_WAV | SF_FORMAT_PCM_16;
    SNDFILE* const file = sf_open(path.c_str(), SFM_WRITE, &info);
    ASSERT_NE(file, nullptr);
    std::vector<double> tone(20000);
    for (size_t i = 0; i < tone.size(); ++i)
      tone[i] = 0.2 * std::sin(step * static_cast<double>(i));
    sf_write_double(file, tone.data(), static_cast<sf_count_t>(tone.size()));
    sf_close(file);
  }

  std::string Fit() {
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    exit_code_ = TrainCommand(options_);
    return testing::internal::GetCapturedStderr() + testing::internal::GetCapturedStdout();
  }

  const test::TemporaryFolder folder_;
  TrainOptions options_;
  base::ExitCode exit_code_ = base::kSuccess;
};

TEST_F(Commands, FitWritesAValidModelAndNamesWhatItSkipped) {
  EXPECT_THAT(Fit(),
              AllOf(HasSubstr("skipped: " + folder_.Path("absent.wav") + ": can't be opened"),
                    HasSubstr("training on 6 clips, validating on 6, 1 skipped"),
                    HasSubstr("on 6 clips that were held out"), HasSubstr("loss of quantisation"),
                    HasSubstr(" of 21 operators: "), HasSubstr(", the same\n")));
  EXPECT_EQ(exit_code_, base::kUnreadableInput);
  const model::PackedModel model = model::ReadModelFile(options_.output);
  EXPECT_TRUE(model::CheckWeights(model).empty());
  testing::internal::CaptureStdout();
  EXPECT_EQ(ProveModelCommand(options_.output, options_.manifest), base::kUnreadableInput);
  EXPECT_THAT(testing::internal::GetCapturedStdout(),
              AllOf(HasSubstr("on 12 clips: "), HasSubstr(", the same\n")));
}

TEST_F(Commands, FitWarnsOfFewClipsAndOfAModelThatFailsOnThem) {
  std::ofstream list(options_.manifest, std::ios::app);
  for (int i = 0; i < 19; ++i) {
    const std::string copy = "copy" + std::to_string(i) + ".wav";
    std::filesystem::create_hard_link(folder_.Path("4.wav"), folder_.Path(copy));
    list << copy << "\tperson_sneeze\t1\n";
  }
  list.close();
  EXPECT_THAT(Fit(),
              AllOf(HasSubstr("warning: few clips to train on: dog_bark 1, baby_cry 1, rooster 1, "
                              "clock_tick 1; expected 20 or more a class\n"),
                    Not(HasSubstr("warning: the model"))));
  options_.hold_out = 0;
  EXPECT_THAT(Fit(), HasSubstr("warning: the model does not recognise its own clips: mean AP 0."));
}

TEST_F(Commands, RefuseBeforeTheWorkBegins) {
  const auto fit = [&] { TrainCommand(options_); };
  options_.hold_out = 3;
  EXPECT_THAT(fit, ThrowsMessage<std::runtime_error>(
                       HasSubstr("no clip of the class 'dog_bark' to validate on in fold 3")));
  options_.hold_out = 0;
  std::ofstream(options_.state_file) << "something";
  EXPECT_THAT(fit, ThrowsMessage<std::runtime_error>(HasSubstr("state: is of another run")));
  for (const std::string& location : {folder_.Path("absent/model"), folder_.Path("")}) {
    options_.output = location;
    EXPECT_THAT(fit, ThrowsMessage<std::runtime_error>(HasSubstr("be written: "))) << location;
  }
  options_.output = options_.state_file;
  EXPECT_THAT(fit, ThrowsMessage<std::runtime_error>(HasSubstr("the model and the state at once")));
  EXPECT_FALSE(std::filesystem::exists(folder_.Path("model")));
  std::ofstream(folder_.Path("model")) << "four";
  EXPECT_THAT([&] { ProveModelCommand(folder_.Path("model"), options_.manifest); },
              ThrowsMessage<std::runtime_error>(HasSubstr("has 4 bytes; expected 86000")));
}

}  // namespace
}  // namespace qz::train
