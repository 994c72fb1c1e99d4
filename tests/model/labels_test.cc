// SPDX-License-Identifier: Apache-2.0
// The table of the classes that the outputs of a model detect.

#include "model/labels.h"

#include <gmock/gmock.h>

#include "base/error.h"
#include "tests/support/temporary_folder.h"

namespace qz::model {
namespace {

using testing::HasSubstr;

constexpr char kHeader[] = "output\tcategory\tclass\tname\n";
constexpr char kFour[] =
    "0\t0\tdog\tdog bark\n1\t6\tbaby\ta baby\n2\t17\tcock\trooster\n3\t15\tclock\tclock\n";

class LabelsFile : public testing::Test {
 protected:
  Labels Read(const std::string& text) const {
    return ReadLabels(folder_.WriteBytes("labels", text));
  }

  const test::TemporaryFolder folder_;
};

TEST_F(LabelsFile, HoldsCategoryClassAndName) {
  for (const char* last : {"4\t255\tman\tsneeze", "4\t255\tman\tsneeze\r\n"}) {
    const Labels labels = Read(std::string(kHeader) + kFour + last);
    EXPECT_EQ(labels[1].category, 6);
    EXPECT_EQ(labels[0].name, "dog bark");
    EXPECT_EQ(labels[4].name, "sneeze");
    EXPECT_EQ(OutputOf(labels, "clock"), 3);
    EXPECT_EQ(OutputOf(labels, "rain"), -1);
  }
}

TEST_F(LabelsFile, IsRefusedWithTheLineAtFault) {
  const std::string start = std::string(kHeader) + kFour;
  const std::pair<std::string, const char*> cases[] = {
      {"", "labels: labels of 0 outputs, should be 5"},
      {kFour, "line 1: the first line should be: output, category, class, name"},
      {start, "labels: labels of 4 outputs, should be 5"},
      {start + "4\t256\tman\tsneeze\n", "line 6: the category is '256', should be 0 to 255"},
      {start + "4\t1x\tman\tsneeze\n", "line 6: the category is '1x'"},
      {start + "5\t1\tman\tsneeze\n", "line 6: the output is '5', should be 4"},
      {start + "4\t1\tman\n", "line 6: 3 fields, should be 4 between tabs: output, category,"},
      {start + "4\t1\tman\t\n", "line 6: the class or the name is empty"},
      {start + "4\t1\tman\t\x1B[31msneeze\n", "line 6: holds the control character U+001B"},
      {start + "4\t1\tdog\tsneeze\n", "line 6: class or category is that of output 0 too"},
      {start + "4\t17\tman\tsneeze\n", "line 6: class or category is that of output 2 too"},
      {start + "4\t1\tman\tsneeze\n5\t2\tcat\tcat\n", "labels: labels of 6 outputs"}};
  for (const auto& [text, message] : cases) {
    try {
      Read(text);
      ADD_FAILURE() << text;
    } catch (const base::InputError& error) {
      EXPECT_THAT(error.what(), HasSubstr(message));
    }
  }
  EXPECT_THROW(ReadLabels(folder_.Path("")), base::InputError);
  EXPECT_THROW(ReadLabels(folder_.Path("absent")), base::InputError);
}

}  // namespace
}  // namespace qz::model
