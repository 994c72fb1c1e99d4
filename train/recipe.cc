// SPDX-License-Identifier: Apache-2.0
#include "train/recipe.h"

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include "base/error.h"
#include "config/detector.h"

namespace qz::train {
namespace {

struct Entry {
  const char* name;
  double min, max;
  int Recipe::*whole;
  double Recipe::*real;
};

constexpr Entry Whole(const char* name, int Recipe::*field, double min, double max) {
  return {name, min, max, field, nullptr};
}
constexpr Entry Real(const char* name, double Recipe::*field, double min, double max) {
  return {name, min, max, nullptr, field};
}

constexpr Entry kEntries[] = {
    Whole("teachers", &Recipe::teachers, 1, 100),
    Whole("epochs", &Recipe::epochs, 1, 100000),
    Whole("tuning_epochs", &Recipe::tuning_epochs, 1, 100000),
    Whole("min_steps", &Recipe::min_steps, 1, 1000000),
    Whole("min_tuning_steps", &Recipe::min_tuning_steps, 1, 1000000),
    Whole("batch", &Recipe::batch, 2, 1024),
    Whole("windows", &Recipe::windows, 1, 64),
    Real("rate", &Recipe::rate, 0, 1),
    Real("tuning_rate", &Recipe::tuning_rate, 0, 1),
    Real("decay", &Recipe::decay, 0, 10),
    Real("average", &Recipe::average, 0, 0.999999),
    Real("dropout", &Recipe::dropout, 0, 0.9),
    Real("smoothing", &Recipe::smoothing, 0, 0.49),
    Real("positive_weight", &Recipe::positive_weight, 0.01, 100),
    Real("sharpness", &Recipe::sharpness, 0.01, 100),
    Real("min_gain", &Recipe::min_gain, -90, 90),
    Real("max_gain", &Recipe::max_gain, -90, 90),
    Real("start_share", &Recipe::start_share, 0, 1),
    Real("turn_share", &Recipe::turn_share, 0, 1),
    Real("speed_share", &Recipe::speed_share, 0, 1),
    Real("speed_range", &Recipe::speed_range, 0, 0.9),
    Real("mix_share", &Recipe::mix_share, 0, 1),
    Real("mix_range", &Recipe::mix_range, 0, 90),
    Real("noise_share", &Recipe::noise_share, 0, 1),
    Real("min_snr", &Recipe::min_snr, -90, 90),
    Real("max_snr", &Recipe::max_snr, -90, 90),
    Real("tilt", &Recipe::tilt, 0, 200),
    Real("shift_share", &Recipe::shift_share, 0, 1),
    Whole("time_masks", &Recipe::time_masks, 0, 100),
    Whole("max_time_mask", &Recipe::max_time_mask, 1, config::kWindowFrames),
    Whole("channel_masks", &Recipe::channel_masks, 0, config::kFeatureChannels),
    Whole("max_channel_mask", &Recipe::max_channel_mask, 1, config::kFeatureChannels),
};

std::string Number(double value) {
  char text[32];
  std::snprintf(text, sizeof(text), "%.10g", value);
  return text;
}

// Conditions on more than one value.
void CheckRanges(const Recipe& recipe, const std::string& path) {
  if (recipe.batch % 2 != 0) {
    throw base::InputError(path + ": batch is " + std::to_string(recipe.batch) +
                           ", expected an even number: two threads share it");
  }
  if (recipe.min_gain > recipe.max_gain || recipe.min_snr > recipe.max_snr) {
    throw base::InputError(
        path + ": min_gain or min_snr is above its maximum, expected at most max_gain or max_snr");
  }
}

}  // namespace

void SetInRecipe(const std::string& name, const std::string& value, Recipe* recipe) {
  for (const Entry& entry : kEntries) {
    if (name != entry.name) continue;
    char* end = nullptr;
    const double number = std::strtod(value.c_str(), &end);
    const bool whole = entry.whole == nullptr || number == std::floor(number);
    if (value.empty() || *end != '\0' || !(number >= entry.min && number <= entry.max) || !whole) {
      std::string line = name;
      line += " is '" + value + "', expected a ";
      line += entry.whole != nullptr ? "whole number from " : "number from ";
      line += Number(entry.min) + " to " + Number(entry.max);
      throw base::InputError(line);
    }
    if (entry.whole != nullptr) {
      recipe->*entry.whole = static_cast<int>(number);
    } else {
      recipe->*entry.real = number;
    }
    return;
  }
  throw base::InputError("unknown name '" + name + "'");
}

Recipe ReadRecipe(const std::string& path) {
  std::ifstream file(path);
  if (!file) throw base::InputError(path + ": can't be opened: " + std::strerror(errno));
  Recipe recipe;
  std::string line;
  for (int number = 1; std::getline(file, line); ++number) {
    std::istringstream words(line.substr(0, line.find('#')));
    std::string name, value, more;
    if (!(words >> name)) continue;
    const std::string location = path + ": line " + std::to_string(number) + ": ";
    if (!(words >> value) || words >> more) {
      throw base::InputError(location + "expected a name and a value");
    }
    try {
      SetInRecipe(name, value, &recipe);
    } catch (const std::runtime_error& error) {
      throw base::InputError(location + error.what());
    }
  }
  if (file.bad()) throw base::InputError(path + ": can't be read: " + std::strerror(errno));
  CheckRanges(recipe, path);
  return recipe;
}

std::string Describe(const Recipe& recipe) {
  std::string text;
  for (const Entry& entry : kEntries) {
    const double value = entry.whole != nullptr ? recipe.*entry.whole : recipe.*entry.real;
    text += std::string(entry.name) + " " + Number(value) + "\n";
  }
  return text;
}

}  // namespace qz::train
