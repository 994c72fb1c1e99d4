// SPDX-License-Identifier: Apache-2.0
#include <nlohmann/json.hpp>

#include "audio/audio_input.h"
#include "tools/run/report_format.h"

namespace qz::tools {
namespace {

using Json = nlohmann::ordered_json;

double Seconds(uint64_t samples) { return static_cast<double>(samples) / audio::kSampleRateHz; }

Json ReportObject(const char* type, const char* receiver_key, uint32_t receiver,
                  const hub::SoundReport& report, const Names& names) {
  Json object = {{"type", type},
                 {receiver_key, receiver},
                 {"time_s", static_cast<double>(report.timestamp_ns) / 1e9},
                 {"timestamp_ns", report.timestamp_ns},
                 {"response_time_ns", report.response_time_ns},
                 {"model_version", report.model_version},
                 {"results", Json::array()}};
  for (const hub::SoundResult& result : report.results) {
    Json entry = {{"category", result.category}, {"confidence", result.confidence}};
    if (const std::string* name = NameOf(names, result.category)) entry["name"] = *name;
    object["results"].push_back(entry);
  }
  return object;
}

// Names come from a file; what is not UTF-8 in them must not end the run.
std::string Line(const Json& object) {
  return object.dump(-1, ' ', false, Json::error_handler_t::replace);
}

// No module says these: "source" tells so.
Json ToolObject(const char* type, uint64_t time_ns) {
  return {{"type", type},
          {"source", "tool"},
          {"time_s", static_cast<double>(time_ns) / 1e9},
          {"timestamp_ns", time_ns}};
}

Json HostResult(int output, const PassScores& scores, const Names& names) {
  const auto index = static_cast<size_t>(output);
  const model::Label& label = names.value()[index];
  return {{"output", output},
          {"category", label.category},
          {"name", label.name},
          {"confidence", scores.confidences[index]},
          {"single_run", scores.single[index]}};
}

class JsonFormat final : public ReportFormat {
 public:
  explicit JsonFormat(const Names& names) : names_(names) {}

  std::string Categories(uint16_t endpoint,
                         const std::vector<uint32_t>& categories) const override {
    return Json{{"type", "categories"}, {"endpoint", endpoint}, {"categories", categories}}.dump();
  }

  std::string Report(uint32_t client, const hub::SoundReport& report) const override {
    return Line(ReportObject("report", "nanoapp", client, report, names_));
  }

  std::string Detection(uint16_t endpoint, const hub::SoundReport& event) const override {
    return Line(ReportObject("detection", "endpoint", endpoint, event, names_));
  }

  std::string Scores(uint64_t time_ns, const PassScores& scores) const override {
    Json object = ToolObject("scores", time_ns);
    object["runs"] = scores.runs;
    for (int i = 0; i < model::kClasses; ++i) {
      object["results"].push_back(HostResult(i, scores, names_));
    }
    return Line(object);
  }

  std::string HostDetection(uint64_t time_ns, const PassScores& scores,
                            const std::vector<int>& outputs) const override {
    Json object = ToolObject("tool_detection", time_ns);
    for (const int output : outputs) {
      object["results"].push_back(HostResult(output, scores, names_));
    }
    return Line(object);
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

 private:
  Names names_;
};

}  // namespace

std::unique_ptr<ReportFormat> MakeJsonFormat(const Names& names) {
  return std::make_unique<JsonFormat>(names);
}

}  // namespace qz::tools
