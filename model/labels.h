// SPDX-License-Identifier: Apache-2.0
// The classes of the five outputs. The module has only their codes; the names are in a small file
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

// Reads a table of the columns output, category, class, name (see base/tab_table.h): a row for each
// of the outputs, in order. Throws base::InputError.
Labels ReadLabels(const std::string& path);

// The output of a class; -1 if there is none.
int OutputOf(const Labels& labels, const std::string& class_name);

}  // namespace qz::model
