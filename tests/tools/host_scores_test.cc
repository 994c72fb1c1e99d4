// SPDX-License-Identifier: Apache-2.0
// Host-side scores: tables of thresholds, the detection rules, the output.

#include <gmock/gmock.h>

#include "tests/support/temporary_folder.h"
#include "tools/run/detection_rules.h"
#include "tools/run/report_format.h"

namespace qz::tools {
namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

const model::Labels kLabels = {{{0, "dog_bark", "dog bark"},
                                {6, "baby_cry", "baby cry"},
                                {17, "rooster", "rooster"},
                                {15, "clock_tick", "clock tick"},
                                {18, "person_sneeze", "person sneeze"}}};

constexpr uint64_t kSecondNs = 1'000'000'000;

TEST(DetectionRules, DetectsAboveTheThresholdAndAfterTheCoolingTime) {
  DetectionTable table;
  table[0] = {0.5f, 4 * kSecondNs};
  table[2] = {0.0f, 0};
  DetectionRules rules(table);
  const float above = std::nextafter(0.5f, 1.0f);
  EXPECT_THAT(rules.Detect({0.5f, 1, 0, 1, 1}, 2 * kSecondNs), IsEmpty());
  EXPECT_THAT(rules.Detect({above, 0, 0.1f, 0, 0}, 4 * kSecondNs), ElementsAre(0, 2));
  // Rests up to and with the moment at which the cooling time has passed.
  EXPECT_THAT(rules.Detect({1, 0, 0.1f, 0, 0}, 6 * kSecondNs), ElementsAre(2));
  EXPECT_THAT(rules.Detect({1, 0, 0, 0, 0}, 8 * kSecondNs), IsEmpty());
  EXPECT_THAT(rules.Detect({1, 0, 0, 0, 0}, 8 * kSecondNs + 1), ElementsAre(0));
  EXPECT_THAT(rules.Detect({1, 0, 0, 0, 0}, 12 * kSecondNs + 1), IsEmpty());
  // A cooling time of 0 rests no longer than its own moment.
  EXPECT_THAT(rules.Detect({0, 0, 1, 0, 0}, 6 * kSecondNs), IsEmpty());
  EXPECT_THAT(rules.Detect({0, 0, 1, 0, 0}, 6 * kSecondNs + 1), ElementsAre(2));
}

class RulesFile : public testing::Test, protected test::TemporaryFolder {
 protected:
  DetectionTable Read(const std::string& text) const {
    return ReadDetectionTable(WriteBytes("t", text), kLabels);
  }
  std::string Refusal(const std::string& text) const {
    try {
      Read(text);
    } catch (const std::runtime_error& error) {
      return error.what();
    }
    return "accepted";
  }
};

const std::string kHeader = "class\tthreshold\tcooling_s\n";
const std::string kFour =
    "baby_cry\t0\t0\nrooster\t1\t1e6\nclock_tick\t0.3\t0\nperson_sneeze\t0\t0\n";

TEST_F(RulesFile, GivesEachClassItsLineInAnyOrder) {
  const DetectionTable rules =
      Read("# mine\n\n" + kHeader + "person_sneeze\t1.0\t2.5\r\nclock_tick\t0.1\t1e-9\n" +
           "rooster\t0\t0\nbaby_cry\t0.25\t1000000\ndog_bark\t.5\t3");
  const float thresholds[] = {0.5f, 0.25f, 0, 0.1f, 1};
  const uint64_t cooling_ns[] = {3 * kSecondNs, 1000000 * kSecondNs, 0, 1, 2'500'000'000};
  for (size_t i = 0; i < rules.size(); ++i) {
    EXPECT_EQ(rules[i].threshold, thresholds[i]) << i;
    EXPECT_EQ(rules[i].cooling_ns, cooling_ns[i]) << i;
  }
}

TEST_F(RulesFile, RefusesWithFileAndLine) {
  const std::pair<std::string, std::string> cases[] = {
      {"", "t: no line for the class 'dog_bark'"},
      {"class threshold cooling_s\n", "t: line 1: the first line should be: class, threshold"},
      {kHeader + kFour, "t: no line for the class 'dog_bark'"},
      {kHeader + kFour + "cat\t1\t0\n",
       "t: line 6: the class is 'cat', expected one of dog_bark, "},
      {kHeader + kFour + "rooster\t1\t0\n", "t: line 6: the class 'rooster' has a line already"},
      {kHeader + "dog_bark\t1\n",
       "t: line 2: 2 fields, should be 3 between tabs: class, threshold, co"},
      {kHeader + "dog_bark\t1\t0\t0\n",
       "t: line 2: 4 fields, should be 3 between tabs: class, threshold, cooling_s"},
      {kHeader + "dog_bark\t1\t-1\n",
       "t: line 2: the cooling time is '-1', expected 0 to 1000000 s"},
      {kHeader + "dog_bark\t1\tinf\n", "t: line 2: the cooling time is 'inf', expected"},
      {kHeader + "dog_bark\t1.01\t0\n", "t: line 2: the threshold is '1.01', expected 0 to 1"},
      {kHeader + "dog_bark\tnan\t0\n", "t: line 2: the threshold is 'nan', expected 0 to 1"},
      {kHeader + "dog_bark\t\t0\n", "t: line 2: the threshold is '', expected 0 to 1"},
      {kHeader + "dog_bark\t0,5\t0\n", "t: line 2: the threshold is '0,5', expected 0 to 1"},
  };
  for (const auto& [text, expected] : cases) EXPECT_THAT(Refusal(text), HasSubstr(expected));
  EXPECT_THROW(ReadDetectionTable(Path(""), kLabels), std::runtime_error);
}

TEST(HostScoresFormat, MarksScoresAsTheToolsAndPaintsThemOnTerminals) {
  PassScores scores;
  scores.runs = 3;
  scores.single = {0.25f, 0.5f, 0.75f, 0.125f, 0};
  scores.confidences = {0.25f, 0.375f, 0.75f, 0.125f, 0};
  const Names names = kLabels;
  const auto plain = MakeTextFormat({}, names);
  EXPECT_EQ(plain->Scores(4 * kSecondNs, scores),
            "[   4.000 s] tool's view: dog bark 0.2500, baby cry 0.3750 (one run 0.5000), "
            "rooster 0.7500, clock tick 0.1250, person sneeze 0.0000");
  EXPECT_THAT(plain->Scores(2 * kSecondNs, {}), EndsWith("tool's view: no network run yet"));
  EXPECT_EQ(plain->HostDetection(4 * kSecondNs, scores, {1, 2}),
            "[   4.000 s] tool's view: would detect baby cry 0.3750, rooster 0.7500; no event of "
            "the module");

  const std::string rows = MakeTextFormat({true, false}, names)->Scores(4 * kSecondNs, scores);
  EXPECT_THAT(rows, AllOf(HasSubstr("tool's view: dog bark      [####............] 0.2500\n  "),
                          HasSubstr("  rooster       [############....] 0.7500\n"),
                          Not(HasSubstr("\x1b"))));
  const std::string colours = MakeTextFormat({true, true}, names)->Scores(4 * kSecondNs, scores);
  EXPECT_THAT(colours, AllOf(HasSubstr("\x1b[90mdog bark"), HasSubstr("\x1b[33mbaby cry"),
                             HasSubstr("\x1b[1;32mrooster"), EndsWith("0.0000\x1b[0m")));
  // The maximum of the low ones is marked too.
  scores.confidences[2] = 0;
  EXPECT_THAT(MakeTextFormat({true, true}, names)->Scores(0, scores),
              AllOf(HasSubstr("\x1b[1;33mbaby cry"), HasSubstr("\x1b[90mrooster")));
}

TEST(HostScoresFormat, PrintsNamesBesideKnownCodes) {
  hub::SoundReport report;
  report.results = {{6, 0.5f}, {7, 0.5f}};
  EXPECT_THAT(MakeTextFormat({}, kLabels)->Report(257, report),
              HasSubstr(": category 6 (baby cry) 0.5000, category 7 0.5000, model 0"));
  EXPECT_THAT(MakeTextFormat({}, {})->Report(257, report), HasSubstr(": category 6 0.5000, "));
  EXPECT_THAT(MakeJsonFormat({})->Report(257, report), Not(HasSubstr("name")));
  model::Labels odd = kLabels;
  odd[1].name = "\xff";
  EXPECT_THAT(MakeJsonFormat(odd)->Report(257, report),
              HasSubstr("[{\"category\":6,\"confidence\":0.5,\"name\":\"\xef\xbf\xbd\"},"
                        "{\"category\":7,\"confidence\":0.5}]"));
}

}  // namespace
}  // namespace qz::tools
