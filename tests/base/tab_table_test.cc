// SPDX-License-Identifier: Apache-2.0
// Tables of text: what editors make of them, and what is refused.

#include "base/tab_table.h"

#include <gmock/gmock.h>

#include "base/error.h"
#include "tests/support/temporary_folder.h"

namespace qz::base {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::ThrowsMessage;

class TabTable : public testing::Test, protected test::TemporaryFolder {
 protected:
  std::vector<TabRow> Read(const std::string& text) const {
    return ReadTabTable(WriteBytes("t", text), {"name", "value"});
  }
  void ExpectRefused(const std::string& text, const std::string& message) const {
    EXPECT_THAT([&] { Read(text); }, ThrowsMessage<InputError>(HasSubstr(message)));
  }
};

TEST_F(TabTable, ReadsWhatEditorsSave) {
  const std::string text = "# mine\n\nname\tvalue\n\xC3\xA4 b\t\n#x\ty\nc\t2";
  std::string windows = "\xEF\xBB\xBF";
  for (const char c : text) windows += c == '\n' ? "\r\n" : std::string(1, c);
  for (const std::string& saved : {text, windows}) {
    const std::vector<TabRow> rows = Read(saved);
    ASSERT_EQ(rows.size(), 2u);
    EXPECT_THAT(rows[0].fields, ElementsAre("\xC3\xA4 b", ""));
    EXPECT_THAT(rows[1].fields, ElementsAre("c", "2"));
    EXPECT_EQ(rows[1].location, Path("t") + ": line 6: ");
  }
}

TEST_F(TabTable, RefusesOtherColumnsAndControlCharacters) {
  EXPECT_TRUE(Read("").empty());
  ExpectRefused("name value\n", "t: line 1: the first line should be: name, value, with tabs");
  ExpectRefused("\xEF\xBB\xBF\xEF\xBB\xBFname\tvalue\n", "t: line 1: the first line should be");
  ExpectRefused("name\tvalue\na\n", "t: line 2: 1 fields, should be 2 between tabs: name, value");
  ExpectRefused("name\tvalue\na\tb\tc\n", "t: line 2: 3 fields, should be 2");
  const std::pair<std::string, const char*> controls[] = {{std::string(1, '\0'), "U+0000"},
                                                          {"\x1B[31m", "U+001B"},
                                                          {"\r", "U+000D"},
                                                          {"\x7F", "U+007F"},
                                                          {"\xC2\x9B", "U+009B"}};
  for (const auto& [control, code] : controls) {
    ExpectRefused("name\tvalue\na\tb" + control + "c\n",
                  std::string("line 2: holds the control character ") + code);
  }
  EXPECT_THROW(ReadTabTable(Path("absent"), {"name"}), InputError);
  EXPECT_THROW(ReadTabTable(Path(""), {"name"}), InputError) << "a folder";
}

}  // namespace
}  // namespace qz::base
