// The application on a hub, linked into the suite: with a network whose scores are chosen and
// detection tables with which things are detected, and with the hub's own audio functions.
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "chre_nanoapp_info.h"
#include "messages.h"
#include "nanoapp.h"
#include "stub_network.h"
#include "test_hub.h"

namespace qz::test {

inline const chreNslNanoappInfo kLinkedInfo = {CHRE_NSL_NANOAPP_INFO_MAGIC,
                                               CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION,
                                               0,
                                               0,
                                               0,
                                               0,
                                               CHRE_API_VERSION_1_9,
                                               "vendor",
                                               "linked",
                                               0,
                                               0,
                                               nanoappStart,
                                               nanoappHandleEvent,
                                               nanoappEnd,
                                               "",
                                               CHRE_PERMS_AUDIO};

class LinkedNanoapp : public testing::Test {
 protected:
  LinkedNanoapp() {
    stub_network = {};
    runtime.hub.sources().emplace_back();
  }
  // The nanoapp ends before what it reports to goes.
  ~LinkedNanoapp() override { hub().End(); }

  void Start() {
    hub::LoadFailure failure;
    ASSERT_TRUE(hub().StartLinked(kLinkedInfo, &failure)) << failure.sentence;
    runtime.TakeLog();
  }

  hub::Hub& hub() { return runtime.hub; }
  std::vector<std::string> TakeLog() { return runtime.TakeLog(); }
  bool audio() { return hub().audio_enabled(); }

  // Everything that host endpoints receive, in order.
  void Connect(uint16_t endpoint) {
    hub().ConnectHostEndpoint(endpoint, [=](uint32_t type, const uint8_t* bytes, size_t size) {
      messages.push_back({endpoint, type, {bytes, bytes + size}});
    });
  }
  void Send(uint16_t endpoint, uint32_t type, const std::vector<uint8_t>& payload) {
    hub().SendFromHost(endpoint, type, payload);
  }
  void Enable(uint16_t endpoint, uint32_t client_id) {
    Send(endpoint, hub::kEnableRequest, hub::EncodeEnableRequest(client_id));
  }
  void Disable(uint16_t endpoint, uint32_t client_id) {
    Send(endpoint, hub::kDisableRequest, hub::EncodeDisableRequest(client_id));
  }

  // Everything that client nanoapps receive, in order.
  uint32_t AddClientNanoapp() {
    const auto id = std::make_shared<uint32_t>();
    *id = hub().AddClientNanoapp([=](uint16_t type, const void* data, size_t size) {
      const auto* bytes = static_cast<const uint8_t*>(data);
      events.push_back({*id, type, {bytes, bytes + size}});
    });
    return *id;
  }
  uint32_t RegisterClientNanoapp() {
    const uint32_t id = AddClientNanoapp();
    hub().SendFromClientNanoapp(id, hub::kRegisterEvent);
    return id;
  }

  // A buffer of two seconds of silence.
  void PlayBuffer() {
    static const std::vector<int16_t> silence(32000);
    hub().PlayAudio(silence.data(), 32000);
  }

  struct Received {
    uint32_t receiver;
    uint32_t type;
    std::vector<uint8_t> bytes;
  };

  TestHub runtime{/*host_time_offset_ns=*/500};
  std::vector<Received> messages;
  std::vector<Received> events;
};

}  // namespace qz::test
