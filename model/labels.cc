#include "model/labels.h"

#include <cerrno>
#include <cstring>
#include <fstream>

#include "base/error.h"

namespace qz::model {
namespace {

constexpr char kHeader[] = "output\tcategory\tclass\tname";

// Takes off what stands before the first tab, or all.
std::string TakeField(std::string* line) {
  const size_t tab = line->find('\t');
  std::string field = line->substr(0, tab);
  line->erase(0, tab == std::string::npos ? tab : tab + 1);
  return field;
}

bool IsCategory(const std::string& text) {
  return !text.empty() && text.size() <= 3 &&
         text.find_first_not_of("0123456789") == std::string::npos && std::stoi(text) <= 255;
}

Label ParseLine(std::string line, int output, const std::string& location) {
  const std::string number = TakeField(&line);
  if (number != std::to_string(output)) {
    throw base::InputError(location + "the output is '" + number + "', should be " +
                           std::to_string(output));
  }
  const std::string category = TakeField(&line);
  if (!IsCategory(category)) {
    throw base::InputError(location + "the category is '" + category + "', should be 0 to 255");
  }
  Label label;
  label.category = std::stoi(category);
  label.class_name = TakeField(&line);
  label.name = line;
  if (label.class_name.empty() || label.name.empty()) {
    throw base::InputError(location +
                           "should be: output, category, class, name, with tabs between");
  }
  return label;
}

}  // namespace

Labels ReadLabels(const std::string& path) {
  std::ifstream file(path);
  if (!file) throw base::InputError(path + ": can't be opened: " + std::strerror(errno));
  Labels labels;
  int lines = 0;
  for (std::string line; std::getline(file, line); ++lines) {
    if (!line.empty() && line.back() == '\r') line.pop_back();
    const std::string location = path + ": line " + std::to_string(lines + 1) + ": ";
    if (lines == 0 && line != kHeader) {
      throw base::InputError(location +
                             "should be: output, category, class, name, with tabs between");
    }
    if (lines > kClasses) throw base::InputError(location + "should not be: there are 5 outputs");
    if (lines == 0) continue;
    const Label label = ParseLine(line, lines - 1, location);
    for (int i = 0; i < lines - 1; ++i) {
      const Label& before = labels[static_cast<size_t>(i)];
      if (before.class_name == label.class_name || before.category == label.category) {
        throw base::InputError(location + "class or category stands in the line of output " +
                               std::to_string(i) + " already");
      }
    }
    labels[static_cast<size_t>(lines - 1)] = label;
  }
  if (file.bad()) throw base::InputError(path + ": can't be read: " + std::strerror(errno));
  if (lines <= kClasses) {
    throw base::InputError(path + ": " + std::to_string(lines) +
                           " lines, should be 6: a header and the outputs 0 to 4");
  }
  return labels;
}

int OutputOf(const Labels& labels, const std::string& class_name) {
  for (int i = 0; i < kClasses; ++i) {
    if (labels[static_cast<size_t>(i)].class_name == class_name) return i;
  }
  return -1;
}

}  // namespace qz::model
