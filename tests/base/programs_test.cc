// SPDX-License-Identifier: Apache-2.0
// What the programs share, run from a shell: their outputs, exit codes, --help and --version.

#include <gmock/gmock.h>

#include <filesystem>

#include "model/synthetic_model.h"
#include "tests/tools/qz_program.h"

namespace qz::test {
namespace {

namespace fs = std::filesystem;
using testing::AllOf;
using testing::HasSubstr;
using testing::StartsWith;

class Programs : public QzProgram {
 protected:
  Programs() {
    const model::PackedModel packed = model::MakeSyntheticModel(1);
    WriteBytes("m.bin", {packed.begin(), packed.end()});
    WriteSound("a.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_16, 16000, 1,
               Random(1).Fill<int16_t>(9000, -9, 9));
    WriteBytes("list.tsv", "file\tclass\tfold\na.wav\train\t1\n");
  }
  int RunHere(const std::string& line) { return Run("cd " + Path("") + " && " + line); }
  // Runs a line of which an output can't be written: it ends with one message and leaves no file.
  void ExpectUnwritable(const std::string& line, const std::string& message) {
    const auto files = [&] { return std::distance(fs::directory_iterator(Path("")), {}); };
    RunHere("true");
    const std::ptrdiff_t before = files();
    EXPECT_EQ(RunHere(line), 5) << line;
    EXPECT_THAT(err_, HasSubstr(message)) << line;
    EXPECT_EQ(files(), before) << line;
  }
};

TEST_F(Programs, PrintHelpAndVersion) {
  const std::string build = " " QZ_VERSION " (build " QZ_BUILD_NUMBER ")";
  std::vector<std::pair<std::string, std::string>> programs = {
      {"qz", QZ_PROGRAM}, {"qz-trace", QZ_TRACE_PROGRAM}, {"qz-model-tool", QZ_MODEL_TOOL}};
  if (*QZ_TRAIN_PROGRAM != '\0') programs.emplace_back("qz-train", QZ_TRAIN_PROGRAM);
  for (const auto& [name, program] : programs) {
    EXPECT_EQ(Run(program + " --version"), 0) << err_;
    EXPECT_THAT(out_, StartsWith(name + build));
    EXPECT_EQ(Run(program + " --help"), 0) << err_;
    EXPECT_THAT(out_, AllOf(HasSubstr(name), HasSubstr(name + build)));
    for (const char* word : {" --version", " --help"}) {
      const std::string line = program + word;
      EXPECT_EQ(Run(line + " >/dev/full"), 5) << line;
      EXPECT_THAT(err_, StartsWith(name + ": standard output: can't be written"));
      EXPECT_EQ(Run("{ " + line + "; echo $? >&2; } | true"), 0);
      EXPECT_EQ(err_, "0\n") << "a reader that leaves is none of our faults";
    }
    EXPECT_EQ(Run(program + " --melt"), 2);
  }
}

TEST_F(Programs, WriteOutputsWholeOrNotAtAll) {
  ExpectUnwritable("$QZ model export m.bin -o /dev/full", "/dev/full: can't be written: No space");
  EXPECT_TRUE(fs::is_character_file("/dev/full"));
  ExpectUnwritable("ulimit -f 20; $QZ model export m.bin -o m.npz",
                   "m.npz: can't be written: File too large");
  EXPECT_EQ(
      RunHere(
          "mkfifo pipe; cat pipe >read & $QZ model export m.bin -o pipe && wait && test -p pipe"),
      0);
  // What the user keeps under a name like that of a temporary file.
  EXPECT_EQ(RunHere("echo mine >kept; ln -s kept m.npz.part; $QZ model export m.bin -o m.npz &&"
                    " cmp m.npz read && grep -q mine m.npz.part"),
            0);
  EXPECT_EQ(RunHere("cp m.npz b.bin; chmod 600 b.bin; ln -s b.bin link.bin;"
                    " $QZ model import m.npz -o link.bin && test -L link.bin && cmp b.bin m.bin &&"
                    " stat -c %a b.bin"),
            0)
      << err_;
  EXPECT_EQ(out_, "600\n");
}

TEST_F(Programs, NeverWriteOverAnInput) {
  ASSERT_EQ(
      RunHere("$QZ model export m.bin -o m.npz && cp a.wav a.npy && cp list.tsv features.tsv"), 0);
  const std::string too = "can't be written: it is the input ";
  ExpectUnwritable("$QZ model export m.bin -o ./m.bin", "qz: ./m.bin: " + too);
  ExpectUnwritable("$QZ model import m.npz -o m.npz", "qz: m.npz: " + too);
  ExpectUnwritable("$QZ features a.npy -o a.npy", "qz: a.npy: " + too);
  ExpectUnwritable("$QZ features --manifest features.tsv -o .", "features.tsv: " + too);
  EXPECT_EQ(Contents("features.tsv"), Contents("list.tsv"));
  EXPECT_EQ(Contents("a.npy"), Contents("a.wav"));
  if (*QZ_TRAIN_PROGRAM == '\0') GTEST_SKIP() << "this build has no trainer";
  const std::string fit = QZ_TRAIN_PROGRAM " fit list.tsv -o ";
  ExpectUnwritable(fit + "list.tsv", "qz-train: list.tsv: " + too);
  ExpectUnwritable(fit + "x --state list.tsv", "qz-train: list.tsv: " + too);
  ExpectUnwritable(fit + "x --state ./x", "the model and the state at once");
}

// Of SIGINT by the suite of qz run.
TEST_F(Programs, ReportASignalThatEndsThem) {
  EXPECT_EQ(RunHere("timeout --foreground --preserve-status -k 9 2 $QZ run --raw - < "
                    "<(tail -c +45 a.wav; exec sleep 60)"),
            143);
  EXPECT_THAT(out_, HasSubstr("summary: "));
}

}  // namespace
}  // namespace qz::test
