// SPDX-License-Identifier: Apache-2.0
// A hub with a record of its log and of what its clients receive; faults found at its end fail the
// test.
#pragma once

#include <gmock/gmock.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "hub/hub.h"
#include "hub/messages.h"

namespace qz::test {

struct Received {
  uint32_t receiver;
  uint32_t type;
  std::vector<uint8_t> bytes;
};

// Lines are in `log` as "E text", "W text" or "I text", without the nanoapp's prefix.
class TestHub {
 public:
  explicit TestHub(int64_t host_time_offset_ns = 0) : hub(host_time_offset_ns) {
    hub.SetLogHandler([this](chreLogLevel level, uint64_t, const std::string& line) {
      const std::string prefix = "[SOUND_DETECTION] ";
      EXPECT_EQ(line.rfind(prefix, 0), 0u) << line;
      log.push_back(std::string(1, "EWID"[level]) + " " + line.substr(prefix.size()));
    });
  }
  ~TestHub() {
    hub.End();
    for (const std::string& fault : hub.Faults()) ADD_FAILURE() << fault;
  }

  // The lines since the last call, less the one that announces each message of the host.
  std::vector<std::string> TakeLog() {
    std::vector<std::string> lines;
    for (const std::string& line : std::exchange(log, {})) {
      if (line.rfind("I Got message from host", 0) != 0) lines.push_back(line);
    }
    return lines;
  }

  // "type@endpoint" of what host endpoints received since the last call.
  std::vector<std::string> TakeMessages() {
    std::vector<std::string> list;
    for (const Received& message : std::exchange(messages, {})) {
      list.push_back(std::to_string(message.type) + "@" + std::to_string(message.receiver));
    }
    return list;
  }

  // Host clients. Every message is a heap block of its own size, but the answer to a query.
  void Connect(uint16_t endpoint) {
    hub.ConnectHostEndpoint(endpoint, [=](uint32_t type, const uint8_t* bytes, size_t size) {
      EXPECT_EQ(hub.heap().SizeOf(bytes), type == hub::kQueryResponse ? 1024 : size) << type;
      messages.push_back({endpoint, type, {bytes, bytes + size}});
    });
  }
  void Query(uint16_t endpoint, const std::vector<uint8_t>& payload = {}) {
    hub.SendFromHost(endpoint, hub::kQueryRequest, payload);
  }
  void Enable(uint16_t endpoint, uint32_t client_id) {
    hub.SendFromHost(endpoint, hub::kEnableRequest, hub::EncodeEnableRequest(client_id));
  }
  void Disable(uint16_t endpoint, uint32_t client_id) {
    hub.SendFromHost(endpoint, hub::kDisableRequest, hub::EncodeDisableRequest(client_id));
  }

  // Client nanoapps.
  uint32_t RegisterClientNanoapp() {
    const auto id = std::make_shared<uint32_t>();
    *id = hub.AddClientNanoapp([=](uint16_t type, const void* data, size_t size) {
      const auto* bytes = static_cast<const uint8_t*>(data);
      events.push_back({*id, type, {bytes, bytes + size}});
    });
    Register(*id);
    return *id;
  }
  void Register(uint32_t client) { hub.SendFromClientNanoapp(client, hub::kRegisterEvent); }
  void Unregister(uint32_t client) { hub.SendFromClientNanoapp(client, hub::kUnregisterEvent); }

  // What host endpoints and client nanoapps received, in order. Declared before the hub, which may
  // deliver until it is destroyed.
  std::vector<Received> messages;
  std::vector<Received> events;
  std::vector<std::string> log;
  hub::Hub hub;
};

}  // namespace qz::test
