#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "console.h"
#include "hub.h"
#include "report_format.h"

namespace qz::tools {

// The clients of a run: host endpoints from 0x0010 upwards with client IDs from 0, and client
// nanoapps. They print what they receive. Must outlive the nanoapp's run on the hub.
class Clients {
 public:
  Clients(hub::Hub* hub, const ReportFormat* format, Console* console)
      : hub_(*hub), format_(*format), console_(*console) {}
  Clients(const Clients&) = delete;
  Clients& operator=(const Clients&) = delete;

  // Each nanoapp registers; each host asks for the categories, then enables detection.
  void Connect(uint32_t hosts, uint32_t nanoapps);
  // Whoever is served takes its leave.
  void Leave();

  uint64_t reports() const { return reports_; }
  uint64_t detections() const { return detections_; }
  uint64_t accepted_hosts() const { return accepted_hosts_; }
  // One sentence for each message or event that could not be decoded.
  const std::vector<std::string>& faults() const { return faults_; }

 private:
  struct Host {
    uint16_t endpoint;
    bool accepted = false;
  };

  void ConnectHost(size_t index);
  void OnHostMessage(size_t index, uint32_t type, const uint8_t* bytes, size_t size);
  void OnEvent(uint32_t nanoapp, uint16_t type, const void* data, size_t size);

  hub::Hub& hub_;
  const ReportFormat& format_;
  Console& console_;
  std::vector<Host> hosts_;  // the index is the client ID
  std::vector<uint32_t> nanoapps_;
  uint64_t reports_ = 0;
  uint64_t detections_ = 0;
  uint64_t accepted_hosts_ = 0;
  std::vector<std::string> faults_;
};

}  // namespace qz::tools
