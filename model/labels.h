// What the five outputs answer to. The module keeps only codes; the names stand in a small file
// beside the model.
#pragma once

#include <array>
#include <string>

#include "model/reference_network.h"

namespace qz::model {

struct Label {
  int category = 0;        // the code in reports and detections, 0 to 255
  std::string class_name;  // as lists of recordings write it: dog_bark
  std::string name;        // for people: dog bark
};

// By output.
using Labels = std::array<Label, kClasses>;

// Reads text, tab-separated, headed by the line "output category class name": a line for each of
// the outputs 0 to 4, in order. Throws std::runtime_error: one line that names the file, the line,
// the value and what would be right.
Labels ReadLabels(const std::string& path);

// The output that answers to a class; -1 if none does.
int OutputOf(const Labels& labels, const std::string& class_name);

}  // namespace qz::model
