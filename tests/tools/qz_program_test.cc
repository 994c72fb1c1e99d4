// The program qz as a whole, run as a process: its output, its messages, its exit codes.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <algorithm>
#include <nlohmann/json.hpp>
#include <sstream>

#include "program.h"
#include "random.h"
#include "sound_folder.h"

namespace qz::test {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

constexpr size_t kSecond = 16000;

ProgramResult RunQz(std::vector<std::string> arguments, const std::string& input = "") {
  arguments.insert(arguments.begin(), QZ_PROGRAM);
  Program program(std::move(arguments));
  program.Write(input);
  return program.Finish();
}

std::vector<nlohmann::json> ParseLines(const std::string& text) {
  std::vector<nlohmann::json> objects;
  std::istringstream lines(text);
  for (std::string line; std::getline(lines, line);) {
    objects.push_back(nlohmann::json::parse(line));
  }
  return objects;
}

std::string RawNoise(size_t samples) {
  const auto noise = Random(3).Fill<int16_t>(samples, -8000, 8000);
  return {reinterpret_cast<const char*>(noise.data()), samples * 2};
}

void ExpectOneLine(const std::string& text) {
  EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 1) << text;
  EXPECT_THAT(text, StartsWith("qz: "));
}

class QzProgramTest : public testing::Test {
 protected:
  SoundFolder folder_;
};

