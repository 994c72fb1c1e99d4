// SPDX-License-Identifier: Apache-2.0
// Lists of recordings: what they hold, and the messages about lists that can't be used.

#include "dataset/manifest.h"

#include <gmock/gmock.h>

#include <string>

#include "base/error.h"
#include "tests/support/temporary_folder.h"

namespace qz::dataset {
namespace {

using testing::StartsWith;

const std::string kHeader = "file\tclass\tfold\n";

class Manifest : public testing::Test, protected test::TemporaryFolder {
 protected:
  std::string ErrorOf(const std::string& text) const {
    try {
      ReadManifest(WriteBytes("list.tsv", text));
    } catch (const base::InputError& error) {
      return error.what();
    }
    return "none";
  }
};

TEST_F(Manifest, HoldsTheRecordingsInOrder) {
  const std::string text = "# noises\n\n" + kHeader +
                           "rain/a b.wav\train\t0\r\n#x.wav\train\t1\n\n/abs/c.ogg\tdog bark\t99";
  const std::vector<Recording> recordings = ReadManifest(WriteBytes("list.tsv", text));
  ASSERT_EQ(recordings.size(), 2u);
  EXPECT_EQ(recordings[0].file, Path("rain/a b.wav"));
  EXPECT_EQ(recordings[0].class_name, "rain");
  EXPECT_EQ(recordings[0].fold, 0);
  EXPECT_EQ(recordings[1].file, "/abs/c.ogg");
  EXPECT_EQ(recordings[1].class_name, "dog bark");
  EXPECT_EQ(recordings[1].fold, 99);
}

TEST_F(Manifest, NamesTheLineAtFault) {
  const std::string list = Path("list.tsv") + ": ";
  const std::pair<std::string, std::string> cases[] = {
      {"", "lists no recording"},
      {kHeader + "# nothing\n", "lists no recording"},
      {"a.wav\train\t1\n", "line 1: the first line should be: file, class, fold"},
      {kHeader + "\na.wav\train\n", "line 3: 2 fields, should be 3 between tabs"},
      {kHeader + "a.wav\train\t1\t\n", "line 2: 4 fields, should be 3 between tabs"},
      {kHeader + "\train\t1\n", "line 2: no file name before the first tab"},
      {kHeader + "a.wav\t\t1\n", "line 2: no class between the tabs"},
      {kHeader + "a.wav\train\t\n", "line 2: the fold is '', should be 0 to 99"},
      {kHeader + "a.wav\train\t100\n", "line 2: the fold is '100', should be 0 to 99"},
      {kHeader + "a.wav\train\t-1\n", "line 2: the fold is '-1', should be 0 to 99"},
      {kHeader + "a.wav\train\t 1\n", "line 2: the fold is ' 1', should be 0 to 99"}};
  for (const auto& [text, message] : cases) EXPECT_THAT(ErrorOf(text), StartsWith(list + message));
  EXPECT_THROW(ReadManifest(Path("absent.tsv")), base::InputError);
  EXPECT_THROW(ReadManifest(Path("")), base::InputError) << "a folder";
}

}  // namespace
}  // namespace qz::dataset
