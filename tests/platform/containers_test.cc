#include <gtest/gtest.h>

#include <vector>

#include "chre/dynamic_vector.h"
#include "test_hub.h"

namespace {

template <typename Container>
std::vector<int> Contents(const Container& container) {
  return {container.begin(), container.end()};
}

TEST(DynamicVector, DoublesItsStorageAndKeepsTheOrder) {
  qz::test::TestHub runtime;
  chre::DynamicVector<int> vector;
  std::vector<size_t> capacities;
  for (int i = 1; i <= 5; ++i) {
    // A refused growth changes nothing; where there is room nothing can be refused.
    runtime.hub.heap().RefuseNth(1);
    const bool grows = vector.size() == vector.capacity();
    EXPECT_EQ(vector.push_back(i), !grows);
    runtime.hub.heap().RefuseNth(0);
    if (grows) {
      EXPECT_EQ(vector.size(), static_cast<size_t>(i - 1));
      ASSERT_TRUE(vector.push_back(i));
    }
    capacities.push_back(vector.capacity());
  }
  EXPECT_EQ(capacities, (std::vector<size_t>{1, 2, 4, 4, 8}));
  EXPECT_EQ(runtime.hub.heap().live_blocks(), 1u);
  EXPECT_FALSE(vector.reserve(SIZE_MAX / 2));
  vector.erase(1);
  EXPECT_EQ(Contents(vector), (std::vector<int>{1, 3, 4, 5}));
  vector.erase(3);
  EXPECT_EQ(Contents(vector), (std::vector<int>{1, 3, 4}));
  EXPECT_EQ(vector.find(4), 2u);
  EXPECT_EQ(vector.find(2), vector.size());
  EXPECT_EQ(vector.capacity(), 8u);
}

}  // namespace
