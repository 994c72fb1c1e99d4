// The main program of every suite: a suite that ran nothing has failed.

#include <gtest/gtest.h>

#include <cstdio>

int main(int argc, char** argv) {
  testing::InitGoogleTest(&argc, argv);
  const int result = RUN_ALL_TESTS();
  const auto& unit = *testing::UnitTest::GetInstance();
  if (!testing::GTEST_FLAG(list_tests) &&
      unit.successful_test_count() + unit.failed_test_count() == 0) {
    std::fprintf(stderr, "%s ran no test\n", argv[0]);
    return 1;
  }
  return result;
}