TEST_F(QzProgramTest, JsonTellsWhatEveryClientReceived) {
  const std::string file = folder_.WriteBytes("noise.raw", RawNoise(9 * kSecond));
  const ProgramResult result =
      RunQz({"run", "--raw", "--json", "--host-clients", "3", "--client-nanoapps", "2", file});
  EXPECT_EQ(result.exit_code, 0) << result.err;
  EXPECT_THAT(result.err, HasSubstr("padded the last buffer with 1.000 s of silence"));
  const auto lines = ParseLines(result.out);
  ASSERT_EQ(lines.size(), 3u + 5 * 2 + 1);
  for (size_t i = 0; i < 3; ++i) {
    EXPECT_EQ(lines[i]["type"], "categories");
    EXPECT_EQ(lines[i]["endpoint"], 0x10 + i);
    EXPECT_EQ(lines[i]["categories"], (std::vector<int>{0, 6, 17, 15, 18}));
  }
  for (size_t i = 3; i < 13; ++i) {
    const uint64_t pass = (i - 1) / 2;
    EXPECT_EQ(lines[i]["type"], "report");
    EXPECT_EQ(lines[i]["timestamp_ns"], pass * 2'000'000'000);
    EXPECT_EQ(lines[i]["results"][1]["category"], 15);
  }
  EXPECT_NE(lines[3]["nanoapp"], lines[4]["nanoapp"]);
  const auto& summary = lines.back();
  EXPECT_EQ(summary["type"], "summary");
  EXPECT_EQ(summary["audio_s"], 10);
  EXPECT_EQ(summary["passes"], 5);
  EXPECT_EQ(summary["reports"], 10);
  EXPECT_EQ(summary["messages_to_host"], 9);
  EXPECT_EQ(summary["heap_blocks_held"], 0);
  EXPECT_GT(summary["speed"], 0);
}

TEST_F(QzProgramTest, ContainersAndRawStreamsComeThroughStandardInputToo) {
  const auto tone = Random(4).Fill<int16_t>(kSecond * 2, -9000, 9000);
  const std::string path =
      folder_.WriteSound("a.ogg", SF_FORMAT_OGG | SF_FORMAT_VORBIS, 16000, 1, tone);
  std::ostringstream bytes;
  bytes << std::ifstream(path, std::ios::binary).rdbuf();
  const ProgramResult piped = RunQz({"run", "-"}, bytes.str());
  EXPECT_EQ(piped.exit_code, 0) << piped.err;
  EXPECT_THAT(piped.err, HasSubstr("standard input: 16000 Hz, 1 channel, rounded to 16 bits"));
  EXPECT_THAT(piped.err, HasSubstr("the audio gave 198 of the 382 frames"));
  EXPECT_THAT(piped.out, HasSubstr("2.00 s of audio, 1 passes, 1 reports"));
}

TEST_F(QzProgramTest, OnlyEightHostsAreServedAndNobodyNeedsToListen) {
  const std::string audio = RawNoise(4 * kSecond);
  const ProgramResult many = RunQz({"run", "--raw", "--host-clients", "10", "-"}, audio);
  EXPECT_EQ(many.exit_code, 0);
  EXPECT_THAT(many.out, HasSubstr("8 of 10 host clients accepted"));
  EXPECT_THAT(many.err, HasSubstr("warning: "));
  const ProgramResult none =
      RunQz({"run", "--raw", "--host-clients", "0", "--client-nanoapps", "0", "-"}, audio);
  EXPECT_EQ(none.exit_code, 0);
  EXPECT_THAT(none.err, HasSubstr("no audio source was taken"));
  EXPECT_THAT(none.out, HasSubstr("4.00 s of audio, 0 passes, 0 reports"));
}

TEST_F(QzProgramTest, InterruptEndsLiveInputWithTheSummary) {
  Program qz({QZ_PROGRAM, "run", "--raw", "-"});
  qz.Write(RawNoise(2 * kSecond));
  ASSERT_TRUE(qz.ReadUntil("[   2.000 s] report"));
  qz.Signal(SIGINT);
  ASSERT_TRUE(qz.ReadUntil("heap blocks still held: 0"));
  const ProgramResult result = qz.Finish();
  EXPECT_EQ(result.exit_code, 0) << result.err;
  EXPECT_THAT(result.err, HasSubstr("interrupted"));
  EXPECT_THAT(result.out, HasSubstr("2.00 s of audio, 1 pass"));
}

TEST_F(QzProgramTest, AReaderThatLeavesEndsTheRunQuietly) {
  Program qz({QZ_PROGRAM, "run", "--raw", "-"});
  qz.Write(RawNoise(2 * kSecond));
  ASSERT_TRUE(qz.ReadUntil("report"));
  qz.Close(1);
  // More than it reads before it notices.
  qz.Write(RawNoise(20 * kSecond));
  const ProgramResult result = qz.Finish();
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_THAT(result.err, Not(HasSubstr("qz: ")));
}

TEST_F(QzProgramTest, FaultsOfANanoappAreFound) {
  const std::string file = folder_.WriteBytes("noise.raw", RawNoise(kSecond));
  const ProgramResult result = RunQz({"run", "--raw", "--module", QZ_FAULTY_MODULE, file});
  EXPECT_EQ(result.exit_code, 1);
  EXPECT_THAT(result.out, HasSubstr("heap blocks still held: 1"));
  EXPECT_THAT(result.err, HasSubstr("qz: fault: event 33287 to nanoapp 257"));
  EXPECT_THAT(result.err, HasSubstr("qz: fault: chreHeapFree of "));
  EXPECT_THAT(result.err, HasSubstr("qz: fault: 1 heap block"));
}

TEST_F(QzProgramTest, WhatPreventsARunIsSaidInOneLine) {
  const std::string good = folder_.WriteBytes("noise.raw", RawNoise(kSecond));
  struct Case {
    std::vector<std::string> arguments;
    int exit_code;
  };
  const std::vector<Case> cases = {
      {{"run", "--raw", "--module", QZ_REFUSED_MODULE, good}, 1},
      {{}, 2},
      {{"run"}, 2},
      {{"run", "--host-clients", "65", good}, 2},
      {{"run", "--log-level", "loud", good}, 2},
      {{"walk", good}, 2},
      {{"run", folder_.Path("missing.wav")}, 3},
      {{"run", "-"}, 3},
      {{"run", "--raw", "--module", "/nonexistent", good}, 4},
      {{"run", "--raw", "--module", good, good}, 4},
      {{"run", "--raw", "--module", QZ_NO_MODULE, good}, 4},
  };
  for (const Case& wrong : cases) {
    const ProgramResult result = RunQz(wrong.arguments);
    SCOPED_TRACE(result.err);
    EXPECT_EQ(result.exit_code, wrong.exit_code);
    EXPECT_THAT(result.out, IsEmpty());
    ExpectOneLine(result.err);
  }
}

}  // namespace
}  // namespace qz::test
