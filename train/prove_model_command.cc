#include "prove_model_command.h"

#include <cstdio>

#include "model_files.h"
#include "packing.h"
#include "proof.h"
#include "training_set.h"

namespace qz::train {

programs::ExitCode ProveModelCommand(const std::string& model_file, const std::string& manifest) {
  const model::PackedModel model = model::ReadSoundModel(model_file);
  // Any sound does: no class is asked for.
  const ClipList list = LoadClips(dataset::ReadManifest(manifest), model::Labels());
  std::vector<Batch> judged;
  for (const Clip& clip : list.clips) judged.push_back(JudgedFeatures(clip.samples));
  for (const std::string& line : list.skipped) {
    std::fprintf(stderr, "qz-train: skipped: %s\n", line.c_str());
  }
  const Proof proof = Prove(ParametersOf(model::Unpack(model)), model, judged);
  std::printf("%s on %zu clips: %s\n", model_file.c_str(), judged.size(), Sentence(proof).c_str());
  if (!proof.difference.empty() || proof.runs == 0) return programs::kFaultFound;
  return list.skipped.empty() ? programs::kFine : programs::kUnreadableInput;
}

}  // namespace qz::train
