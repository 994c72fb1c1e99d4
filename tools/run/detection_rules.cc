#include "tools/run/detection_rules.h"

#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstring>
#include <fstream>

#include "base/error.h"

namespace qz::tools {
namespace {

constexpr char kHeader[] = "class\tthreshold\tcooling_s";
constexpr double kMaxCoolingS = 1e6;

// Of `text` as a whole; false if it is no number of [0, highest].
template <typename T>
bool ParseNumber(const std::string& text, T max, T* number) {
  const char* const end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, *number);
  return error == std::errc() && stop == end && *number >= 0 && *number <= max;
}

std::string ClassNames(const model::Labels& labels) {
  std::string names;
  for (const model::Label& label : labels) names += (names.empty() ? "" : ", ") + label.class_name;
  return names;
}

// The line's rule goes to its class's place, where none has been.
void ParseLine(const std::string& line, const model::Labels& labels, const std::string& location,
               DetectionRules* rules, std::array<bool, model::kClasses>* given) {
  const size_t tab = line.find('\t');
  const size_t second = tab == std::string::npos ? tab : line.find('\t', tab + 1);
  if (second == std::string::npos) {
    throw base::InputError(location + "should be: class, threshold, cooling_s, with tabs between");
  }
  const std::string name = line.substr(0, tab);
  const int output = model::OutputOf(labels, name);
  if (output < 0) {
    throw base::InputError(location + "the class is '" + name + "', should be one of " +
                           ClassNames(labels));
  }
  const auto index = static_cast<size_t>(output);
  if ((*given)[index]) {
    throw base::InputError(location + "the class '" + name + "' has a line already");
  }
  (*given)[index] = true;
  DetectionRule& rule = (*rules)[index];
  const std::string threshold = line.substr(tab + 1, second - tab - 1);
  if (!ParseNumber(threshold, 1.0f, &rule.threshold)) {
    throw base::InputError(location + "the threshold is '" + threshold + "', should be 0 to 1");
  }
  const std::string cooling = line.substr(second + 1);
  double cooling_s = 0;
  if (!ParseNumber(cooling, kMaxCoolingS, &cooling_s)) {
    throw base::InputError(location + "the cooling time is '" + cooling +
                           "', should be 0 to 1000000 seconds");
  }
  rule.cooling_ns = static_cast<uint64_t>(std::llround(cooling_s * 1e9));
}

}  // namespace

DetectionRules ReadDetectionRules(const std::string& path, const model::Labels& labels) {
  std::ifstream file(path);
  if (!file) throw base::InputError(path + ": can't be opened: " + std::strerror(errno));
  DetectionRules rules;
  std::array<bool, model::kClasses> given{};
  bool headed = false;
  std::string line;
  for (int number = 1; std::getline(file, line); ++number) {
    if (!line.empty() && line.back() == '\r') line.pop_back();
    if (line.empty() || line[0] == '#') continue;
    const std::string location = path + ": line " + std::to_string(number) + ": ";
    if (headed) {
      ParseLine(line, labels, location, &rules, &given);
    } else if (line != kHeader) {
      throw base::InputError(
          location + "the first line should be: class, threshold, cooling_s, with tabs between");
    }
    headed = true;
  }
  if (file.bad()) throw base::InputError(path + ": can't be read: " + std::strerror(errno));
  for (size_t i = 0; i < given.size(); ++i) {
    if (given[i]) continue;
    throw base::InputError(path + ": no line for the class '" + labels[i].class_name + "'");
  }
  return rules;
}

std::vector<int> ToolDetector::Detect(const Scores& confidences, uint64_t now_ns) {
  std::vector<int> detected;
  for (size_t i = 0; i < confidences.size(); ++i) {
    if (!(confidences[i] > rules_[i].threshold)) continue;
    if (last_ns_[i] != 0 && last_ns_[i] + rules_[i].cooling_ns >= now_ns) continue;
    last_ns_[i] = now_ns;
    detected.push_back(static_cast<int>(i));
  }
  return detected;
}

}  // namespace qz::tools
