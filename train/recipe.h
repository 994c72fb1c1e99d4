// What a training run does, beside its recordings and its seed. A small text file.
#pragma once

#include <string>

namespace qz::train {

struct Recipe {
  // The run: sequences are augmented clips; an epoch draws each recording once as the first.
  int teachers = 2;         // networks over float, each from its own beginning
  int epochs = 300;         // of each of them
  int tuning_epochs = 200;  // of the model behind them, in the device's arithmetic
  int batch = 32;           // sequences a step
  int windows = 4;          // network windows a sequence, a run apart
  double rate = 0.003;      // of learning, at its highest; it falls to 0 along a cosine
  double tuning_rate = 0.001;
  double decay = 0.02;      // of weights
  double average = 0.995;   // memory of the weights' moving average, which becomes the model
  double dropout = 0.2;     // of the teachers
  double smoothing = 0.02;  // of targets
  double positive_weight = 1.5;
  double sharpness = 3;  // of the soft maximum over windows

  // Sound. Shares are of sequences, levels in dB.
  double min_gain = -20;
  double max_gain = 6;
  double start_share = 0.3;  // a clip begins with its first loud sound, and the sequence with it
  double turn_share = 0.5;   // of the others: a clip begins anywhere in itself and goes round
  double speed_share = 0.5;  // played faster or slower
  double speed_range = 0.15;
  double mix_share = 0.5;  // another clip is added
  double mix_range = 6;    // its gain relative to the first
  double noise_share = 0.4;
  double min_snr = 5;
  double max_snr = 35;

  // Features.
  double tilt = 12;          // up to this much from the middle to an end of the channels
  double shift_share = 0.3;  // all channels a place up or down
  int time_masks = 2;
  int max_time_mask = 40;  // frames
  int channel_masks = 1;
  int widest_channel_mask = 6;
};

// Reads lines "name value"; empty lines and what follows # say nothing. What is not named keeps the
// value above. Throws std::runtime_error: one line that names the file, the line, the value and
// what would be right.
Recipe ReadRecipe(const std::string& path);

// Sets one value, for ReadRecipe. Throws std::runtime_error without a place.
void SetInRecipe(const std::string& name, const std::string& value, Recipe* recipe);

// All values, a line each: what a run depends on.
std::string Describe(const Recipe& recipe);

}  // namespace qz::train
