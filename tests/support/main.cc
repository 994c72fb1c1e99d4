// SPDX-License-Identifier: Apache-2.0
// The main program of every suite: a suite that ran nothing has failed.

#include <gtest/gtest.h>

#include <cstdio>

// For LeakSanitizer: libvorbis does not free this where a stream's headers are cut off.
extern "C" const char* __lsan_default_suppressions() { return "leak:vorbis_info_init"; }

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
