#include <nlohmann/json.hpp>

#include "audio_input.h"
#include "report_format.h"

namespace qz::tools {
namespace {

using Json = nlohmann::ordered_json;

double Seconds(uint64_t samples) { return static_cast<double>(samples) / kSampleRateHz; }

Json ReportObject(const char* type, const char* receiver_key, uint32_t receiver,
                  const hub::SoundReport& report) {
  Json object = {{"type", type},
                 {receiver_key, receiver},
                 {"time_s", static_cast<double>(report.timestamp_ns) / 1e9},
                 {"timestamp_ns", report.timestamp_ns},
                 {"response_time_ns", report.response_time_ns},
                 {"model_version", report.model_version},
                 {"results", Json::array()}};
  for (const hub::SoundResult& result : report.results) {
    object["results"].push_back({{"category", result.category}, {"confidence", result.confidence}});
  }
  return object;
}

class JsonFormat final : public ReportFormat {
 public:
  std::string Categories(uint16_t endpoint,
                         const std::vector<uint32_t>& categories) const override {
    return Json{{"type", "categories"}, {"endpoint", endpoint}, {"categories", categories}}.dump();
  }

  std::string Report(uint32_t client, const hub::SoundReport& report) const override {
    return ReportObject("report", "nanoapp", client, report).dump();
  }

  std::string Detection(uint16_t endpoint, const hub::SoundReport& event) const override {
    return ReportObject("detection", "endpoint", endpoint, event).dump();
  }

  std::string Summary(const RunSummary& s) const override {
    Json object = {{"type", "summary"},
                   {"audio_s", Seconds(s.audio_samples)},
                   {"silence_appended_s", Seconds(s.silent_samples)},
                   {"passes", s.passes},
                   {"feature_frames", s.feature_frames},
                   {"reports", s.reports},
                   {"detections", s.detections},
                   {"host_clients_accepted", s.host_clients_accepted},
                   {"host_clients", s.host_clients},
                   {"client_nanoapps", s.client_nanoapps},
                   {"messages_from_host", s.messages_from_host},
                   {"messages_to_host", s.messages_to_host},
                   {"events_to_clients", s.events_to_clients},
                   {"heap_blocks_held", s.heap_blocks_held},
                   {"faults", s.faults},
                   {"speed", nullptr}};
    if (s.speed > 0) object["speed"] = s.speed;
    return object.dump();
  }
};

}  // namespace

std::unique_ptr<ReportFormat> MakeJsonFormat() { return std::make_unique<JsonFormat>(); }

}  // namespace qz::tools
