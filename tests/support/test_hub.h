// A hub that a suite looks into: its log, and the faults that must not be there at the end.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "hub.h"

namespace qz::test {

// Lines stand in `log` as "E text", "W text" or "I text", without the nanoapp's prefix.
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
  TestHub(const TestHub&) = delete;
  TestHub& operator=(const TestHub&) = delete;

  // The lines since the last call, less the one that announces each message of the host.
  std::vector<std::string> TakeLog() {
    std::vector<std::string> lines;
    for (const std::string& line : std::exchange(log, {})) {
      if (line.rfind("I Got message from host", 0) != 0) lines.push_back(line);
    }
    return lines;
  }

  hub::Hub hub;
  std::vector<std::string> log;
};

}  // namespace qz::test
