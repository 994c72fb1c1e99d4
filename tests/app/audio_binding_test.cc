// SPDX-License-Identifier: Apache-2.0
// The binding of the audio functions, against a dlsym of the suite's own (see CMakeLists.txt).

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "chre.h"

namespace {

std::vector<std::string> lookups;

}  // namespace

// A runtime with half of the functions.
extern "C" void* qz_test_dlsym(void* handle, const char* name) {
  EXPECT_EQ(reinterpret_cast<intptr_t>(handle), -1);
  lookups.emplace_back(name);
  bool (*const get_source)(uint32_t, chreAudioSource*) = [](uint32_t number,
                                                            chreAudioSource* source) {
    source->sampleRate = number * 10;
    return number < 2;
  };
  return lookups.back() == "chreAudioGetSource" ? reinterpret_cast<void*>(get_source) : nullptr;
}

TEST(AudioBinding, BindsOnceAndForwardsOrAnswersFalse) {
  chreAudioSource source = {};
  EXPECT_TRUE(chreAudioGetSource(1, &source));
  EXPECT_EQ(source.sampleRate, 10u);
  EXPECT_FALSE(chreAudioGetSource(2, &source));
  for (int i = 0; i < 2; ++i) EXPECT_FALSE(chreAudioConfigureSource(0, true, 1, 1));
  EXPECT_EQ(lookups, (std::vector<std::string>{"chreAudioGetSource", "chreAudioConfigureSource"}));
}
