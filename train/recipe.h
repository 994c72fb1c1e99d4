// SPDX-License-Identifier: Apache-2.0
// The settings of a training run, beside its recordings and its seed. A small text file.
#pragma once

#include <string>

namespace qz::train {

struct Recipe {
  // The run: sequences are augmented clips; an epoch draws each recording once as the first.
  int teachers = 2;             // networks over float, each from its own initial values
  int epochs = 300;             // of each of them
  int tuning_epochs = 200;      // of the model that follows, in the device's arithmetic
  int min_steps = 2000;         // of a teacher: with few recordings there are more epochs
  int min_tuning_steps = 1000;  // the same for the tuning
  int batch = 32;               // sequences a step
  int windows = 4;              // network windows a sequence, a run apart
  double rate = 0.003;          // learning rate at its maximum; it falls to 0 along a cosine
  double tuning_rate = 0.001;
  double decay = 0.02;      // of weights
  double average = 0.995;   // of the weights' exponential moving average, which becomes the model
  double dropout = 0.2;     // of the teachers
  double smoothing = 0.02;  // of targets
  double positive_weight = 1.5;
  double sharpness = 3;  // of the soft maximum over windows

  // Sound. Shares are of sequences, levels in dB.
  double min_gain = -20;
  double max_gain = 6;
  double start_share = 0.3;  // the sequence begins with the clip's first loud sound
  double turn_share = 0.5;   // of the others: rotated by a random number of samples
  double speed_share = 0.5;  // played faster or slower
  double speed_range = 0.15;
  double mix_share = 0.5;  // another clip is added
  double mix_range = 6;    // its gain relative to the first
  double noise_share = 0.4;
  double min_snr = 5;
  double max_snr = 35;

  // Features.
  double tilt = 12;          // up to this much from the middle to an end of the channels
  double shift_share = 0.3;  // all channels moved up or down by one
  int time_masks = 2;
  int max_time_mask = 40;  // frames
  int channel_masks = 1;
  int max_channel_mask = 6;  // channels
};

// Reads lines "name value"; empty lines and what follows # are skipped. What is not named keeps the
// value above. Throws std::runtime_error: one line that names the file, the line, the value and
// what is expected.
Recipe ReadRecipe(const std::string& path);

// Sets one value, for ReadRecipe. Throws std::runtime_error without file and line.
void SetInRecipe(const std::string& name, const std::string& value, Recipe* recipe);

// All values, a line each.
std::string Describe(const Recipe& recipe);

}  // namespace qz::train
