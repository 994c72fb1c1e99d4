#include "clients.h"

#include "messages.h"

namespace qz::tools {
namespace {

constexpr uint16_t kFirstEndpoint = 0x0010;

std::string FaultSentence(const std::string& what, uint32_t type, const std::string& receiver,
                          uint32_t id, size_t size) {
  return what + " " + std::to_string(type) + " to " + receiver + " " + std::to_string(id) +
         ": its " + std::to_string(size) + " bytes can't be decoded";
}

}  // namespace

void Clients::Connect(uint32_t hosts, uint32_t nanoapps) {
  for (uint32_t i = 0; i < nanoapps; ++i) {
    nanoapps_.push_back(0);
    uint32_t& id = nanoapps_.back();
    id = hub_.AddClientNanoapp([this, i](uint16_t type, const void* data, size_t size) {
      OnEvent(nanoapps_[i], type, data, size);
    });
    hub_.SendFromClientNanoapp(id, hub::kRegisterEvent);
  }
  for (uint32_t i = 0; i < hosts; ++i) {
    hosts_.push_back({static_cast<uint16_t>(kFirstEndpoint + i)});
    ConnectHost(i);
  }
}

void Clients::ConnectHost(size_t index) {
  const uint16_t endpoint = hosts_[index].endpoint;
  hub_.ConnectHostEndpoint(endpoint,
                           [this, index](uint32_t type, const uint8_t* bytes, size_t size) {
                             OnHostMessage(index, type, bytes, size);
                           });
  hub_.SendFromHost(endpoint, hub::kQueryRequest, {});
  hub_.SendFromHost(endpoint, hub::kEnableRequest,
                    hub::EncodeEnableRequest(static_cast<uint32_t>(index)));
}

void Clients::Leave() {
  for (size_t i = 0; i < hosts_.size(); ++i) {
    if (hosts_[i].accepted) {
      hub_.SendFromHost(hosts_[i].endpoint, hub::kDisableRequest,
                        hub::EncodeDisableRequest(static_cast<uint32_t>(i)));
    }
  }
  for (const uint32_t nanoapp : nanoapps_) {
    hub_.SendFromClientNanoapp(nanoapp, hub::kUnregisterEvent);
  }
}

void Clients::OnHostMessage(size_t index, uint32_t type, const uint8_t* bytes, size_t size) {
  Host& host = hosts_[index];
  bool decoded = true;
  switch (type) {
    case hub::kQueryResponse:
      if (const auto categories = hub::DecodeQueryResponse(bytes, size)) {
        console_.Data(format_.Categories(host.endpoint, *categories));
      } else {
        decoded = false;
      }
      break;
    case hub::kSoundEventDetection:
      if (const auto event = hub::DecodeSoundReport(bytes, size)) {
        ++detections_;
        console_.Data(format_.Detection(host.endpoint, *event));
      } else {
        decoded = false;
      }
      break;
    case hub::kEnableResponse:
      decoded = size == 0;
      host.accepted = true;
      ++accepted_hosts_;
      break;
    case hub::kDisableResponse:
      decoded = size == 0;
      break;
    default:
      decoded = false;
  }
  if (!decoded) {
    faults_.push_back(FaultSentence("message of type", type, "endpoint", host.endpoint, size));
  }
}

void Clients::OnEvent(uint32_t nanoapp, uint16_t type, const void* data, size_t size) {
  const auto report = type == hub::kReportEvent ? hub::DecodeFramedSoundReport(data, size)
                                                : std::optional<hub::SoundReport>();
  if (!report) {
    faults_.push_back(FaultSentence("event", type, "nanoapp", nanoapp, size));
    return;
  }
  ++reports_;
  console_.Data(format_.Report(nanoapp, *report));
}

}  // namespace qz::tools
