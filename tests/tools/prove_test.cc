// qz prove on builds that are alike, on builds with deliberately faulty kernels, and on what is no
// working build.

#include <gmock/gmock.h>

#include <algorithm>

#include "qz_program.h"

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
  // The same with a shell script in its place, in which $GOOD is the good program.
  void MakeScript(const std::string& name, const std::string& script) {
    MakeBuild(name, "qz-trace");
    std::filesystem::remove(Path(name + "/bin/qz-trace"));
    const std::string good =
        "GOOD=\"$(tr '\\n' ' ' <" QZ_BUILD "/launcher) " QZ_BUILD "/bin/qz-trace\"\n";
    WriteBytes(name + "/bin/qz-trace", good + script);
    WriteBytes(name + "/launcher", "sh\n");
  }
  int RunProve(const std::string& first, const std::string& second) {
    return Run("cd " + Path(".") + " && $QZ prove sound.wav " + first + " " + second);
  }
};

TEST_F(Prove, BuildsThatAreAlikeGiveTheSame) {
  EXPECT_EQ(RunProve("good", "good --host-clients 9 --client-nanoapps 2"), 0);
  EXPECT_THAT(out_, MatchesRegex("features of 598 frames +digest [0-9a-f]{16}\n"
                                 "outputs of 21 operators in 4 network runs +digest [0-9a-f]{16}\n"
                                 "25 messages to hosts +digest [0-9a-f]{16}\n"
                                 "6 reports +digest [0-9a-f]{16}\n"
                                 "[0-9]+ log lines +digest [0-9a-f]{16}\n"
                                 "good and good give the same\n"));
  EXPECT_EQ(RunProve("good", "good --host-clients 0 --client-nanoapps 0"), 1);
  EXPECT_THAT(err_, HasSubstr("nothing was computed"));
}

// The faulty kernels say themselves where they first were at fault.
TEST_F(Prove, FaultyKernelsAreFound) {
  const std::pair<std::string, std::string> kernels[] = {{"max_pool", "network run "},
                                                         {"logarithm", "features of frame "}};
  for (const auto& [kernel, said] : kernels) {
    MakeBuild(kernel, "qz_trace_faulty_" + kernel);
    EXPECT_EQ(RunProve("good", kernel), 1);
    const size_t start = err_.find(said);
    ASSERT_NE(start, std::string::npos) << "the kernel had no occasion to be at fault";
    const std::string place = err_.substr(start, err_.find('\n', start) - start);
    EXPECT_THAT(out_, StartsWith("first difference: " + place + " (the linked nanoapp at "));
    int good = 0;
    int faulty = 0;
    ASSERT_EQ(
        std::sscanf(out_.substr(out_.rfind(": ")).c_str(), ": %d in good, %d in", &good, &faulty),
        2)
        << out_;
    EXPECT_EQ(std::abs(good - faulty), 1);
  }
}

TEST_F(Prove, AModuleUnlikeTheLinkedNanoappIsFound) {
  MakeBuild("odd", "qz-trace", "qz_without_audio.so");
  EXPECT_EQ(RunProve("odd", "odd"), 1);
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
  const std::pair<std::string, std::string> cases[] = {
      {"nothing", "nothing/bin/qz-trace: No such file or directory"},
      {"cut", "of the trace: cut off, should be a whole trace with an end record\n"},
      {"fails", "its trace is whole, but it ended with exit status 5"},
      {"silent",
       "record 0 of the trace: cut off, should be a whole trace with an end record; it ended "
       "with exit status 6"},
      {"dies", "it was ended by signal 9"},
      {"talks", "talks/bin/qz-trace: record 0 of the trace: its kind is 84, should be 1 to 7"},
      {"unlaunched", "unlaunched/bin/qz-trace: "},
  };
  for (const auto& [build, wrong] : cases) {
    EXPECT_EQ(RunProve("good", build), 4) << build;
    EXPECT_EQ(out_, "");
    EXPECT_THAT(err_, AllOf(HasSubstr("\nqz: " + build + "/bin/"), HasSubstr(wrong)));
  }
}

TEST_F(Prove, AnInterruptLeavesNoProgramBehind) {
  MakeScript("sleeps", "echo $$ >>" + WriteBytes("running", "") + "; exec sleep 60");
  EXPECT_EQ(Run("cd " + Path(".") + R"(
      $QZ prove sound.wav sleeps sleeps & prove=$!
      until [ $(wc -l <running) = 2 ]; do sleep 0.05; done
      kill -INT $prove; wait $prove; status=$?
      while read id; do kill -0 $id && echo $id still runs; done <running
      exit $status)"),
            4);
  EXPECT_EQ(out_, "");
  EXPECT_THAT(err_, HasSubstr("qz: interrupted"));
}

TEST_F(Prove, WhatCannotBeReadIsSaid) {
  EXPECT_EQ(Run("$QZ prove " + Path("missing.wav")), 3);
  EXPECT_THAT(err_, HasSubstr("missing.wav: can't be opened"));
  EXPECT_EQ(Run("$QZ prove " + Path("sound.wav") + " one-build"), 2);
  EXPECT_THAT(err_, HasSubstr("(see qz prove --help)"));
}

}  // namespace
}  // namespace qz::test
