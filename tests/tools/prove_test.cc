// SPDX-License-Identifier: Apache-2.0
// qz prove on builds that are alike, on builds with deliberately faulty kernels, and on what is no
// working build.

#include <gmock/gmock.h>

#include "tests/tools/qz_program.h"

namespace qz::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::StartsWith;

class Prove : public QzProgram {
 protected:
  Prove() {
    // Five seconds that fade: every loudness occurs.
    constexpr int kValues = 5 * 44100 * 2;
    Random random(5);
    std::vector<float> frames;
    for (int left = kValues; left > 0; --left) {
      frames.push_back(static_cast<float>(random.Between(-left, left)) / kValues / 4);
    }
    WriteSound("sound.wav", SF_FORMAT_WAV | SF_FORMAT_FLOAT, 44100, 2, frames);
    MakeBuild("good", "qz-trace");
    MakeBuild("alike", "qz-trace");
  }

  // A build folder with a program and a module of this build's own.
  void MakeBuild(const std::string& name, const std::string& program,
                 const std::string& module = "qz.so") {
    for (const char* folder : {"/bin", "/lib"}) {
      std::filesystem::create_directories(Path(name + folder));
    }
    std::filesystem::create_symlink(QZ_BUILD "/bin/" + program, Path(name + "/bin/qz-trace"));
    std::filesystem::create_symlink(QZ_BUILD "/lib/" + module, Path(name + "/lib/qz.so"));
    std::filesystem::copy(QZ_BUILD "/launcher", Path(name + "/launcher"));
  }
  // The same with a shell script as its qz-trace, in which $GOOD is the good program.
  void MakeScript(const std::string& name, const std::string& script) {
    MakeBuild(name, "qz-trace");
    std::filesystem::remove(Path(name + "/bin/qz-trace"));
    const std::string good =
        "GOOD=\"$(tr '\\n' ' ' <" QZ_BUILD "/launcher) " QZ_BUILD "/bin/qz-trace\"\n";
    WriteBytes(name + "/bin/qz-trace", good + script);
    WriteBytes(name + "/launcher", "sh\n");
  }
  int RunProve(const std::string& first, const std::string& second,
               const std::string& environment = "") {
    return Run("cd " + Path(".") + " && " + environment + " $QZ prove sound.wav " + first + " " +
               second);
  }
};

TEST_F(Prove, BuildsThatAreAlikeGiveTheSame) {
  EXPECT_EQ(RunProve("good", "alike --host-clients 9 --client-nanoapps 2", "TMPDIR="), 0) << err_;
  EXPECT_THAT(out_, MatchesRegex("features of 598 frames +digest [0-9a-f]{16}\n"
                                 "outputs of 21 operators in 4 network runs +digest [0-9a-f]{16}\n"
                                 "4 objects in memory after 3 buffers +digest [0-9a-f]{16}\n"
                                 "25 messages to hosts +digest [0-9a-f]{16}\n"
                                 "6 reports +digest [0-9a-f]{16}\n"
                                 "[0-9]+ log lines +digest [0-9a-f]{16}\n"
                                 "good and alike give the same\n"));
  EXPECT_EQ(RunProve("good", "alike >/dev/full"), 5);
  EXPECT_THAT(err_, HasSubstr("qz: standard output: can't be written: "));
}

// The network over whole windows and over a stream: each row of each operator, and of the memory
// what both have.
TEST_F(Prove, ModulesWithEitherNetworkGiveTheSame) {
  EXPECT_EQ(RunProve("good", QZ_OTHER_MODULE), 0) << out_ << err_;
  EXPECT_THAT(out_, HasSubstr("\noutputs of 21 operators in 4 network runs "));
  EXPECT_THAT(out_, HasSubstr("\n2 objects in memory after 3 buffers "));
  EXPECT_THAT(out_, HasSubstr("good and " QZ_OTHER_MODULE " give the same\n"));
}

