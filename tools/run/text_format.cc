// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstdarg>
#include <cstdio>

#include "audio/audio_input.h"
#include "tools/run/report_format.h"

namespace qz::tools {
namespace {

constexpr int kBarCells = 16;

// A score above this is shown as heard, one above half of it as a doubt.
constexpr float kDetected = 0.5f;

constexpr char kToolsView[] = "tool's view: ";

[[gnu::format(printf, 1, 2)]] std::string Format(const char* format, ...) {
  va_list arguments, again;
  va_start(arguments, format);
  va_copy(again, arguments);
  std::string text(static_cast<size_t>(std::vsnprintf(nullptr, 0, format, arguments)), '\0');
  std::vsnprintf(text.data(), text.size() + 1, format, again);
  va_end(again);
  va_end(arguments);
  return text;
}

double Seconds(uint64_t samples) { return static_cast<double>(samples) / audio::kSampleRateHz; }

std::string Bar(float confidence) {
  int filled = 0;
  if (confidence > 0) {
    filled = static_cast<int>(std::lround(std::min(confidence, 1.0f) * kBarCells));
  }
  return " [" + std::string(static_cast<size_t>(filled), '#') +
         std::string(static_cast<size_t>(kBarCells - filled), '.') + "]";
}

std::string Time(uint64_t time_ns) {
  return Format("[%8.3f s] ", static_cast<double>(time_ns) * 1e-9);
}

// The parameters of a terminal's colour: bold where a score stands out.
std::string Colour(float score, bool leads) {
  const bool stands_out = leads || score > kDetected;
  const char* const shade = score > kDetected ? "32" : score > kDetected / 2 ? "33" : "90";
  return Format("\x1b[%s%sm", stands_out ? "1;" : "", shade);
}

class TextFormat final : public ReportFormat {
 public:
  TextFormat(TextStyle style, const Names& names) : style_(style), names_(names) {}

  std::string Categories(uint16_t endpoint,
                         const std::vector<uint32_t>& categories) const override {
    std::string list;
    for (const uint32_t category : categories) {
      list += (list.empty() ? "" : ", ") + Category(category);
    }
    return Format("endpoint 0x%04x: supported categories %s", endpoint, list.c_str());
  }

  std::string Report(uint32_t client, const hub::SoundReport& report) const override {
    return Line(Format("report to nanoapp %u", client), report);
  }

  std::string Detection(uint16_t endpoint, const hub::SoundReport& event) const override {
    return Line(Format("DETECTION to endpoint 0x%04x", endpoint), event);
  }

  std::string Scores(uint64_t time_ns, const PassScores& scores) const override {
    if (scores.runs == 0) return Time(time_ns) + kToolsView + "no network run yet";
    return Time(time_ns) + kToolsView + (style_.bars ? ScoreRows(scores) : ScoreList(scores));
  }

  std::string HostDetection(uint64_t time_ns, const PassScores& scores,
                            const std::vector<int>& outputs) const override {
    std::string text = Time(time_ns) + kToolsView + "would detect";
    const char* separator = " ";
    for (const int output : outputs) {
      const auto index = static_cast<size_t>(output);
      text += separator +
              Format("%s %.4f", names_.value()[index].name.c_str(), scores.confidences[index]);
      separator = ", ";
    }
    return text + "; no event of the module";
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
    std::string text = Time(report.timestamp_ns) + what + ":";
    const char* separator = " ";
    for (const hub::SoundResult& result : report.results) {
      text += Format("%scategory %s %.4f", separator, Category(result.category).c_str(),
                     result.confidence);
      if (style_.bars) text += Bar(result.confidence);
      separator = ", ";
    }
    return text + Format(", model %u", report.model_version);
  }

  std::string Category(uint32_t category) const {
    const std::string* name = NameOf(names_, category);
    return std::to_string(category) + (name == nullptr ? "" : " (" + *name + ")");
  }

  // One line.
  std::string ScoreList(const PassScores& scores) const {
    std::string text;
    for (size_t i = 0; i < scores.confidences.size(); ++i) {
      text += (i == 0 ? "" : ", ") + names_.value()[i].name +
              Format(" %.4f", scores.confidences[i]) + SingleRun(scores, i);
    }
    return text;
  }

  // A line for each output, the first one to follow on time and mark.
  std::string ScoreRows(const PassScores& scores) const {
    size_t width = 0;
    for (const model::Label& label : names_.value()) width = std::max(width, label.name.size());
    const size_t leader =
        static_cast<size_t>(std::max_element(scores.confidences.begin(), scores.confidences.end()) -
                            scores.confidences.begin());
    const std::string margin((Time(0) + kToolsView).size(), ' ');
    std::string text;
    for (size_t i = 0; i < scores.confidences.size(); ++i) {
      const float score = scores.confidences[i];
      std::string row = names_.value()[i].name;
      row.resize(width, ' ');
      row += Bar(score) + Format(" %.4f", score) + SingleRun(scores, i);
      if (style_.colour) {
        row.insert(0, Colour(score, i == leader && score > 0));
        row += "\x1b[0m";
      }
      if (i > 0) text.append("\n").append(margin);
      text += row;
    }
    return text;
  }

  // Where an output is smoothed, what the highest of the pass's runs was.
  static std::string SingleRun(const PassScores& scores, size_t output) {
    if (scores.single[output] == scores.confidences[output]) return {};
    return Format(" (one run %.4f)", scores.single[output]);
  }

  TextStyle style_;
  Names names_;
};

}  // namespace

const std::string* NameOf(const Names& names, uint32_t category) {
  if (!names) return nullptr;
  for (const model::Label& label : *names) {
    if (static_cast<uint32_t>(label.category) == category) return &label.name;
  }
  return nullptr;
}

std::unique_ptr<ReportFormat> MakeTextFormat(TextStyle style, const Names& names) {
  return std::make_unique<TextFormat>(style, names);
}

}  // namespace qz::tools
