// The binding of the audio functions, against a dlsym of the suite's own (see CMakeLists.txt).

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "chre.h"

namespace {

std::vector<std::string> lookups;
void* answer = nullptr;

bool RuntimeGetSource(uint32_t handle, chreAudioSource* source) {
  source->sampleRate = handle * 10;
  return handle < 2;
}

}  // namespace

extern "C" void* qz_test_dlsym(void* handle, const char* name) {
  EXPECT_EQ(reinterpret_cast<intptr_t>(handle), -1);
  lookups.emplace_back(name);
  return strcmp(name, "chreAudioGetSource") == 0 ? answer : nullptr;
}

namespace {

TEST(AudioBinding, BindsOnceAndForwardsOrAnswersFalse) {
  answer = reinterpret_cast<void*>(RuntimeGetSource);
  chreAudioSource source = {};
  EXPECT_TRUE(chreAudioGetSource(1, &source));
  EXPECT_EQ(source.sampleRate, 10u);
  EXPECT_FALSE(chreAudioGetSource(2, &source));
  EXPECT_EQ(lookups, std::vector<std::string>{"chreAudioGetSource"});

  EXPECT_FALSE(chreAudioConfigureSource(0, true, 1, 1));
  EXPECT_FALSE(chreAudioConfigureSource(0, true, 1, 1));
  EXPECT_EQ(lookups, (std::vector<std::string>{"chreAudioGetSource", "chreAudioConfigureSource"}));
}

}  // namespace
