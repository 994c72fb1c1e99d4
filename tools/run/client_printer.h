// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "hub/clients.h"
#include "hub/messages.h"
#include "tools/console.h"
#include "tools/run/report_format.h"

namespace qz::tools {

// Decodes and prints what clients receive.
class ClientPrinter final : public hub::ClientListener {
 public:
  ClientPrinter(const ReportFormat* format, Console* console)
      : format_(*format), console_(*console) {}

  void OnHostMessage(uint16_t endpoint, uint32_t type, const uint8_t* bytes, size_t size) override;
  void OnEvent(uint32_t nanoapp, uint16_t type, const void* data, size_t size) override;

  // The newest report since the last call, if any.
  std::optional<hub::SoundReport> TakeReport();

  // As the nanoapp told them last, by output; empty if nobody asked.
  const std::vector<uint32_t>& categories() const { return categories_; }

  uint64_t reports() const { return reports_; }
  uint64_t detections() const { return detections_; }
  // One sentence for each message or event that could not be decoded.
  const std::vector<std::string>& faults() const { return faults_; }

 private:
  const ReportFormat& format_;
  Console& console_;
  uint64_t reports_ = 0;
  uint64_t detections_ = 0;
  std::vector<std::string> faults_;
  std::optional<hub::SoundReport> newest_report_;
  std::vector<uint32_t> categories_;
};

}  // namespace qz::tools
