// SPDX-License-Identifier: Apache-2.0
// The program qz as a whole, run from a shell: its output, its messages, its exit codes.

#include "tests/tools/qz_program.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <map>
#include <nlohmann/json.hpp>
#include <sstream>
#include <tuple>

namespace qz::test {
namespace {

using testing::AllOf;
using testing::Ge;
using testing::HasSubstr;
using testing::Le;
using testing::Not;
using testing::StartsWith;

TEST_F(QzProgram, JsonTellsWhatEveryClientReceived) {
  EXPECT_EQ(Run("$QZ run --raw --json --host-clients 3 --client-nanoapps 2 " + Noise(9 * kSecond)),
            0);
  EXPECT_THAT(err_, HasSubstr("padded the last buffer with 1.000 s of silence"));
  EXPECT_EQ(std::count(out_.begin(), out_.end(), '\n'), 3 + 5 * 2 + 1);
  const char* const parts[] = {
      R"({"type":"categories","endpoint":18,"categories":[0,6,17,15,18]})",
      R"({"type":"report","nanoapp":257,"time_s":2.0,"timestamp_ns":2000000000,)",
      R"({"type":"report","nanoapp":258,"time_s":10.0,"timestamp_ns":10000000000,)",
      R"("response_time_ns":10000000000,"model_version":202208270,"results":[{"category":6,)",
      R"({"type":"summary","audio_s":10.0,"silence_appended_s":1.0,"passes":5,)",
      R"("reports":10,"detections":0,"host_clients_accepted":3,)",
      R"("messages_to_host":9,"events_to_clients":10,"heap_blocks_held":0,"faults":0,"speed":)"};
  for (const char* part : parts) EXPECT_THAT(out_, HasSubstr(part));
}

TEST_F(QzProgram, ContainersComeThroughStandardInputToo) {
  const auto noise = Random(4).Fill<int16_t>(kSecond * 3 / 2, -9000, 9000);
  WriteSound("a.ogg", SF_FORMAT_OGG | SF_FORMAT_VORBIS, 16000, 1, noise);
  EXPECT_EQ(Run("cat " + Path("a.ogg") + " | $QZ run -"), 0);
  EXPECT_THAT(err_, HasSubstr("standard input: 16000 Hz, 1 channel, rounded to 16 bits"));
  EXPECT_THAT(err_, HasSubstr("no network run happened yet: the audio gave 148 of the 382 frames"));
  EXPECT_THAT(err_, Not(HasSubstr("[SOUND_DETECTION]")));
  EXPECT_THAT(out_, HasSubstr("1 passes, 1 reports"));
}

TEST_F(QzProgram, AStreamOfAnyFormatPlaysAsItComes) {
  // 4 s of 8 kHz stereo, headerless and behind a header; the input stays open.
  const std::string audio = "head -c 128000 " + Noise(8 * kSecond);
  const std::string header =
      R"(printf 'RIFF\xff\xff\xff\xffWAVEfmt \x10\0\0\0\1\0\2\0\x40\x1f\0\0\0\x7d\0\0\4\0\x10\0data\xff\xff\xff\xff')";
  const std::string interrupted = "timeout --foreground -s INT 2 $QZ run --json ";
  Run(interrupted + "--raw --rate 8000 --channels 2 --format s16le - < <(" + audio +
      "; exec sleep 60) >" + Path("raw") + " & " + interrupted + "- < <(" + header + "; " + audio +
      "; exec sleep 60) >" + Path("wav") + "; wait $!");
  const std::string raw = Contents("raw");
  EXPECT_THAT(raw, HasSubstr(R"("audio_s":4.0,"silence_appended_s":0.0)")) << err_;
  const auto reports = [](const std::string& text) { return text.substr(0, text.find("speed")); };
  EXPECT_EQ(reports(Contents("wav")), reports(raw));
  EXPECT_EQ(Run("$QZ run --rate 8000 " + Path("raw")), 2);
  EXPECT_EQ(Run("$QZ run --raw --format s17 " + Path("raw")), 2);
  EXPECT_THAT(err_, HasSubstr("u8,s8,s16le,"));
}

TEST_F(QzProgram, NobodyNeedsToListen) {
  EXPECT_EQ(Run("$QZ --version && $QZ run --raw --host-clients 0 --client-nanoapps 0 " + Noise(1)),
            0);
  EXPECT_THAT(err_, HasSubstr("no audio source was taken"));
  EXPECT_THAT(out_, AllOf(StartsWith("qz "), HasSubstr("\nkernels")));
  EXPECT_THAT(out_, HasSubstr("2.00 s of audio (2.00 s of it silence), 0 passes, 0 reports"));
}

TEST_F(QzProgram, ProgressIsVisibleBetweenReports) {
  const std::string shown = "\r2 of 4 s, 50%\x1b[K";
  const std::string line = "$QZ run --realtime --raw " + Noise(4 * kSecond);
  // `script` gives the program a terminal and copies what it shows to standard output. At once, as
  // each takes 4 s.
  const std::string one = Path("one"), both = Path("both"), reports = Path("reports");
  EXPECT_EQ(Run("export QZ; script -qec \"" + line + " >" + reports + "\" /dev/null >" + one +
                " & script -qec \"" + line + "\" /dev/null >" + both + " && wait $!"),
            0);
  // Lines on the terminal erase the progress, those in a file don't.
  const std::string report = "[   4.000 s] report";
  EXPECT_THAT(Contents("one"), AllOf(HasSubstr(shown), Not(HasSubstr(report))));
  EXPECT_THAT(Contents("reports"), AllOf(HasSubstr(report), Not(HasSubstr("\x1b"))));
  const std::string terminal = Contents("both");
  const size_t erased = terminal.find(shown + "\r\x1b[K" + report);
  ASSERT_NE(erased, std::string::npos) << terminal;
  // It is drawn again below them, until the summary.
  const size_t below = terminal.find('\n', erased) + 1;
  EXPECT_EQ(terminal.compare(below, shown.size(), shown), 0) << terminal;
  EXPECT_EQ(terminal.find("50%", terminal.find("summary")), std::string::npos);
}

TEST_F(QzProgram, AnInterruptOrAReaderThatLeavesEndsLiveInput) {
  const std::string live = "(cat " + Noise(3 * kSecond) + "; exec sleep 60)";
  EXPECT_EQ(Run("timeout --foreground --preserve-status -k 9 -s INT 3 $QZ run --raw - < <" + live),
            130);
  EXPECT_THAT(err_, HasSubstr("interrupted"));
  EXPECT_THAT(out_, HasSubstr("4.00 s of audio (1.00 s of it silence), 2 passes"));

  EXPECT_EQ(
      Run("cat " + Noise(60 * kSecond) + " | $QZ run --raw - | head -1; exit ${PIPESTATUS[1]}"), 0);
  EXPECT_THAT(err_, Not(HasSubstr("qz: ")));
}

// Each result in the lines of one type, from whichever receiver: when, which category, how surely.
using Result = std::tuple<double, int, float>;
std::vector<Result> ResultsOf(const std::string& lines, const std::string& type) {
  std::vector<Result> results;
  std::istringstream stream(lines);
  for (std::string line; std::getline(stream, line);) {
    const auto object = nlohmann::json::parse(line);
    if (object["type"] != type) continue;
    for (const auto& result : object["results"]) {
      results.emplace_back(object["time_s"], result["category"], result["confidence"]);
    }
  }
  return results;
}

// A module of low thresholds, whatever model this build holds: over a synthetic one.
const std::string kWithModel =
    "export MODEL=$(dirname $0)/model && " QZ_MODEL_TOOL " synthetic --seed 1 -o $MODEL && ";
const std::string kLowModule = " --module " QZ_LOW_MODULE " --labels " QZ_LABELS " ";

TEST_F(QzProgram, TheToolsViewIsWhatTheModuleReportsAndDetects) {
  // As in the module's own tables.
  const std::string table = WriteBytes("table",
                                       "class\tthreshold\tcooling_s\nperson_sneeze\t0.5\t0\n"
                                       "dog_bark\t0.5\t0\nbaby_cry\t0.25\t0\n"
                                       "rooster\t0.5\t5\nclock_tick\t0.0625\t0\n");
  ASSERT_EQ(Run(kWithModel + "$QZ run --raw --json --scores --thresholds " + table + kLowModule +
                " --model $MODEL " + LoudAndSoft(40 * kSecond)),
            0)
      << err_;
  EXPECT_THAT(err_, HasSubstr("tool's view: what qz itself hears beside the module, by "));
  EXPECT_THAT(out_, HasSubstr(R"({"type":"scores","source":"tool","time_s":2.0,)"
                              R"("timestamp_ns":2000000000,"runs":0,"results":[{"output":0,)"));

  const std::vector<Result> events = ResultsOf(out_, "detection");
  EXPECT_EQ(ResultsOf(out_, "tool_detection"), events);
  std::map<int, int> detections;
  for (const Result& event : events) ++detections[std::get<1>(event)];
  // All five, and a rooster that rests: there are 20 passes, one every two seconds.
  for (const int category : {0, 6, 15, 18}) EXPECT_GE(detections[category], 5) << category;
  EXPECT_THAT(detections[17], AllOf(Ge(2), Le(7)));

  std::vector<Result> scores = ResultsOf(out_, "scores");
  EXPECT_EQ(scores.size(), 20u * 5);
  const auto unreported = [](const Result& score) {
    return std::get<1>(score) != 6 && std::get<1>(score) != 15;
  };
  scores.erase(std::remove_if(scores.begin(), scores.end(), unreported), scores.end());
  EXPECT_EQ(scores, ResultsOf(out_, "report"));
}

TEST_F(QzProgram, AModelThatIsNotTheModulesIsAFault) {
  EXPECT_EQ(
      Run(kWithModel + QZ_MODEL_TOOL " synthetic --seed 2 -o $MODEL-2 && $QZ run --raw --scores" +
          kLowModule + "--model $MODEL-2 " + LoudAndSoft(10 * kSecond)),
      1);
  EXPECT_THAT(err_, HasSubstr("model-2: is not the model in the module: at 4.000 s output "));
  EXPECT_THAT(out_, AllOf(HasSubstr("[   2.000 s] tool's view: "), HasSubstr("[   4.000 s] report"),
                          Not(HasSubstr("[   4.000 s] tool's view: "))));
}

TEST_F(QzProgram, FaultsOfANanoappAreFound) {
  EXPECT_EQ(Run("$QZ run --raw --module " QZ_FAULTY_MODULE " " + Noise(kSecond)), 1);
  EXPECT_THAT(out_, HasSubstr("heap blocks still held: 1"));
  EXPECT_THAT(err_, HasSubstr("qz: fault: event 33287 to nanoapp 257"));
  EXPECT_THAT(err_, HasSubstr("qz: fault: chreHeapFree of "));
  EXPECT_THAT(err_, HasSubstr("qz: fault: 1 heap block"));
}

TEST_F(QzProgram, WhatPreventsARunIsSaidInOneLine) {
  const std::string good = Noise(kSecond);
  const std::pair<std::string, int> cases[] = {
      {"$QZ run --raw --module " QZ_REFUSED_MODULE " " + good, 1},
      {"$QZ", 2},
      {"$QZ run", 2},
      {"$QZ run --host-clients 65 " + good, 2},
      {"$QZ run " + Path("missing.wav"), 3},
      {"$QZ run -", 3},
      {"$QZ run --raw - <&-", 3},
      {"$QZ run --raw --model " + good + " " + good, 2},
      {"$QZ run --raw --scores --model " + good + " " + good, 3},
      {"$QZ run --raw --scores --model " + Path("missing") + " " + good, 3},
      {"$QZ run --raw --labels " + good + " " + good, 3},
      {"$QZ run --raw --thresholds " + good + " " + good, 3},
      {"$QZ run --raw --module /nonexistent " + good, 4},
      {"$QZ run --raw --module " QZ_NO_MODULE " " + good, 4},
  };
  for (const auto& [line, exit_code] : cases) {
    EXPECT_EQ(Run(line), exit_code) << line;
    EXPECT_EQ(out_, "") << line;
    EXPECT_EQ(std::count(err_.begin(), err_.end(), '\n'), 1) << err_;
    EXPECT_THAT(err_, StartsWith("qz: "));
  }
  EXPECT_EQ(Run("$QZ run --raw " + good + " <&- >&-"), 5);
  EXPECT_THAT(err_, HasSubstr("qz: standard output: can't be written"));
  EXPECT_EQ(Run("$QZ run --raw " + WriteBytes("odd.raw", "abc")), 3);
  EXPECT_THAT(out_, HasSubstr("heap blocks still held: 0"));
  EXPECT_THAT(err_, HasSubstr("odd.raw: ends after 3 bytes"));
}

}  // namespace
}  // namespace qz::test
