// SPDX-License-Identifier: Apache-2.0
// The application on a hub, linked into the suite: with a network whose scores are chosen,
// detection tables with low thresholds, and the hub's own audio functions.
#pragma once

#include "app/nanoapp.h"
#include "tests/support/nanoapp_record.h"
#include "tests/support/stub_network.h"
#include "tests/support/test_hub.h"

namespace qz::test {

inline constexpr chreNslNanoappInfo kLinkedInfo =
    NanoappRecord(nanoappStart, nanoappHandleEvent, nanoappEnd);

class LinkedNanoapp : public testing::Test, protected TestHub {
 protected:
  LinkedNanoapp() : TestHub(/*host_time_offset_ns=*/500) {
    stub_network = {};
    hub.sources().emplace_back();
    Start();
  }

  void Start() {
    hub::LoadFailure failure;
    ASSERT_TRUE(hub.StartLinked(kLinkedInfo, &failure)) << failure.message;
    TakeLog();
  }
  bool audio() { return hub.audio_enabled(); }

  // A buffer of two seconds of silence.
  void PlayBuffer() {
    static const std::vector<int16_t> silence(32000);
    hub.PlayAudio(silence.data(), 32000);
  }
  // Plays until the network has run with these scores: its window is full in the second buffer.
  void PlayRun(const Scores& scores) {
    stub_network.scores = [=](int) { return scores; };
    const int before = stub_network.runs;
    for (int buffer = 0; stub_network.runs == before; ++buffer) {
      ASSERT_LT(buffer, 2) << "the network does not run";
      PlayBuffer();
    }
  }
};

}  // namespace qz::test
