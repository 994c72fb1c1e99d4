// SPDX-License-Identifier: Apache-2.0
#include "train/state_file.h"

#include <cstring>
#include <filesystem>

#include "base/digest.h"
#include "base/error.h"
#include "base/input_file.h"
#include "base/output_file.h"
#include "model/weight_layout.h"

namespace qz::train {
namespace {

// To be raised with every change of the layout, or of what an epoch does. Numbers are as in memory,
// little-endian; their digest follows.
constexpr char kMagic[] = "qz training state 2\n";

// Of a hundred teachers and more.
constexpr size_t kMaxBytes = 128 << 20;

std::string DigestOf(const std::vector<Clip>& clips) {
  uint64_t digest = base::kEmptyDigest;
  for (const Clip& clip : clips) {
    digest = base::Digest(&clip.output, sizeof(clip.output), digest);
    digest = base::Digest(clip.samples.data(), clip.samples.size() * sizeof(int16_t), digest);
  }
  return std::to_string(clips.size()) + " clips, digest " + std::to_string(digest);
}

// Calls `visit` with every field in the order of the file; the number of teachers is set already.
template <typename State, typename Visit>
void ForEachField(State& state, Visit visit) {
  visit(&state.epoch, sizeof(state.epoch));
  visit(&state.phase_epoch, sizeof(state.phase_epoch));
  visit(&state.best_epoch, sizeof(state.best_epoch));
  visit(&state.best_metric, sizeof(state.best_metric));
  visit(&state.adam.steps, sizeof(state.adam.steps));
  const auto visit_values = [&](auto& values) {
    visit(values.data(), values.size() * sizeof(float));
  };
  for (auto* values :
       {&state.adam.mean, &state.adam.square, &state.values, &state.average, &state.best}) {
    visit_values(*values);
  }
  for (auto& teacher : state.teachers) visit_values(teacher);
}

size_t SizeOf(const TrainingState& state) {
  size_t bytes = 0;
  ForEachField(state, [&](const void*, size_t size) { bytes += size; });
  return bytes;
}

}  // namespace

std::string Fingerprint(const Recipe& recipe, uint64_t seed, const std::vector<Clip>& trained,
                        const std::vector<Clip>& validation_clips) {
  return kMagic + Describe(recipe) + "seed " + std::to_string(seed) + "\ntrained on " +
         DigestOf(trained) + "\nvalidated on " + DigestOf(validation_clips) + "\n";
}

void WriteState(const std::string& path, const std::string& fingerprint,
                const TrainingState& state) {
  std::string bytes = fingerprint;
  uint64_t digest = base::kEmptyDigest;
  ForEachField(state, [&](const void* field, size_t size) {
    bytes.append(static_cast<const char*>(field), size);
    digest = base::Digest(field, size, digest);
  });
  bytes.append(reinterpret_cast<const char*>(&digest), sizeof(digest));
  base::WriteOutputFile(path, bytes);
}

std::optional<TrainingState> ReadState(const std::string& path, const std::string& fingerprint) {
  if (!std::filesystem::exists(path)) return std::nullopt;
  const std::vector<uint8_t> bytes = base::ReadWholeFile(path, kMaxBytes);
  if (bytes.size() < fingerprint.size() + sizeof(uint64_t) ||
      std::memcmp(bytes.data(), fingerprint.data(), fingerprint.size()) != 0) {
    throw base::InputError(path +
                           ": is of another run (recipe, seed or clips differ); remove it "
                           "or name another file");
  }
  // The number of teachers follows from the size.
  TrainingState state;
  const size_t fields = SizeOf(state), teacher = kParameters.all * sizeof(float);
  const size_t held = bytes.size() - fingerprint.size() - sizeof(uint64_t);
  if (held < fields || (held - fields) % teacher != 0) {
    throw base::InputError(path + ": has " + std::to_string(bytes.size()) +
                           " bytes, which is not whole; remove it to begin anew");
  }
  state.teachers.assign((held - fields) / teacher, Values(kParameters.all));
  size_t next = fingerprint.size();
  ForEachField(state, [&](void* field, size_t size) {
    std::memcpy(field, bytes.data() + next, size);
    next += size;
  });
  if (base::Digest(bytes.data() + fingerprint.size(), held) != model::Load<uint64_t>(bytes, next)) {
    throw base::InputError(path + ": is damaged; remove it to begin anew");
  }
  return state;
}

}  // namespace qz::train
