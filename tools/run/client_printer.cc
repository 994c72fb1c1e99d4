// SPDX-License-Identifier: Apache-2.0
#include "tools/run/client_printer.h"

#include <utility>

namespace qz::tools {
namespace {

std::string FaultMessage(const std::string& what, uint32_t type, const std::string& receiver,
                         uint32_t id, size_t size) {
  return what + " " + std::to_string(type) + " to " + receiver + " " + std::to_string(id) +
         ": its " + std::to_string(size) + " bytes can't be decoded";
}

}  // namespace

void ClientPrinter::OnHostMessage(uint16_t endpoint, uint32_t type, const uint8_t* bytes,
                                  size_t size) {
  bool decoded = true;
  switch (type) {
    case hub::kQueryResponse:
      if (const auto categories = hub::DecodeQueryResponse(bytes, size)) {
        categories_ = *categories;
        console_.Data(format_.Categories(endpoint, *categories));
      } else {
        decoded = false;
      }
      break;
    case hub::kSoundEventDetection:
      if (const auto event = hub::DecodeSoundReport(bytes, size)) {
        ++detections_;
        console_.Data(format_.Detection(endpoint, *event));
      } else {
        decoded = false;
      }
      break;
    case hub::kEnableResponse:
    case hub::kDisableResponse:
      decoded = size == 0;
      break;
    default:
      decoded = false;
  }
  if (!decoded) {
    faults_.push_back(FaultMessage("message of type", type, "endpoint", endpoint, size));
  }
}

void ClientPrinter::OnEvent(uint32_t nanoapp, uint16_t type, const void* data, size_t size) {
  const auto report = type == hub::kReportEvent ? hub::DecodeFramedSoundReport(data, size)
                                                : std::optional<hub::SoundReport>();
  if (!report) {
    faults_.push_back(FaultMessage("event", type, "nanoapp", nanoapp, size));
    return;
  }
  ++reports_;
  console_.Data(format_.Report(nanoapp, *report));
  newest_report_ = report;
}

std::optional<hub::SoundReport> ClientPrinter::TakeReport() {
  return std::exchange(newest_report_, std::nullopt);
}

}  // namespace qz::tools
