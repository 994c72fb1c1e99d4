#include <algorithm>
#include <cmath>
#include <cstdarg>
#include <cstdio>

#include "audio_input.h"
#include "report_format.h"

namespace qz::tools {
namespace {

constexpr int kBarCells = 16;

[[gnu::format(printf, 1, 2)]] std::string Format(const char* format, ...) {
  char text[512];
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(text, sizeof(text), format, arguments);
  va_end(arguments);
  return text;
}

double Seconds(uint64_t samples) { return static_cast<double>(samples) / kSampleRateHz; }

std::string Bar(float confidence) {
  int filled = 0;
  if (confidence > 0) {
    filled = static_cast<int>(std::lround(std::min(confidence, 1.0f) * kBarCells));
  }
  return " [" + std::string(static_cast<size_t>(filled), '#') +
         std::string(static_cast<size_t>(kBarCells - filled), '.') + "]";
}

class TextFormat final : public ReportFormat {
 public:
  explicit TextFormat(bool bars) : bars_(bars) {}

  std::string Categories(uint16_t endpoint,
                         const std::vector<uint32_t>& categories) const override {
    std::string list;
    for (const uint32_t category : categories) {
      list += (list.empty() ? "" : ", ") + std::to_string(category);
    }
    return Format("endpoint 0x%04x: supported categories %s", endpoint, list.c_str());
  }

  std::string Report(uint32_t client, const hub::SoundReport& report) const override {
    return Line(Format("report to nanoapp %u", client), report);
  }

  std::string Detection(uint16_t endpoint, const hub::SoundReport& event) const override {
    return Line(Format("DETECTION to endpoint 0x%04x", endpoint), event);
  }

  std::string Summary(const RunSummary& s) const override {
    using ull = unsigned long long;
    std::string text = Format("summary: %.2f s of audio", Seconds(s.audio_samples));
    if (s.silent_samples > 0) text += Format(" (%.2f s of it silence)", Seconds(s.silent_samples));
    text += Format(", %llu passes, %llu reports, %llu detection events\n", ull{s.passes},
                   ull{s.reports}, ull{s.detections});
    text += Format("  clients: %llu of %llu host clients accepted, %llu client nanoapps\n",
                   ull{s.host_clients_accepted}, ull{s.host_clients}, ull{s.client_nanoapps});
    text += Format("  messages: %llu from the host, %llu to the host; %llu events to nanoapps\n",
                   ull{s.messages_from_host}, ull{s.messages_to_host}, ull{s.events_to_clients});
    text += Format("  heap blocks still held: %llu", ull{s.heap_blocks_held});
    if (s.speed > 0) text += Format("\n  speed: %.0f times real time", s.speed);
    return text;
  }

 private:
  std::string Line(const std::string& what, const hub::SoundReport& report) const {
    std::string text =
        Format("[%8.3f s] %s:", static_cast<double>(report.timestamp_ns) * 1e-9, what.c_str());
    const char* separator = " ";
    for (const hub::SoundResult& result : report.results) {
      text += Format("%scategory %u %.4f", separator, result.category, result.confidence);
      if (bars_) text += Bar(result.confidence);
      separator = ", ";
    }
    return text + Format(", model %u", report.model_version);
  }

  bool bars_;
};

}  // namespace

std::unique_ptr<ReportFormat> MakeTextFormat(bool bars) {
  return std::make_unique<TextFormat>(bars);
}

}  // namespace qz::tools
