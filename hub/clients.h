// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <vector>

#include "hub/hub.h"

namespace qz::hub {

// Receives what clients receive; bytes are valid during the call.
class ClientListener {
 public:
  virtual ~ClientListener() = default;
  virtual void OnHostMessage(uint16_t endpoint, uint32_t type, const uint8_t* bytes,
                             size_t size) = 0;
  virtual void OnEvent(uint32_t nanoapp, uint16_t type, const void* data, size_t size) = 0;
};

// The clients of a run: host endpoints from 0x0010 upwards with client IDs from 0, and client
// nanoapps. Must outlive the nanoapp's run on the hub. Neither pointer may be null.
class Clients {
 public:
  Clients(Hub* hub, ClientListener* listener) : hub_(*hub), listener_(*listener) {}
  Clients(const Clients&) = delete;
  Clients& operator=(const Clients&) = delete;

  // Each nanoapp registers; each host asks for the categories, then enables detection. Once, with
  // at most 0xFFEF hosts.
  void Connect(uint32_t hosts, uint32_t nanoapps);
  // Accepted hosts disable detection, nanoapps unregister.
  void Leave();

  uint64_t accepted_hosts() const { return accepted_hosts_; }

 private:
  struct Host {
    uint16_t endpoint;
    bool accepted = false;
  };

  void ConnectHost(size_t index);

  Hub& hub_;
  ClientListener& listener_;
  std::vector<Host> hosts_;  // the index is the client ID
  std::vector<uint32_t> nanoapps_;
  uint64_t accepted_hosts_ = 0;
};

}  // namespace qz::hub