TEST_F(Prove, TooLittleAudioIsNoComparison) {
  WriteSound("sound.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_16, 16000, 1, std::vector<float>(16000));
  EXPECT_EQ(RunProve("good", "alike"), 1);
  EXPECT_THAT(err_, HasSubstr("qz: the network did not run in 1 buffers"));
  EXPECT_EQ(out_, "");
  for (const char* other : {"alike --client-nanoapps 0", "alike/../good"}) {
    EXPECT_EQ(RunProve("good", other), 2) << other;
    EXPECT_THAT(err_, HasSubstr("(see qz prove --help)\n"));
  }
}

// The faulty kernels print themselves where they first were at fault.
TEST_F(Prove, FaultyKernelsAreFound) {
  MakeBuild("faulty", "qz_trace_faulty");
  const std::pair<std::string, std::string> kernels[] = {{"max_pool", "network run "},
                                                         {"logarithm", "features of frame "}};
  for (const auto& [kernel, location] : kernels) {
    EXPECT_EQ(RunProve("good", "faulty", "FAULTY_KERNEL=" + kernel), 1);
    const std::string start = "first difference: ";
    EXPECT_THAT(out_, StartsWith(start + location));
    const size_t nanoapp = out_.find(" (the linked nanoapp at ");
    ASSERT_NE(nanoapp, std::string::npos) << out_;
    EXPECT_THAT(err_, HasSubstr(out_.substr(start.size(), nanoapp - start.size()) +
                                out_.substr(out_.find("): ") + 1)));
  }
}

// Neither messages nor reports show the scores that are lost.
TEST_F(Prove, AModuleUnlikeTheLinkedNanoappIsFound) {
  for (const char* build : {"stale", "stale_too"}) {
    MakeBuild(build, "qz-trace", "libfaulty_scores_module.so");
  }
  EXPECT_EQ(RunProve("good", "stale"), 1);
  EXPECT_THAT(out_, StartsWith("first difference: memory after buffer 1, arena, byte 182"));
  EXPECT_EQ(RunProve("stale", "stale_too"), 1);
  EXPECT_THAT(out_, HasSubstr("what was loaded and what was observed do not: memory: 12 of the "));

  const std::string runtime = "/lib/libchre_runtime_without_audio.so";
  for (const std::string build : {"odd", "odd_too"}) {
    MakeBuild(build, "qz-trace", "qz_without_audio.so");
    std::filesystem::create_symlink(QZ_BUILD + runtime, Path(build + runtime));
  }
  EXPECT_EQ(RunProve("odd", "odd_too"), 1);
  EXPECT_THAT(out_, HasSubstr("what was loaded and what was observed do not: log line: "));
}

TEST_F(Prove, WhatIsNoWorkingBuildIsNamed) {
  MakeScript("cut", "$GOOD \"$@\" | head -c 100000");
  MakeScript("fails", "$GOOD \"$@\"; exit 5");
  MakeScript("silent", "exit 6");
  MakeScript("dies", "kill -9 $$");
  MakeScript("talks", "echo This is no trace at all.; exec sleep 60");
  MakeBuild("unlaunched", "qz-trace");
  WriteBytes("unlaunched/launcher", "/nonexistent\n");
  // A module whose head no longer has the offset of its sections loads all the same.
  MakeBuild("stripped", "qz-trace");
  std::string module = Contents("stripped/lib/qz.so");
  std::filesystem::remove(Path("stripped/lib/qz.so"));
  WriteBytes("stripped/lib/qz.so", module.replace(sizeof(void*) == 8 ? 40 : 32, 4, 4, '\0'));
  const std::pair<std::string, std::string> cases[] = {
      {"nothing", "nothing/bin/qz-trace: No such file or directory"},
      {"cut", "of the trace: cut off, should be a whole trace with an end record\n"},
      {"fails", "its trace is whole, but it ended with exit status 5"},
      {"silent",
       "record 0 of the trace: cut off, should be a whole trace with an end record; it ended "
       "with exit status 6"},
      {"dies", "it was ended by signal 9"},
      {"talks", "talks/bin/qz-trace: record 0 of the trace: its kind is 84, should be 1 to "},
      {"unlaunched", "unlaunched/bin/qz-trace: "},
      {"stripped", "stripped/lib/qz.so: no symbol of an object inference_input_buffer of at least"},
  };
  for (const auto& [build, error] : cases) {
    EXPECT_EQ(RunProve("good", build), 4) << build;
    EXPECT_EQ(out_, "");
    EXPECT_THAT(err_, AllOf(HasSubstr("\nqz: " + build + "/bin/"), HasSubstr(error)));
  }
}

TEST_F(Prove, AudioThatALauncherLosesIsMissed) {
  // What is typed must not reach the programs, whose output it would spoil.
  for (const char* build : {"short", "short_too"}) {
    MakeScript(build, "cat; head -c 128000 \"$1\" >$0.raw; shift; $GOOD $0.raw \"$@\"");
  }
  EXPECT_EQ(Run("cd " + Path(".") + " && echo typed | $QZ prove sound.wav short short_too"), 4);
  EXPECT_THAT(err_, HasSubstr("played 4 buffers of audio each, should be 6"));
}

TEST_F(Prove, AnInterruptLeavesNoProgramBehind) {
  for (const char* build : {"sleeps", "sleeps_too"}) {
    MakeScript(build, "sleep 60 & echo $! >>" + WriteBytes("running", "") + "; wait");
  }
  EXPECT_EQ(Run("cd " + Path(".") + R"(
      mkdir temporary; export TMPDIR=$PWD/temporary
      $QZ prove sound.wav sleeps sleeps_too & prove=$!
      until [ $(wc -l <running) = 2 ] || ! kill -0 $prove; do sleep 0.05; done
      kill -INT $prove; wait $prove; status=$?
      still_runs() { grep -qs '^State:.[^ZX]' /proc/$1/status; }
      for try in {1..100}; do
        left=$(while read id; do still_runs $id && echo $id still runs; done <running)
        [ -z "$left" ] && break; sleep 0.05
      done
      echo -n "$left"
      ls temporary
      exit $status)"),
            130);
  EXPECT_EQ(out_, "");
  EXPECT_THAT(err_, HasSubstr("qz: interrupted"));
}

TEST_F(Prove, WhatCannotBeReadIsNamed) {
  EXPECT_EQ(Run("$QZ prove " + Path("missing.wav") + " one-build another"), 3);
  EXPECT_THAT(err_, HasSubstr("missing.wav: can't be opened"));
  EXPECT_EQ(Run("$QZ prove " + Path("sound.wav") + " one-build"), 2);
  EXPECT_THAT(err_, HasSubstr("(see qz prove --help)"));
}

}  // namespace
}  // namespace qz::test
