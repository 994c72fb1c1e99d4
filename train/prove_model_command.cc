// SPDX-License-Identifier: Apache-2.0
#include "train/prove_model_command.h"

#include <cstdio>

#include "model/model_files.h"
#include "model/packing.h"
#include "train/equivalence.h"
#include "train/training_set.h"

namespace qz::train {

base::ExitCode ProveModelCommand(const std::string& model_file, const std::string& manifest) {
  const model::PackedModel model = model::ReadValidModel(model_file);
  // Any recording will do: classes are not read.
  const ClipList list = LoadClips(dataset::ReadManifest(manifest), model::Labels());
  std::vector<Batch> features;
  features.reserve(list.clips.size());
  for (const Clip& clip : list.clips) features.push_back(ValidationFeatures(clip.samples));
  for (const std::string& line : list.skipped) {
    std::fprintf(stderr, "qz-train: skipped: %s\n", line.c_str());
  }
  const EquivalenceCheck check = Prove(ParametersOf(model::Unpack(model)), model, features);
  std::printf("%s on %zu clips: %s\n", model_file.c_str(), features.size(), Message(check).c_str());
  if (!check.difference.empty() || check.runs == 0) return base::kFaultFound;
  return list.skipped.empty() ? base::kSuccess : base::kUnreadableInput;
}

}  // namespace qz::train
