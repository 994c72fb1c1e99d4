#include "hub.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "messages.h"
#include "test_hub.h"

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
  heap.Free(block);
  heap.Free(nullptr);
  EXPECT_THAT(heap.faults(), IsEmpty());
  heap.Free(block);
  heap.Free(&heap);
  EXPECT_THAT(heap.faults(),
              ElementsAre(HasSubstr("which was freed before"), HasSubstr("which is no block")));
  EXPECT_EQ(heap.live_blocks(), 1u);
  heap.Free(kept);
  EXPECT_EQ(heap.live_blocks(), 0u);
}

chreNslNanoappInfo GoodInfo() {
  chreNslNanoappInfo info = {};
  info.magic = CHRE_NSL_NANOAPP_INFO_MAGIC;
  info.structMinorVersion = CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION;
  info.targetApiVersion = CHRE_API_VERSION_1_9;
  info.vendor = "vendor";
  info.name = "name";
  info.start = [] { return true; };
  info.handleEvent = [](uint32_t, uint16_t, const void*) {};
  info.end = [] {};
  info.appPermissions = CHRE_PERMS_AUDIO;
  return info;
}

TEST(NanoappInfo, EveryWrongFieldIsNamed) {
  const struct {
    void (*spoil)(chreNslNanoappInfo& info);
    const char* sentence;
  } cases[] = {
      {[](auto& info) { info.magic = 1; }, "magic is 0x00000001, should be 0x50e69977"},
      {[](auto& info) { info.targetApiVersion = 0x01100000; }, "API version is 0x01100000"},
      {[](auto& info) { info.targetApiVersion = 0x00090000; }, "API version is 0x00090000"},
      {[](auto& info) { info.start = nullptr; }, "start entry point is null"},
      {[](auto& info) { info.handleEvent = nullptr; }, "event entry point is null"},
      {[](auto& info) { info.end = nullptr; }, "end entry point is null"},
      {[](auto& info) { info.name = nullptr; }, "name is null"},
      {[](auto& info) { info.structMinorVersion = 2; }, "record version 2"},
      {[](auto& info) { info.appPermissions = 0; }, "permissions are 0x00000000"},
      {[](auto& info) { info.appPermissions = 3; }, "permissions are 0x00000003"},
      {[](auto& info) { info.start = [] { return false; }; }, "start entry point failed"},
  };
  for (const auto& wrong : cases) {
    Hub hub;
    chreNslNanoappInfo info = GoodInfo();
    wrong.spoil(info);
    LoadFailure failure;
    EXPECT_FALSE(hub.StartLinked(info, &failure));
    EXPECT_EQ(failure.kind, LoadFailure::Kind::kRefused);
    EXPECT_THAT(failure.sentence, HasSubstr(wrong.sentence));
  }
  chreNslNanoappInfo older = GoodInfo();
  older.targetApiVersion = 0x01080000;
  EXPECT_EQ(CheckNanoappInfo(older), "");
}

// A nanoapp that leaks a block at its end and answers every event with two events and two messages,
// one each to nobody.
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
    hub.ConnectHostEndpoint(1, [&](uint32_t type, const uint8_t*, size_t size) {
      delivered.push_back("message " + std::to_string(type) + " size " + std::to_string(size) +
                          " freed " + std::to_string(freed));
    });
    const uint32_t client = hub.AddClientNanoapp([&](uint16_t type, const void*, size_t size) {
      delivered.push_back("event " + std::to_string(type) + " size " + std::to_string(size) +
                          " freed " + std::to_string(freed));
    });
    chreNslNanoappInfo info = GoodInfo();
    info.handleEvent = SendThings;
    info.end = [] { chreHeapAlloc(1); };
    LoadFailure failure;
    ASSERT_TRUE(hub.StartLinked(info, &failure));
    hub.SendFromClientNanoapp(client, 5);
    EXPECT_EQ(freed, 4);
    EXPECT_EQ(hub.heap().live_blocks(), 0u);
    EXPECT_EQ(hub.counts().undeliverable, refuse ? 0u : 2u);
    if (refuse) {
      EXPECT_THAT(delivered, IsEmpty());
    } else {
      EXPECT_THAT(delivered, ElementsAre("event 7 size 4 freed 0", "message 9 size 8 freed 2"));
    }
    EXPECT_THAT(hub.Faults(), IsEmpty());
    hub.End();
    EXPECT_THAT(hub.Faults(), ElementsAre(HasSubstr("1 heap blocks still held")));
  }
}

TEST(Messages, DamagedFramesAreNoReports) {
  const std::vector<uint8_t> good = {4, 0, 0, 0, 0x08, 0x05, 0x20, 0x07};
  EXPECT_TRUE(DecodeFramedSoundReport(good.data(), good.size()).has_value());
  for (size_t size = 0; size < good.size(); ++size) {
    EXPECT_FALSE(DecodeFramedSoundReport(good.data(), size).has_value()) << size;
  }
  const std::vector<uint8_t> broken = {2, 0, 0, 0, 0x08, 0xFF};
  EXPECT_FALSE(DecodeFramedSoundReport(broken.data(), broken.size()).has_value());
}

}  // namespace
}  // namespace qz::hub
