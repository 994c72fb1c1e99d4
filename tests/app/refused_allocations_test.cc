// Every allocation of a busy scenario fails in turn: nothing leaks, nothing is freed twice, the log
// says which work was dropped, and the next good request works.

#include <gmock/gmock.h>

#include <set>

#include "linked_nanoapp.h"

namespace qz::test {
namespace {

class RefusedAllocations : public LinkedNanoapp {
 protected:
  void Scenario() {
    Send(0x10, hub::kQueryRequest, {});
    Enable(0x10, 1);
    Enable(0x11, 2);
    const uint32_t first = RegisterClientNanoapp();
    const uint32_t second = RegisterClientNanoapp();
    const uint32_t third = RegisterClientNanoapp();
    stub_network.scores = [](int) { return Scores{0.75f, 0, 0, 0, 0}; };
    const int before = stub_network.runs;
    while (stub_network.runs == before) PlayBuffer();
    for (const uint32_t client : {first, second, third}) {
      hub().SendFromClientNanoapp(client, hub::kUnregisterEvent);
    }
    Disable(0x10, 1);
    Disable(0x11, 2);
  }
};

TEST_F(RefusedAllocations, EachInTurn) {
  Connect(0x10);
  Connect(0x11);
  Start();
  std::set<std::string> errors;
  uint64_t refusals = 0;
  for (;; ++refusals) {
    ASSERT_LT(refusals, 100u);
    hub().End();
    Start();
    const uint64_t turn = refusals + 1;
    hub().heap().RefuseNth(turn);
    Scenario();
    const bool refused = hub().heap().refused();
    hub().heap().RefuseNth(0);
    if (!refused) break;
    size_t lines = 0;
    for (const std::string& line : TakeLog()) {
      if (line[0] != 'E' || line.find("not registered") != std::string::npos) continue;
      errors.insert(line.substr(0, line.find('#')));
      ++lines;
    }
    EXPECT_GE(lines, 1u) << "refusal " << turn << " was not logged";
    messages.clear();
    Send(0x10, hub::kQueryRequest, {});
    EXPECT_EQ(messages.size(), 1u);
    hub().End();
    EXPECT_EQ(hub().heap().live_blocks(), 0u) << "refusal " << turn;
  }
  EXPECT_GE(refusals, 10u);
  EXPECT_THAT(
      errors,
      testing::IsSupersetOf(
          {"E OOM at app_manager.cc:174", "E SoundService: failed to register",
           "E OOM at sound_detection_proto_helper.cc:155",
           "E Failed to encode detection response message.", "E Unable to encode response message",
           "E Failed to send SOUND_EVENT_DETECTION message to host.",
           "E Failed to allocate output buffer of size 39h for publishing eventto client "}));
}

}  // namespace
}  // namespace qz::test
