#include "weight_layout.h"

#include <gmock/gmock.h>

namespace qz::model {
namespace {

TEST(WeightLayout, TablesFollowOneAnother) {
  std::vector<size_t> offsets;
  for (const TableLayout& table : kTables) offsets.push_back(table.offset);
  EXPECT_THAT(offsets, testing::ElementsAre(0, 528, 4112, 4816, 9168, 21200, 33232, 45264, 57296,
                                            69328, 81360, 85456));
  EXPECT_EQ(FindTable(18)->Bytes(), 544u);
}

TEST(WeightLayout, PlacesAreWhereThePackedFileHasThem) {
  // w3 starts at 528 + 3584; channel 59 is lane 11 of its group 3.
  EXPECT_EQ(FindTable(3)->BiasOffset(59), 4112u + 3 * 176 + 4 * 11);
  EXPECT_EQ(FindTable(3)->WeightOffset(2, 0, 59), 4112u + 3 * 176 + 64 + 2 * 16 + 11);
  EXPECT_EQ(FindTable(3)->ScaleOffset(59), 4112u + 3 * 176 + 64 + 48 + 4 * 11);
  EXPECT_EQ(FindTable(1)->ScaleOffset(59), 528u + 7 * 448 + 32 + 48 * 8 + 4 * 3);
  EXPECT_EQ(FindTable(6)->WeightOffset(1, 5, 9), 9168u + 1504 + 32 + (60 + 5) * 8 + 1);
  EXPECT_EQ(FindTable(18)->WeightOffset(0, 63, 4), 85456u + 32 + 63 * 8 + 4);
  EXPECT_EQ(FindTable(2), nullptr);
}

TEST(WeightLayout, PlacesCoverTheFileOnce) {
  std::vector<int> covered(kModelBytes);
  const auto cover = [&](size_t offset, size_t bytes) {
    for (size_t i = 0; i < bytes; ++i) ++covered.at(offset + i);
  };
  for (const TableLayout& table : kTables) {
    for (int column = 0; column < table.PaddedColumns(); ++column) {
      cover(table.BiasOffset(column), 4);
      if (table.HasScales()) cover(table.ScaleOffset(column), 4);
      for (int tap = 0; tap < table.taps; ++tap) {
        for (int input = 0; input < table.inputs; ++input) {
          cover(table.WeightOffset(tap, input, column), 1);
        }
      }
    }
  }
  EXPECT_THAT(covered, testing::Each(1));
}

}  // namespace
}  // namespace qz::model
