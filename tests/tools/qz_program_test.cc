// The program qz as a whole, run from a shell: its output, its messages, its exit codes.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>

#include "random.h"
#include "sound_folder.h"

namespace qz::test {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

constexpr size_t kSecond = 16000;

class QzProgram : public testing::Test {
 protected:
  // Runs a line of bash, in which $QZ is the program; its exit code. The streams are in out_ and
  // err_.
  int Run(const std::string& line) {
    const std::string script = folder_.WriteBytes("script", line);
    const int status = std::system(("QZ=" QZ_PROGRAM " bash " + script + " >" + Path("out") +
                                    " 2>" + Path("err") + " </dev/null")
                                       .c_str());
    out_ = Contents("out");
    err_ = Contents("err");
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  std::string Path(const std::string& name) const { return folder_.Path(name); }
  std::string Contents(const std::string& name) const {
    std::ostringstream text;
    text << std::ifstream(Path(name), std::ios::binary).rdbuf();
    return text.str();
  }
  // The path of a headerless file with so many samples.
  std::string Noise(size_t samples) const {
    return folder_.WriteRaw("noise.raw", Random(3).Fill<int16_t>(samples, -8000, 8000));
  }

  SoundFolder folder_;
  std::string out_;
  std::string err_;
};

TEST_F(QzProgram, JsonTellsWhatEveryClientReceived) {
  EXPECT_EQ(Run("$QZ run --raw --json --host-clients 3 --client-nanoapps 2 " + Noise(9 * kSecond)),
            0);
  EXPECT_THAT(err_, HasSubstr("padded the last buffer with 1.000 s of silence"));
  std::vector<nlohmann::json> lines;
  std::istringstream text(out_);
  for (std::string line; std::getline(text, line);) lines.push_back(nlohmann::json::parse(line));
  ASSERT_EQ(lines.size(), 3u + 5 * 2 + 1);
  for (size_t i = 0; i < 3; ++i) {
    EXPECT_EQ(lines[i]["type"], "categories");
    EXPECT_EQ(lines[i]["endpoint"], 0x10 + i);
    EXPECT_EQ(lines[i]["categories"], (std::vector<int>{0, 6, 17, 15, 18}));
  }
  for (size_t i = 3; i < 13; ++i) {
    EXPECT_EQ(lines[i]["type"], "report");
    EXPECT_EQ(lines[i]["timestamp_ns"], (i - 1) / 2 * 2'000'000'000);
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

TEST_F(QzProgram, ContainersComeThroughStandardInputToo) {
  const auto noise = Random(4).Fill<int16_t>(kSecond * 3 / 2, -9000, 9000);
  folder_.WriteSound("a.ogg", SF_FORMAT_OGG | SF_FORMAT_VORBIS, 16000, 1, noise);
  EXPECT_EQ(Run("cat " + Path("a.ogg") + " | $QZ run -"), 0);
  EXPECT_THAT(err_, HasSubstr("standard input: 16000 Hz, 1 channel, rounded to 16 bits"));
  EXPECT_THAT(err_, HasSubstr("no network run happened yet: the audio gave 148 of the 382 frames"));
  EXPECT_THAT(err_, Not(HasSubstr("[SOUND_DETECTION]")));
  EXPECT_THAT(out_, HasSubstr("1 passes, 1 reports"));
}

TEST_F(QzProgram, NobodyNeedsToListen) {
  EXPECT_EQ(Run("$QZ run --raw --host-clients 0 --client-nanoapps 0 " + Noise(1)), 0);
  EXPECT_THAT(err_, HasSubstr("no audio source was taken"));
  EXPECT_THAT(out_, HasSubstr("2.00 s of audio (2.00 s of it silence), 0 passes, 0 reports"));
}

TEST_F(QzProgram, AnInterruptOrAReaderThatLeavesEndsLiveInput) {
  const std::string live = "(cat " + Noise(3 * kSecond) + "; exec sleep 60)";
  EXPECT_EQ(Run("timeout --preserve-status -s INT 3 $QZ run --raw - < <" + live), 0);
  EXPECT_THAT(err_, HasSubstr("interrupted"));
  EXPECT_THAT(out_, HasSubstr("4.00 s of audio (1.00 s of it silence), 2 passes"));
  EXPECT_THAT(out_, HasSubstr("heap blocks still held: 0"));

  EXPECT_EQ(
      Run("cat " + Noise(60 * kSecond) + " | $QZ run --raw - | head -1; exit ${PIPESTATUS[1]}"), 0);
  EXPECT_THAT(err_, Not(HasSubstr("qz: ")));
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
  folder_.WriteBytes("odd.raw", "abc");
  const struct {
    std::string line;
    int exit_code;
  } cases[] = {
      {"$QZ run --raw --module " QZ_REFUSED_MODULE " " + good, 1},
      {"$QZ", 2},
      {"$QZ run", 2},
      {"$QZ run --host-clients 65 " + good, 2},
      {"$QZ run --log-level loud " + good, 2},
      {"$QZ walk " + good, 2},
      {"$QZ run " + Path("missing.wav"), 3},
      {"$QZ run -", 3},
      {"$QZ run --raw - <&-", 3},
      {"$QZ run --raw --module /nonexistent " + good, 4},
      {"$QZ run --raw --module " + good + " " + good, 4},
      {"$QZ run --raw --module " QZ_NO_MODULE " " + good, 4},
  };
  for (const auto& wrong : cases) {
    EXPECT_EQ(Run(wrong.line), wrong.exit_code) << wrong.line;
    EXPECT_THAT(out_, IsEmpty()) << wrong.line;
    EXPECT_EQ(std::count(err_.begin(), err_.end(), '\n'), 1) << err_;
    EXPECT_THAT(err_, StartsWith("qz: "));
  }
  EXPECT_EQ(Run("$QZ run --raw " + good + " <&- >&-"), 1);
  EXPECT_THAT(err_, HasSubstr("qz: standard output: can't be written"));
  EXPECT_EQ(Run("$QZ run --raw " + Path("odd.raw")), 3);
  EXPECT_THAT(out_, HasSubstr("heap blocks still held: 0"));
  EXPECT_THAT(err_, HasSubstr("odd.raw: ends after 3 bytes"));
}

}  // namespace
}  // namespace qz::test
