// SPDX-License-Identifier: Apache-2.0
#include "chre/dynamic_vector.h"
#include "tests/support/test_hub.h"

namespace {

TEST(DynamicVector, DoublesItsStorageAndKeepsTheOrder) {
  qz::test::TestHub runtime;
  chre::DynamicVector<int> vector;
  for (const size_t capacity : {1, 2, 4, 4, 8}) {
    // A refused growth changes nothing; where there is space nothing can be refused.
    const bool grows = capacity != vector.capacity();
    const auto next = static_cast<int>(vector.size()) + 1;
    runtime.hub.heap().RefuseNth(1);
    ASSERT_EQ(vector.push_back(next), !grows);
    runtime.hub.heap().RefuseNth(0);
    ASSERT_TRUE(!grows || vector.push_back(next));
    EXPECT_EQ(vector.capacity(), capacity);
  }
  EXPECT_EQ(runtime.hub.heap().live_blocks(), 1u);
  EXPECT_FALSE(vector.reserve(SIZE_MAX / 2));
  vector.erase(1);
  vector.erase(3);
  EXPECT_EQ(std::vector<int>(vector.begin(), vector.end()), (std::vector<int>{1, 3, 4}));
  EXPECT_EQ(vector.find(4), 2u);
  EXPECT_EQ(vector.find(2), vector.size());
}

}  // namespace
