// The module as a loader sees it: what it exports, what it imports, what runs at load, what it says
// of itself.

#include <dlfcn.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <cstring>
#include <memory>
#include <set>
#include <sstream>
#include <string>

#include "chre_nanoapp_info.h"

namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::Not;

std::string OutputOf(const std::string& command) {
  std::string output;
  const std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
  std::array<char, 4096> block;
  while (pipe != nullptr && fgets(block.data(), block.size(), pipe.get()) != nullptr) {
    output += block.data();
  }
  return output;
}

// Names of the dynamic symbols, without their versions.
std::set<std::string> DynamicSymbols(const std::string& which) {
  std::set<std::string> names;
  std::istringstream lines(OutputOf("nm -D --format=just-symbols " + which + " " QZ_MODULE));
  for (std::string line; std::getline(lines, line);) names.insert(line.substr(0, line.find('@')));
  return names;
}

std::set<std::string> Sections() {
  std::set<std::string> names;
  std::istringstream words(OutputOf("readelf -WS " QZ_MODULE));
  for (std::string word; words >> word;) {
    if (word[0] == '.') names.insert(word);
  }
  return names;
}

#ifndef QZ_SANITIZED
TEST(ModuleFile, ImportsTheRuntimeAndLittleElse) {
  EXPECT_THAT(
      DynamicSymbols("--undefined-only"),
      ElementsAre("chreGetEstimatedHostTimeOffset", "chreGetTime", "chreHeapAlloc", "chreHeapFree",
                  "chreLog", "chreSendEvent", "chreSendMessageToHostEndpoint",
                  "chrexClockRateChangeRequest", "dlsym", "memcpy", "memmove", "memset"));
}

TEST(ModuleFile, RunsNothingAtLoad) {
  const std::set<std::string> sections = Sections();
  ASSERT_THAT(sections, Contains(".text"));
  for (const char* name : {".init", ".init_array", ".ctors", ".fini_array", ".data", ".tbss"}) {
    EXPECT_THAT(sections, Not(Contains(name)));
  }
}
#endif

TEST(ModuleFile, ExportsTheRecordAndTheUnstableId) {
  EXPECT_THAT(DynamicSymbols("--defined-only"),
              ElementsAre("_chreNanoappUnstableId", "_chreNslDsoNanoappInfo"));
}

TEST(ModuleFile, SaysWhatItIs) {
  EXPECT_THAT(Sections(), Contains(".unstable_id"));
  EXPECT_THAT(OutputOf("readelf -p .unstable_id " QZ_MODULE),
              testing::HasSubstr("nanoapp=qz@" QZ_BUILD_NUMBER "~" QZ_DEVICE));
  void* module = dlopen(QZ_MODULE, RTLD_NOW | RTLD_LOCAL);
  ASSERT_NE(module, nullptr) << dlerror();
  const auto* info =
      static_cast<const chreNslNanoappInfo*>(dlsym(module, CHRE_NSL_NANOAPP_INFO_SYMBOL));
  ASSERT_NE(info, nullptr);
  // Magic, version 3, no flag, nothing in the reserved and padding bytes, API 1.9.
  const uint8_t first_bytes[12] = {0x77, 0x99, 0xE6, 0x50, 3, 0, 0, 0, 0, 0, 9, 1};
  EXPECT_EQ(memcmp(info, first_bytes, sizeof(first_bytes)), 0);
  EXPECT_STREQ(info->vendor, "Tamrex");
  EXPECT_STREQ(info->name, "QZ");
  EXPECT_EQ(info->appId, 0x54616D7265001030u);
  EXPECT_EQ(info->appVersion, 18u);
  EXPECT_EQ(info->appVersionString, dlsym(module, "_chreNanoappUnstableId"));
  EXPECT_EQ(info->appPermissions, 1u);
  dlclose(module);
}

}  // namespace
