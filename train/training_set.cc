// SPDX-License-Identifier: Apache-2.0
#include "train/training_set.h"

#include <algorithm>

#include "audio/audio_input.h"
#include "dataset/clip.h"
#include "dataset/clip_features.h"
#include "detector/window.h"
#include "evaluation/clip_scores.h"

namespace qz::train {

ClipList LoadClips(const std::vector<dataset::Recording>& recordings, const model::Labels& labels) {
  ClipList list;
  for (const dataset::Recording& recording : recordings) {
    try {
      list.clips.push_back({recording.file, recording.fold,
                            model::OutputOf(labels, recording.class_name),
                            dataset::ReadClip(recording.file)});
    } catch (const audio::AudioError& error) {
      list.skipped.emplace_back(error.what());
    }
  }
  return list;
}

Batch ValidationFeatures(const std::vector<int16_t>& samples) {
  const std::vector<uint16_t> features = evaluation::FeaturesToPlay(samples);
  const auto frames = static_cast<int>(features.size() / config::kFeatureChannels);
  Batch batch;
  batch.Resize(
      1, FramesFor(1 + (frames - FramesFor(1)) / static_cast<int>(config::kFramesBetweenRuns)),
      static_cast<Eigen::Index>(config::kFeatureChannels));
  CopyFeatures(features, 0, &batch);
  return batch;
}

void CopyFeatures(const std::vector<uint16_t>& features, Eigen::Index sequence, Batch* batch) {
  const Eigen::Index count = batch->steps() * batch->channels();
  std::transform(
      features.begin(), features.begin() + count, batch->values.data() + sequence * count,
      [](uint16_t feature) { return static_cast<float>(detector::NetworkInput(feature) + 128); });
}

}  // namespace qz::train
