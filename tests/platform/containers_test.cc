#include <gtest/gtest.h>

#include <vector>

#include "chre/dynamic_vector.h"
#include "chre/fixed_size_vector.h"
#include "chre/singleton.h"
#include "test_hub.h"

namespace {

template <typename Container>
std::vector<int> Contents(const Container& container) {
  return {container.begin(), container.end()};
}

TEST(DynamicVector, DoublesItsStorageAndKeepsTheOrder) {
  qz::test::TestHub runtime;
  {
    chre::DynamicVector<int> vector;
    EXPECT_EQ(runtime.hub.heap().allocations(), 0u);
    std::vector<size_t> capacities;
    for (int i = 1; i <= 5; ++i) {
      ASSERT_TRUE(vector.push_back(i));
      capacities.push_back(vector.capacity());
    }
    EXPECT_EQ(capacities, (std::vector<size_t>{1, 2, 4, 4, 8}));
    EXPECT_EQ(runtime.hub.heap().live_blocks(), 1u);
    vector.erase(1);
    EXPECT_EQ(Contents(vector), (std::vector<int>{1, 3, 4, 5}));
    vector.erase(3);
    EXPECT_EQ(Contents(vector), (std::vector<int>{1, 3, 4}));
    EXPECT_EQ(vector.find(4), 2u);
    EXPECT_EQ(vector.find(2), vector.size());
    EXPECT_EQ(vector.capacity(), 8u);
  }
  EXPECT_EQ(runtime.hub.heap().live_blocks(), 0u);
}

TEST(DynamicVector, ARefusedGrowthChangesNothing) {
  qz::test::TestHub runtime;
  chre::DynamicVector<int> vector;
  runtime.hub.heap().RefuseNth(1);
  EXPECT_FALSE(vector.push_back(1));
  EXPECT_TRUE(vector.empty());
  ASSERT_TRUE(vector.push_back(1));
  runtime.hub.heap().RefuseNth(1);
  EXPECT_FALSE(vector.push_back(2));
  EXPECT_FALSE(vector.reserve(SIZE_MAX / 2));
  EXPECT_EQ(Contents(vector), std::vector<int>{1});
  EXPECT_TRUE(vector.push_back(2));
  EXPECT_EQ(Contents(vector), (std::vector<int>{1, 2}));
}

TEST(FixedSizeVector, EraseClosesTheGap) {
  chre::FixedSizeVector<int, 3> vector;
  for (int i = 1; i <= 3; ++i) vector.push_back(i);
  EXPECT_TRUE(vector.full());
  vector.erase(0);
  EXPECT_EQ(Contents(vector), (std::vector<int>{2, 3}));
  vector.erase(1);
  EXPECT_EQ(Contents(vector), std::vector<int>{2});
}

struct Counted {
  Counted() { ++built; }
  ~Counted() { ++destroyed; }
  Counted(const Counted&) = delete;
  Counted& operator=(const Counted&) = delete;
  static inline int built = 0;
  static inline int destroyed = 0;
};

TEST(Singleton, IsBuiltAndDestroyedOnce) {
  using One = chre::Singleton<Counted>;
  EXPECT_FALSE(One::isInitialized());
  One::init();
  One::init();
  EXPECT_TRUE(One::isInitialized());
  One::deinit();
  One::deinit();
  EXPECT_EQ(Counted::built, 1);
  EXPECT_EQ(Counted::destroyed, 1);
}

}  // namespace
