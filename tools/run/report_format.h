// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "hub/messages.h"
#include "model/labels.h"
#include "tools/run/score_stream.h"

namespace qz::tools {

// What a run comes to.
struct RunSummary {
  uint64_t audio_samples = 0;  // at 16 kHz, as delivered: the silence appended included
  uint64_t silent_samples = 0;
  uint64_t passes = 0;
  uint64_t feature_frames = 0;  // 25 ms frames that the audio delivered so far fills
  uint64_t reports = 0;
  uint64_t detections = 0;
  uint64_t host_clients_accepted = 0;
  uint64_t host_clients = 0;
  uint64_t client_nanoapps = 0;
  uint64_t messages_from_host = 0;
  uint64_t messages_to_host = 0;
  uint64_t events_to_clients = 0;
  uint64_t heap_blocks_held = 0;
  uint64_t faults = 0;
  double speed = 0;  // as a multiple of real time; 0 when not measured
};

// How the data of a run looks on stdout: one line (the summary: a few) without a newline at its
// end.
class ReportFormat {
 public:
  virtual ~ReportFormat() = default;
  virtual std::string Categories(uint16_t endpoint,
                                 const std::vector<uint32_t>& categories) const = 0;
  virtual std::string Report(uint32_t client, const hub::SoundReport& report) const = 0;
  virtual std::string Detection(uint16_t endpoint, const hub::SoundReport& event) const = 0;
  // What the tool itself made of the pass that ended at `time_ns`, in the hub's clock.
  virtual std::string Scores(uint64_t time_ns, const PassScores& scores) const = 0;
  // Of that pass, the outputs that the tool's own table detects; at least one.
  virtual std::string HostDetection(uint64_t time_ns, const PassScores& scores,
                                    const std::vector<int>& outputs) const = 0;
  virtual std::string Summary(const RunSummary& summary) const = 0;
};

// Names for categories. Without them reports show codes alone, and there are no scores to show.
using Names = std::optional<model::Labels>;
// The name of a category; null if it has none.
const std::string* NameOf(const Names& names, uint32_t category);

struct TextStyle {
  bool bars = false;    // a small bar beside each confidence, and scores one below the other
  bool colour = false;  // scores in colours of a terminal
};

// For people.
std::unique_ptr<ReportFormat> MakeTextFormat(TextStyle style, const Names& names);
// For programs: one JSON object a line, its kind under "type".
std::unique_ptr<ReportFormat> MakeJsonFormat(const Names& names);

// A format for programs, and the option of qz run that asks for it.
struct NamedFormat {
  const char* option;
  const char* help;
  std::unique_ptr<ReportFormat> (*make)(const Names& names);
};
inline constexpr NamedFormat kNamedFormats[] = {
    {"--json", "One JSON object a line on standard output", MakeJsonFormat},
};

}  // namespace qz::tools
