// SPDX-License-Identifier: Apache-2.0
// What qz features writes is what the nanoapp itself computes; and its dealings with files.

#include <gmock/gmock.h>

#include <cstdio>
#include <filesystem>

#include "arrays/npy_file.h"
#include "tests/tools/qz_program.h"
#include "trace/trace_records.h"

namespace qz::tools {
namespace {

using testing::HasSubstr;

class Features : public test::QzProgram {
 protected:
  // Noise that comes and goes, up to full scale, with silence at its end.
  static std::vector<int16_t> Sound() {
    test::Random random(5);
    std::vector<int16_t> sound = random.Fill<int16_t>(6 * test::kSecond, -32768, 32767);
    for (size_t i = 0; i < sound.size(); ++i) {
      sound[i] = static_cast<int16_t>(i < 80000 ? sound[i] >> (i / 4000 * 5 % 14) : 0);
    }
    return sound;
  }

  std::string Wav(const std::string& name, const std::vector<int16_t>& samples) const {
    return WriteSound(name, SF_FORMAT_WAV | SF_FORMAT_PCM_16, 16000, 1, samples);
  }

  arrays::NpyArray Array(const std::string& name) const {
    return arrays::ParseNpy(Contents(name), name);
  }

  // The bytes of all frames that the linked nanoapp makes of a headerless file.
  std::string NanoappFeatures(const std::string& raw) {
    EXPECT_EQ(Run(QZ_TRACE_PROGRAM " " + raw + " " QZ_MODULE " 0 1"), 0) << err_;
    size_t location = 0;
    trace::Reader reader([&](uint8_t* bytes, size_t size) {
      const size_t given = out_.copy(reinterpret_cast<char*>(bytes), size, location);
      location += given;
      return given;
    });
    std::string features;
    for (trace::Record record; reader.Next(&record), record.kind != trace::Kind::kEnd;) {
      if (record.kind != trace::Kind::kFeatures) continue;
      features.append(record.bytes.begin(), record.bytes.end());
    }
    return features;
  }
};

TEST_F(Features, AreTheNanoappsOwn) {
  ASSERT_EQ(Run("$QZ features " + Wav("a.wav", Sound()) + " -o " + Path("a.npy")), 0) << err_;
  const arrays::NpyArray array = Array("a.npy");
  EXPECT_EQ(array.type, arrays::ElementType::kUint16);
  EXPECT_EQ(array.shape, (std::vector<size_t>{598, 48}));
  EXPECT_TRUE(array.bytes == NanoappFeatures(WriteRaw("a.raw", Sound())));
}

TEST_F(Features, GoIntoAFolderFromAFreshStartEach) {
  std::filesystem::create_directory(Path("other"));
  const std::string first = Wav("a.wav", Sound());
  const std::string second = Wav("other/a.wav", Sound());
  ASSERT_EQ(Run("$QZ features " + first + " " + second + " -o " + Path("into/deep")), 0) << err_;
  EXPECT_EQ(Contents("into/deep/a.npy"), Contents("into/deep/a-2.npy"));
  EXPECT_EQ(Array("into/deep/a.npy").shape[0], 598u);
}

TEST_F(Features, OfAManifestAreListedAndWhatIsMissingIsNamed) {
  Wav("a.wav", Sound());
  Wav("b.wav", {1, 2, 3});
  WriteBytes("c.wav", "no sound");
  WriteBytes("list",
             "file\tclass\tfold\na.wav\tdog\t1\nc.wav\tdog\t2\nd.wav\tdog\t2\n"
             "b.wav\t../up\t0\n");
  EXPECT_EQ(Run("$QZ features --manifest " + Path("list") + " -o " + Path("into")), 3);
  EXPECT_THAT(err_, HasSubstr("qz: skipped: " + Path("c.wav") + ": not a readable sound file"));
  EXPECT_THAT(err_, HasSubstr("qz: skipped: " + Path("d.wav") + ": can't be opened"));
  EXPECT_THAT(err_, HasSubstr("qz: skipped 2 of 4 clips\n"));
  EXPECT_EQ(Contents("into/features.tsv"),
            "file\tclass\tfold\ndog/a.npy\tdog\t1\n_._up/b.npy\t../up\t0\n");
  EXPECT_EQ(Array("into/dog/a.npy").shape[0], 598u);
  EXPECT_EQ(Array("into/_._up/b.npy").shape, (std::vector<size_t>{0, 48}));
}

TEST_F(Features, OfWrongUseWriteNothing) {
  const std::string sound = Wav("a.wav", Sound());
  EXPECT_EQ(Run("$QZ features -o " + Path("out")), 2);
  EXPECT_THAT(err_, HasSubstr("FILES or --manifest is required"));
  EXPECT_EQ(Run("$QZ features " + sound + " " + sound + " -o " + Path("x.npy")), 2);
  EXPECT_THAT(err_, HasSubstr("x.npy names one array, should be a folder"));
  EXPECT_EQ(Run("$QZ features --manifest " + WriteBytes("list", "a\n") + " -o " + Path("x")), 3);
  EXPECT_THAT(err_, HasSubstr("line 1"));
  EXPECT_EQ(Run("$QZ features " + sound + " -o " + sound + "/x.npy"), 5);
  EXPECT_THAT(err_, HasSubstr(sound + ": this folder can't be made: "));
  EXPECT_FALSE(std::filesystem::exists(Path("x")));
}

}  // namespace
}  // namespace qz::tools
