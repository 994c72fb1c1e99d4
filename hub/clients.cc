// SPDX-License-Identifier: Apache-2.0
#include "hub/clients.h"

#include "hub/messages.h"
#include "hub/precondition.h"

namespace qz::hub {
namespace {

constexpr uint16_t kFirstEndpoint = 0x0010;
constexpr uint16_t kInvalidEndpoint = 0xFFFF;

}  // namespace

void Clients::Connect(uint32_t hosts, uint32_t nanoapps) {
  QZ_HUB_REQUIRE(hosts_.empty() && nanoapps_.empty());
  QZ_HUB_REQUIRE(hosts <= uint32_t{kInvalidEndpoint - kFirstEndpoint});
  for (uint32_t i = 0; i < nanoapps; ++i) {
    nanoapps_.push_back(0);
    uint32_t& id = nanoapps_.back();
    id = hub_.AddClientNanoapp([this, i](uint16_t type, const void* data, size_t size) {
      listener_.OnEvent(nanoapps_[i], type, data, size);
    });
    hub_.SendFromClientNanoapp(id, kRegisterEvent);
  }
  for (uint32_t i = 0; i < hosts; ++i) {
    hosts_.push_back({static_cast<uint16_t>(kFirstEndpoint + i)});
    ConnectHost(i);
  }
}

void Clients::ConnectHost(size_t index) {
  const uint16_t endpoint = hosts_[index].endpoint;
  hub_.ConnectHostEndpoint(endpoint, [=](uint32_t type, const uint8_t* bytes, size_t size) {
    if (type == kEnableResponse) {
      hosts_[index].accepted = true;
      ++accepted_hosts_;
    }
    listener_.OnHostMessage(endpoint, type, bytes, size);
  });
  hub_.SendFromHost(endpoint, kQueryRequest, {});
  hub_.SendFromHost(endpoint, kEnableRequest, EncodeEnableRequest(static_cast<uint32_t>(index)));
}

void Clients::Leave() {
  for (size_t i = 0; i < hosts_.size(); ++i) {
    if (hosts_[i].accepted) {
      hub_.SendFromHost(hosts_[i].endpoint, kDisableRequest,
                        EncodeDisableRequest(static_cast<uint32_t>(i)));
    }
  }
  for (const uint32_t nanoapp : nanoapps_) hub_.SendFromClientNanoapp(nanoapp, kUnregisterEvent);
}

}  // namespace qz::hub
