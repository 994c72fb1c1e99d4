// SPDX-License-Identifier: Apache-2.0
#include "hub/hub.h"

#include <gmock/gmock.h>

#include "hub/messages.h"
#include "tests/support/nanoapp_record.h"

namespace qz::hub {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

TEST(Heap, RemembersMisuseAndRefusesExactlyTheOrderedAllocation) {
  Heap heap;
  heap.RefuseNth(2);
  void* kept = heap.Allocate(10);
  EXPECT_EQ(heap.Allocate(10), nullptr);
  EXPECT_TRUE(heap.refused());
  void* block = heap.Allocate(20);
  EXPECT_EQ(heap.SizeOf(block), 20u);
  for (void* each : std::vector<void*>{block, nullptr, block, &heap}) heap.Free(each);
  EXPECT_THAT(heap.faults(),
              ElementsAre(HasSubstr("which was freed before"), HasSubstr("which is no block")));
  EXPECT_EQ(heap.live_blocks(), 1u);
  heap.Free(kept);
  EXPECT_EQ(heap.live_blocks(), 0u);
}

constexpr chreNslNanoappInfo kGoodRecord =
    test::NanoappRecord([] { return true; }, [](uint32_t, uint16_t, const void*) {}, [] {});

TEST(NanoappInfo, EveryInvalidFieldIsNamed) {
  const std::pair<void (*)(chreNslNanoappInfo & info), const char*> cases[] = {
      {[](auto& info) { info.magic = 1; }, "magic is 0x00000001, should be 0x50e69977"},
      {[](auto& info) { info.targetApiVersion = 0x01100000; }, "API version is 0x01100000"},
      {[](auto& info) { info.targetApiVersion = 0x00090000; }, "API version is 0x00090000"},
      {[](auto& info) { info.start = nullptr; }, "start entry point is null"},
      {[](auto& info) { info.handleEvent = nullptr; }, "event entry point is null"},
      {[](auto& info) { info.end = nullptr; }, "end entry point is null"},
      {[](auto& info) { info.name = nullptr; }, "name is null"},
      {[](auto& info) { info.vendor = nullptr; }, "name is null"},
      {[](auto& info) { info.structMinorVersion = 2; }, "record version 2"},
      {[](auto& info) { info.appPermissions = 0; }, "permissions are 0x00000000"},
      {[](auto& info) { info.appPermissions = 3; }, "permissions are 0x00000003"},
      {[](auto& info) { info.start = [] { return false; }; }, "start entry point failed"},
  };
  for (const auto& [spoil, message] : cases) {
    Hub hub;
    chreNslNanoappInfo info = kGoodRecord;
    spoil(info);
    LoadFailure failure;
    EXPECT_FALSE(hub.StartLinked(info, &failure));
    EXPECT_EQ(failure.kind, LoadFailure::Kind::kRefused);
    EXPECT_THAT(failure.message, HasSubstr(message));
  }
}

// A nanoapp that leaks a block at its end and answers every event, and the end, with two events and
// two messages, one each to an unknown receiver.
int freed = 0;
void SendThings(uint32_t sender, uint16_t, const void*) {
  for (const uint32_t target : {sender, uint32_t{0xBAD}}) {
    chreSendEvent(
        7, chreHeapAlloc(4), [](uint16_t, void* data) { ++freed, chreHeapFree(data); }, target);
  }
  for (const uint16_t endpoint : {uint16_t{1}, uint16_t{0xBAD}}) {
    chreSendMessageToHostEndpoint(chreHeapAlloc(8), 8, 9, endpoint,
                                  [](void* data, size_t) { ++freed, chreHeapFree(data); });
  }
}

TEST(Hub, DeliversInOrderFreesEverythingOnceAndFindsTheLeak) {
  for (const bool refuse : {false, true}) {
    Hub hub;
    freed = 0;
    hub.fault_plan() = {refuse, refuse};
    std::vector<std::string> delivered;
    const auto record = [&](uint32_t type, const void*, size_t size) {
      delivered.push_back(std::to_string(type) + " size " + std::to_string(size) + " freed " +
                          std::to_string(freed));
    };
    hub.ConnectHostEndpoint(1, record);
    const uint32_t client = hub.AddClientNanoapp(record);
    chreNslNanoappInfo info = kGoodRecord;
    info.targetApiVersion = 0x01080000;  // an older one is fine
    info.handleEvent = SendThings;
    info.end = [] { chreHeapAlloc(1), SendThings(0xBAD, 0, nullptr); };
    LoadFailure failure;
    ASSERT_TRUE(hub.StartLinked(info, &failure));
    hub.SendFromClientNanoapp(client, 5);
    EXPECT_EQ(freed, 4);
    EXPECT_EQ(hub.counts().undeliverable, refuse ? 0u : 2u);
    EXPECT_EQ(delivered, refuse
                             ? std::vector<std::string>()
                             : (std::vector<std::string>{"7 size 4 freed 0", "9 size 8 freed 2"}));
    EXPECT_THAT(hub.Faults(), IsEmpty());
    hub.End();
    EXPECT_THAT(hub.Faults(), ElementsAre(HasSubstr("1 heap blocks still held")));
  }
}

TEST(Hub, IsTheOnlyOneOfItsProcess) {
  std::string line;
  {
    Hub first;
    first.SetLogHandler([&](chreLogLevel, uint64_t, const std::string& text) { line = text; });
    EXPECT_THROW(Hub second, std::logic_error);
    chreLog(CHRE_LOG_INFO, "%s", "to the first");
  }
  EXPECT_EQ(line, "to the first");
  Hub third;
}

// A caller that breaks a precondition ends the program in every build.
TEST(HubDeathTest, PreconditionsAreChecked) {
  Hub hub;
  hub.sources().emplace_back();
  EXPECT_DEATH(hub.StartLinked(kGoodRecord, nullptr), "precondition violated: failure != nullptr");
  LoadFailure failure;
  chreNslNanoappInfo info = kGoodRecord;
  info.handleEvent = [](uint32_t, uint16_t, const void*) { chreLog(CHRE_LOG_INFO, "!"); };
  ASSERT_TRUE(hub.StartLinked(info, &failure));
  EXPECT_DEATH(hub.PlayAudio(nullptr, 1), "samples != nullptr");
  EXPECT_DEATH(hub.ConnectHostEndpoint(1, nullptr), "handler != nullptr");
  EXPECT_DEATH(hub.AddClientNanoapp(nullptr), "handler != nullptr");
  EXPECT_DEATH(hub.StopClientNanoapp(5), "clients_.count");
  EXPECT_DEATH(chreAudioGetSource(0, nullptr), "source != nullptr");
  EXPECT_DEATH(chreSendMessageToHostEndpoint(nullptr, 1, 1, 1, nullptr), "message != nullptr");
  EXPECT_DEATH(DecodeFramedSoundReport(nullptr, 4), "data != nullptr");
  // From within the nanoapp, and from a handler, which runs while the module's callbacks are due.
  hub.SetLogHandler(
      [&](chreLogLevel, uint64_t, const std::string&) { hub.SendFromHost(1, 1, {}); });
  EXPECT_DEATH(hub.DeliverToNanoapp(0, 1, nullptr), "!in_nanoapp_");
  hub.SetLogHandler(nullptr);
  hub.ConnectHostEndpoint(1, [&](uint32_t, const uint8_t*, size_t) { hub.End(); });
  chreSendMessageToHostEndpoint(nullptr, 0, 1, 1, nullptr);
  EXPECT_DEATH(hub.DeliverToNanoapp(0, 1, nullptr), "!delivering_");
  hub.DisconnectHostEndpoint(1);
}

TEST(Messages, DamagedFramesAreNoReports) {
  // A whole frame and one byte more.
  const uint8_t good[] = {4, 0, 0, 0, 0x08, 0x05, 0x20, 0x07, 0x08};
  for (size_t size = 0; size <= sizeof(good); ++size) {
    EXPECT_EQ(DecodeFramedSoundReport(good, size).has_value(), size == 8) << size;
  }
  const uint8_t broken[] = {2, 0, 0, 0, 0x08, 0xFF};
  EXPECT_FALSE(DecodeFramedSoundReport(broken, sizeof(broken)).has_value());
}

}  // namespace
}  // namespace qz::hub
