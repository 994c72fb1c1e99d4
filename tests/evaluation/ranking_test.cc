// SPDX-License-Identifier: Apache-2.0
// Ranking metrics: values worked out by hand, and the definitions followed word by word.

#include "evaluation/ranking.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <stdexcept>

#include "tests/support/random.h"

namespace qz::evaluation {
namespace {

using Scores = std::vector<float>;
using Truths = std::vector<bool>;

TEST(Ranking, GivesTheValuesWorkedOutByHand) {
  const Scores scores = {0.9f, 0.8f, 0.7f, 0.6f, 0.5f};
  const Truths truths = {true, false, true, false, true};
  EXPECT_DOUBLE_EQ(*AveragePrecision(scores, truths), (1.0 + 2.0 / 3 + 3.0 / 5) / 3);
  EXPECT_DOUBLE_EQ(*RocAuc(scores, truths), 3.0 / 6);
  const double recalls[] = {1.0 / 3, 2.0 / 3, 1, 1};
  for (size_t allowed = 0; allowed < 4; ++allowed) {
    EXPECT_DOUBLE_EQ(*RecallAtFalseAlarms(scores, truths, allowed), recalls[allowed]) << allowed;
  }

  // A positive that shares its score with two negatives can't be had without them.
  const Scores tied = {0.5f, 1, 0.5f, 0, 0.5f};
  const Truths first_two = {true, true, false, false, false};
  EXPECT_DOUBLE_EQ(*AveragePrecision(tied, first_two), (1.0 + 2.0 / 4) / 2);
  EXPECT_DOUBLE_EQ(*RocAuc(tied, first_two), (3 + 1 + 2 * 0.5) / 6);
  EXPECT_DOUBLE_EQ(*RecallAtFalseAlarms(tied, first_two, 1), 0.5);
  EXPECT_DOUBLE_EQ(*RecallAtFalseAlarms(tied, first_two, 2), 1);

  const Scores equal(4, 0.25f);
  const Truths one = {false, false, true, false};
  EXPECT_DOUBLE_EQ(*AveragePrecision(equal, one), 0.25);
  EXPECT_DOUBLE_EQ(*RocAuc(equal, one), 0.5);
  EXPECT_DOUBLE_EQ(*RecallAtFalseAlarms(equal, one, 2), 0);
  EXPECT_DOUBLE_EQ(*RocAuc({NAN, 0, NAN, -1}, {false, true, true, false}), 2.5 / 4);
}

TEST(Ranking, HasNothingToTellApartWithoutBothKinds) {
  for (const Truths& truths : {Truths{}, Truths(3, true), Truths(3, false)}) {
    const Scores scores(truths.size(), 0.5f);
    EXPECT_FALSE(AveragePrecision(scores, truths));
    EXPECT_FALSE(RocAuc(scores, truths));
    EXPECT_FALSE(RecallAtFalseAlarms(scores, truths, 1));
  }
  EXPECT_THROW(RocAuc({1, 2}, {true}), std::invalid_argument);
}

struct Reached {
  double positives = 0;
  double negatives = 0;
};

Reached Reach(const Scores& scores, const Truths& truths, float threshold) {
  Reached reached;
  for (size_t i = 0; i < scores.size(); ++i) {
    if (scores[i] >= threshold) ++(truths[i] ? reached.positives : reached.negatives);
  }
  return reached;
}

TEST(Ranking, EqualsItsDefinitionOnRandomScores) {
  test::Random random(5);
  int compared = 0;
  for (int round = 0; round < 300; ++round) {
    const size_t clips = random.Pick(2, 40);
    const int64_t values = random.Between(1, 12);  // few, for ties
    Scores scores(clips);
    Truths truths(clips);
    for (size_t i = 0; i < clips; ++i) {
      scores[i] = static_cast<float>(random.Between(0, values)) / 256;
      truths[i] = random.Next() % 3 == 0;
    }
    const size_t allowed = random.Pick(0, 5);
    double precision = 0, won = 0, most = 0, positives = 0, pairs = 0;
    for (size_t i = 0; i < clips; ++i) {
      const Reached reached = Reach(scores, truths, scores[i]);
      if (reached.negatives <= static_cast<double>(allowed)) {
        most = std::max(most, reached.positives);
      }
      if (!truths[i]) continue;
      ++positives;
      precision += reached.positives / (reached.positives + reached.negatives);
      for (size_t j = 0; j < clips; ++j) {
        if (truths[j]) continue;
        ++pairs;
        won += scores[i] > scores[j] ? 1 : scores[i] == scores[j] ? 0.5 : 0;
      }
    }
    if (pairs == 0) continue;
    ++compared;
    EXPECT_NEAR(*AveragePrecision(scores, truths), precision / positives, 1e-12);
    EXPECT_NEAR(*RocAuc(scores, truths), won / pairs, 1e-12);
    EXPECT_NEAR(*RecallAtFalseAlarms(scores, truths, allowed), most / positives, 1e-12);
  }
  EXPECT_GT(compared, 200);
}

}  // namespace
}  // namespace qz::evaluation
