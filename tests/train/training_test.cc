// SPDX-License-Identifier: Apache-2.0
// Runs on a few synthetic sounds: the same seed gives the same model, stops don't matter, tones are
// recognised after training, and which recipes are refused.

#include <gmock/gmock.h>

#include <cmath>
#include <filesystem>
#include <fstream>

#include "model/labels.h"
#include "model/model_files.h"
#include "tests/support/temporary_folder.h"
#include "train/adam.h"
#include "train/recipe.h"
#include "train/state_file.h"
#include "train/trainer.h"

namespace qz::train {
namespace {

using testing::HasSubstr;

// A tone for each output, and noise of no class.
std::vector<Clip> Tones(int of_each) {
  std::vector<Clip> clips;
  for (int i = 0; i < 6 * of_each; ++i) {
    base::NumberGenerator random(static_cast<uint64_t>(i));
    Clip clip;
    clip.output = i % 6 == 5 ? -1 : i % 6;
    const double step = 0.1 * (1 + clip.output) * random.Uniform(0.95, 1.05);
    for (int n = 0; n < 40000; ++n) {
      const double value = clip.output < 0 ? random.Bell() : std::sin(step * n) * (n % 8000 < 4000);
      clip.samples.push_back(static_cast<int16_t>(3000 * value));
    }
    clips.push_back(clip);
  }
  return clips;
}

Recipe ShortRecipe() {
  Recipe recipe;
  recipe.teachers = 2;
  recipe.epochs = 2;
  recipe.tuning_epochs = 2;
  recipe.min_steps = recipe.min_tuning_steps = 1;
  recipe.batch = 4;
  recipe.windows = 1;
  return recipe;
}

TrainingState RunTo(int epochs, Trainer* trainer, TrainingState state = TrainingState()) {
  while (state.epoch < epochs) trainer->RunEpoch(&state);
  return state;
}

TEST(Trainer, SameSeedSameModelWhateverTheThreadsAndStops) {
  const Recipe recipe = ShortRecipe();
  const std::vector<Clip> clips = Tones(1);
  Trainer one(recipe, 5, 1, clips), two(recipe, 5, 2, clips), other_seed(recipe, 6, 1, clips);
  const Values straight = RunTo(6, &one).average;
  EXPECT_EQ(RunTo(6, &two).average, straight);
  EXPECT_NE(RunTo(6, &other_seed).average, straight);

  const test::TemporaryFolder folder;
  const std::string file = folder.Path("state"), mark = Fingerprint(recipe, 5, clips, {});
  EXPECT_FALSE(ReadState(file, mark));
  for (const int stop : {1, 2, 3, 4, 5}) {  // within phases and between them
    WriteState(file, mark, RunTo(stop, &one));
    EXPECT_EQ(RunTo(6, &one, *ReadState(file, mark)).average, straight) << stop;
  }
  EXPECT_THROW(ReadState(file, Fingerprint(recipe, 6, clips, {})), std::runtime_error);
  std::fstream(file, std::ios::in | std::ios::out).seekp(-20000, std::ios::end).put('!');
  EXPECT_THROW(ReadState(file, mark), std::runtime_error);
  std::filesystem::resize_file(file, std::filesystem::file_size(file) - 1);
  EXPECT_THROW(ReadState(file, mark), std::runtime_error);
}

// The order of Eigen's sums follows from where a row begins, and with it the last bits.
TEST(Trainer, NumbersAreAlignedWhereverTheyAre) {
  std::vector<std::vector<char>> between;
  for (size_t i = 1; i < 20; ++i) {
    between.emplace_back(16 * i);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(Values(1000 * i).data()) % 32, 0u);
  }
}

TEST(Trainer, RecognisesTonesInFloatAndInt8) {
  Recipe recipe = ShortRecipe();
  recipe.teachers = 1;
  recipe.epochs = 120;
  recipe.tuning_epochs = 3;
  // Two tones, or one played faster, are like another.
  recipe.mix_share = recipe.speed_share = recipe.shift_share = recipe.dropout = 0;
  recipe.tilt = recipe.time_masks = recipe.channel_masks = 0;
  recipe.batch = 6;
  recipe.average = 0.8;
  const std::vector<Clip> clips = Tones(2);
  Trainer trainer(recipe, 1, 2, clips);
  const TrainingState state = RunTo(123, &trainer);
  EXPECT_TRUE(trainer.Done(state));
  std::vector<Batch> features;
  features.reserve(clips.size());
  for (const Clip& clip : clips) features.push_back(ValidationFeatures(clip.samples));
  const Metrics by_float = MetricsOf(ScoresOf(state.teachers[0], features), clips);
  const Metrics by_device =
      MetricsOf(ScoresOf(QuantisedParameters(state.average), features), clips);
  EXPECT_EQ(by_device.outputs, 5);
  EXPECT_GT(by_float.average_precision, 0.9);
  EXPECT_GT(by_device.average_precision, 0.85);
}

// Few recordings make few steps an epoch: there are as many epochs as the steps take.
TEST(Trainer, RunsAtLeastTheStepsOfTheRecipe) {
  Recipe recipe = ShortRecipe();
  recipe.teachers = 1;
  recipe.min_steps = 9;
  recipe.min_tuning_steps = 4;
  const std::vector<Clip> clips = Tones(1);  // 2 steps an epoch
  Trainer trainer(recipe, 1, 1, clips);
  TrainingState state;
  EXPECT_EQ(trainer.EpochsLeft(state), 5 + 2);
  state = RunTo(4, &trainer);
  EXPECT_FALSE(trainer.Tuning(state));
  state = RunTo(5, &trainer, state);
  EXPECT_TRUE(trainer.Tuning(state));
  EXPECT_TRUE(trainer.Accepts(state));
  EXPECT_EQ(trainer.EpochsLeft(state), 2);
  EXPECT_TRUE(trainer.Done(RunTo(7, &trainer, state)));
}

TEST(Trainer, TuningBeginsWithTheFirstTeacherHoweverItEnded) {
  const Recipe recipe = ShortRecipe();
  const std::vector<Clip> clips = Tones(1);
  Trainer trainer(recipe, 1, 1, clips);
  TrainingState state = RunTo(1, &trainer);
  Values best = state.average;
  best[0] = 0.25f;
  trainer.EndTeacher(best, &state);  // with an epoch to go
  EXPECT_EQ(trainer.EpochsLeft(state), 4);
  state = RunTo(3, &trainer, state);
  ASSERT_TRUE(trainer.Tuning(state));
  EXPECT_EQ(state.teachers[0][0], 0.25f);
  state = RunTo(4, &trainer, state);
  EXPECT_NEAR(state.average[0], 0.25f, 0.01f);
  EXPECT_TRUE(trainer.Done(RunTo(5, &trainer, state)));
}

TEST(Augmentation, JoinsLabelsAndStaysInRange) {
  Recipe recipe = ShortRecipe();
  recipe.mix_share = 1;
  recipe.noise_share = 1;
  const std::vector<Clip> clips = Tones(1);
  const Augmentation augmentation(recipe, clips);
  Batch features;
  features.Resize(2, FramesFor(1), 48);
  Matrix targets(2, 5);
  bool joined = false;
  for (uint64_t seed = 0; seed < 40; ++seed) {
    augmentation.Make(seed % 5, seed, 1, &features, &targets);
    EXPECT_EQ(targets(1, static_cast<Eigen::Index>(seed % 5)), 1);
    joined |= targets.row(1).sum() == 2;
    const auto made = features.values.bottomRows(FramesFor(1));
    EXPECT_GE(made.minCoeff(), 0);
    EXPECT_LE(made.maxCoeff(), 255);
    EXPECT_GT(made.maxCoeff(), 60) << "the clip is not in the features";
  }
  EXPECT_TRUE(joined);
}

// As a clip is measured: from a fresh start, with its first sample.
TEST(Augmentation, StartsAtTheClipIfTheRecipeSetsIt) {
  Recipe recipe = ShortRecipe();
  recipe.start_share = 1;
  recipe.min_gain = recipe.max_gain = 0;
  recipe.mix_share = recipe.speed_share = recipe.noise_share = recipe.shift_share = 0;
  recipe.tilt = recipe.time_masks = recipe.channel_masks = 0;
  const std::vector<Clip> clips = Tones(1);
  Batch features;
  features.Resize(1, FramesFor(1), 48);
  Matrix targets(1, 5);
  Augmentation(recipe, clips).Make(2, 3, 0, &features, &targets);
  const Batch measured = ValidationFeatures(clips[2].samples);
  EXPECT_TRUE(features.values == measured.values.topRows(FramesFor(1)));
}

TEST(Recipe, IsReadAndRefused) {
  const test::TemporaryFolder folder;
  const std::string file = folder.Path("recipe");
  const auto read = [&](const std::string& text) {
    std::ofstream(file) << text;
    return ReadRecipe(file);
  };
  EXPECT_THROW(ReadRecipe(folder.Path("")), std::runtime_error);
  const Recipe recipe = read("# mine\n\nepochs 7 # few\nrate 0.5\n");
  EXPECT_EQ(recipe.epochs, 7);
  EXPECT_EQ(recipe.rate, 0.5);
  EXPECT_EQ(Describe(read(Describe(recipe))), Describe(recipe));
  const std::pair<const char*, const char*> kBad[] = {
      {"epochs\n", "line 1: expected a name and a value"},
      {"rate 0.1\nepochs 1.5\n", "line 2: epochs is '1.5', expected a whole number from 1 to"},
      {"rate nan\n", "rate is 'nan', expected a number from 0 to 1"},
      {"rate 1x\n", "rate is '1x'"},
      {"batch 5\n", "batch is 5, expected an even"},
      {"min_snr 9\nmax_snr 8\n", "min_gain or min_snr is above its maximum"},
      {"speed 1\n", "line 1: unknown name 'speed'"}};
  for (const auto& [text, message] : kBad) {
    try {
      read(text);
      ADD_FAILURE() << text;
    } catch (const std::runtime_error& error) {
      EXPECT_THAT(error.what(), HasSubstr(message));
    }
  }
}

}  // namespace
}  // namespace qz::train
