// The program qz as a whole, run from a shell: its output, its messages, its exit codes.

#include "qz_program.h"

#include <gmock/gmock.h>

#include <algorithm>

namespace qz::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
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

TEST_F(QzProgram, NobodyNeedsToListen) {
  EXPECT_EQ(Run("$QZ --version && $QZ run --raw --host-clients 0 --client-nanoapps 0 " + Noise(1)),
            0);
  EXPECT_THAT(err_, HasSubstr("no audio source was taken"));
  EXPECT_THAT(out_, AllOf(StartsWith("qz "), HasSubstr("\nkernels")));
  EXPECT_THAT(out_, HasSubstr("2.00 s of audio (2.00 s of it silence), 0 passes, 0 reports"));
}

TEST_F(QzProgram, AnInterruptOrAReaderThatLeavesEndsLiveInput) {
  const std::string live = "(cat " + Noise(3 * kSecond) + "; exec sleep 60)";
  EXPECT_EQ(Run("timeout --foreground --preserve-status -k 9 -s INT 3 $QZ run --raw - < <" + live),
            0);
  EXPECT_THAT(err_, HasSubstr("interrupted"));
  EXPECT_THAT(out_, HasSubstr("4.00 s of audio (1.00 s of it silence), 2 passes"));

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
  const std::pair<std::string, int> cases[] = {
      {"$QZ run --raw --module " QZ_REFUSED_MODULE " " + good, 1},
      {"$QZ", 2},
      {"$QZ run", 2},
      {"$QZ run --host-clients 65 " + good, 2},
      {"$QZ run " + Path("missing.wav"), 3},
      {"$QZ run -", 3},
      {"$QZ run --raw - <&-", 3},
      {"$QZ run --raw --module /nonexistent " + good, 4},
      {"$QZ run --raw --module " QZ_NO_MODULE " " + good, 4},
  };
  for (const auto& [line, exit_code] : cases) {
    EXPECT_EQ(Run(line), exit_code) << line;
    EXPECT_EQ(out_, "") << line;
    EXPECT_EQ(std::count(err_.begin(), err_.end(), '\n'), 1) << err_;
    EXPECT_THAT(err_, StartsWith("qz: "));
  }
  EXPECT_EQ(Run("$QZ run --raw " + good + " <&- >&-"), 1);
  EXPECT_THAT(err_, HasSubstr("qz: standard output: can't be written"));
  EXPECT_EQ(Run("$QZ run --raw " + WriteBytes("odd.raw", "abc")), 3);
  EXPECT_THAT(out_, HasSubstr("heap blocks still held: 0"));
  EXPECT_THAT(err_, HasSubstr("odd.raw: ends after 3 bytes"));
}

}  // namespace
}  // namespace qz::test
