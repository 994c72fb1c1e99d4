// SPDX-License-Identifier: Apache-2.0
#include "train/augmentation.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "dataset/clip_features.h"
#include "detector/framing.h"

namespace qz::train {
namespace {

constexpr size_t kNoiseSamples = size_t{1} << 18;  // 16 s

double FromDecibels(double decibels) { return std::pow(10, decibels / 20); }

double MeanSquare(const std::vector<float>& sound) {
  double sum = 0;
  for (const float sample : sound) sum += static_cast<double>(sample) * static_cast<double>(sample);
  return sum / static_cast<double>(sound.size());
}

bool Happens(double share, base::NumberGenerator* random) { return random->Unit() < share; }

// `slope`: the share of each sample that is added to the next; 0 is white noise. `white` is the
// share of white noise on top.
std::vector<float> MakeNoise(double slope, double white, uint64_t seed) {
  base::NumberGenerator random(seed);
  std::vector<float> noise(kNoiseSamples);
  double slow = 0;
  for (float& sample : noise) {
    const double draw = random.Bell();
    slow = slope * slow + draw;
    sample = static_cast<float>(slow + white * draw);
  }
  const float gain = static_cast<float>(1 / std::sqrt(MeanSquare(noise)));
  for (float& sample : noise) sample *= gain;
  return noise;
}

// Before a clip's first loud sample, in samples: 50 ms.
constexpr int kMaxLead = 800;

// The first sample that is an eighth as loud as the loudest.
int64_t Onset(const std::vector<int16_t>& samples) {
  int peak = 0;
  for (const int sample : samples) peak = std::max(peak, std::abs(sample));
  const auto loud = [&](int sample) { return 8 * std::abs(sample) >= peak; };
  return std::find_if(samples.begin(), samples.end(), loud) - samples.begin();
}

// Positions between samples, in units of 2^-24.
constexpr int64_t kPhaseOne = int64_t{1} << 24;

// Adds samples from `phase` until `last` or the end of the sound, each interpolated between two;
// returns the phase of the next.
int64_t AddPart(const std::vector<int16_t>& samples, int64_t last, float gain, int64_t step,
                int64_t phase, const float* end, float** out) {
  const int64_t left = last * kPhaseOne - phase;
  if (left <= 0) return phase;
  const int64_t count = std::min<int64_t>((left + step - 1) / step, end - *out);
  if (step == kPhaseOne) {  // the same in less time
    const int16_t* const at = samples.data() + phase / kPhaseOne;
    for (int64_t i = 0; i < count; ++i) (*out)[i] += gain * static_cast<float>(at[i]);
    *out += count;
    return phase + count * step;
  }
  for (int64_t i = 0; i < count; ++i, phase += step) {
    const int16_t* at = samples.data() + phase / kPhaseOne;
    const float rest = static_cast<float>(phase % kPhaseOne) * 0x1p-24f;
    (*out)[i] += gain * (static_cast<float>(at[0]) + rest * static_cast<float>(at[1] - at[0]));
  }
  *out += count;
  return phase;
}

std::vector<int16_t> Rounded(const std::vector<float>& sound) {
  std::vector<int16_t> samples(sound.size());
  std::transform(sound.begin(), sound.end(), samples.begin(), [](float value) {
    return static_cast<int16_t>(std::nearbyint(std::clamp(value, -32768.0f, 32767.0f)));
  });
  return samples;
}

}  // namespace

Augmentation::Augmentation(const Recipe& recipe, const std::vector<Clip>& clips)
    : recipe_(recipe),
      clips_(clips),
      samples_(detector::SamplesOf(static_cast<size_t>(FramesFor(recipe.windows)))),
      noises_{MakeNoise(0, 0, 1), MakeNoise(0.95, 2, 2), MakeNoise(0.98, 0, 3)} {}

void Augmentation::Make(size_t first, uint64_t seed, Eigen::Index sequence, Batch* features,
                        Matrix* targets) const {
  base::NumberGenerator random(seed);
  Sound sound(samples_);
  targets->row(sequence).setZero();
  const auto add = [&](const Clip& clip, double gain) {
    AddClip(clip, gain, &random, &sound);
    if (clip.output >= 0) (*targets)(sequence, clip.output) = 1;
  };
  const double gain = random.Uniform(recipe_.min_gain, recipe_.max_gain);
  add(clips_[first], FromDecibels(gain));
  if (Happens(recipe_.mix_share, &random)) {
    const Clip& other =
        clips_[static_cast<size_t>(random.Between(0, static_cast<int>(clips_.size()) - 1))];
    add(other, FromDecibels(gain + random.Uniform(-recipe_.mix_range, recipe_.mix_range)));
  }
  if (Happens(recipe_.noise_share, &random)) AddNoise(&random, &sound);

  const std::vector<int16_t> samples = Rounded(sound);
  CopyFeatures(dataset::FeaturesOf(samples.data(), samples.size()), sequence, features);
  Colour(&random, sequence, features);
  Mask(&random, sequence, features);
}

// Wholly in the sequence where it fits, else filling it; what comes before and after it stays
// silent.
void Augmentation::AddClip(const Clip& clip, double gain, base::NumberGenerator* random,
                           Sound* sound) const {
  const auto length = static_cast<int64_t>(clip.samples.size());
  const bool at_start = Happens(recipe_.start_share, random);
  int64_t begin = 0;
  if (at_start) {
    begin = std::max<int64_t>(Onset(clip.samples) - random->Between(0, kMaxLead), 0);
  } else if (Happens(recipe_.turn_share, random)) {
    begin = static_cast<int64_t>(random->Uniform(0, static_cast<double>(length)));
  }
  const bool other_speed = Happens(recipe_.speed_share, random);
  const double speed =
      other_speed ? std::exp(random->Uniform(-recipe_.speed_range, recipe_.speed_range)) : 1;
  const double space = static_cast<double>(samples_) - static_cast<double>(length) / speed;
  const double offset = at_start ? 0 : random->Uniform(std::min(space, 0.0), std::max(space, 0.0));

  const auto step = static_cast<int64_t>(speed * kPhaseOne);
  const float* end = sound->data() + sound->size();
  float* out = sound->data() + std::max(static_cast<int64_t>(offset), int64_t{0});
  int64_t phase = begin * kPhaseOne + std::max(-static_cast<int64_t>(offset), int64_t{0}) * step;
  const auto level = static_cast<float>(gain);
  if (phase < (length - 1) * kPhaseOne) {
    phase = AddPart(clip.samples, length - 1, level, step, phase, end, &out);
  }
  phase -= length * kPhaseOne;  // between the last sample and the first: the first
  AddPart(clip.samples, begin - 1, level, step, std::max(phase, int64_t{0}), end, &out);
}

void Augmentation::AddNoise(base::NumberGenerator* random, Sound* sound) const {
  const Sound& noise =
      noises_[static_cast<size_t>(random->Between(0, static_cast<int>(noises_.size()) - 1))];
  const auto begin = static_cast<size_t>(random->Between(0, static_cast<int>(kNoiseSamples) - 1));
  const double level = std::sqrt(MeanSquare(*sound)) *
                       FromDecibels(-random->Uniform(recipe_.min_snr, recipe_.max_snr));
  for (size_t i = 0; i < sound->size(); ++i) {
    (*sound)[i] += static_cast<float>(level) * noise[(begin + i) % kNoiseSamples];
  }
}

// As from another microphone: louder low or high channels, all channels moved up or down by one.
// What was silent stays so.
void Augmentation::Colour(base::NumberGenerator* random, Eigen::Index sequence,
                          Batch* features) const {
  auto rows = features->values.middleRows(sequence * features->steps(), features->steps());
  const double tilt = random->Uniform(-recipe_.tilt, recipe_.tilt);
  RowVector offsets(rows.cols());
  for (Eigen::Index c = 0; c < rows.cols(); ++c) {
    offsets(c) = static_cast<float>(std::floor(tilt * (static_cast<double>(c) - 23.5) / 23.5));
  }
  for (Eigen::Index r = 0; r < rows.rows(); ++r) {
    for (Eigen::Index c = 0; c < rows.cols(); ++c) {
      if (rows(r, c) > 0) rows(r, c) = std::clamp(rows(r, c) + offsets(c), 33.0f, 255.0f);
    }
  }
  if (!Happens(recipe_.shift_share, random)) return;
  const Matrix copy = rows;
  const Eigen::Index kept = rows.cols() - 1;
  if (Happens(0.5, random)) {
    rows.leftCols(kept) = copy.rightCols(kept);
  } else {
    rows.rightCols(kept) = copy.leftCols(kept);
  }
}

void Augmentation::Mask(base::NumberGenerator* random, Eigen::Index sequence,
                        Batch* features) const {
  auto rows = features->values.middleRows(sequence * features->steps(), features->steps());
  for (int i = 0; i < recipe_.time_masks; ++i) {
    const int length = random->Between(0, recipe_.max_time_mask);
    const int begin = random->Between(0, static_cast<int>(rows.rows()) - length);
    rows.middleRows(begin, length).setZero();
  }
  for (int i = 0; i < recipe_.channel_masks; ++i) {
    const int width = random->Between(0, recipe_.max_channel_mask);
    const int begin = random->Between(0, static_cast<int>(rows.cols()) - width);
    rows.middleCols(begin, width).setZero();
  }
}

}  // namespace qz::train
