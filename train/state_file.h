// SPDX-License-Identifier: Apache-2.0
// A training run on disk, so that a stopped one continues as if it had not been stopped.
#pragma once

#include <optional>
#include <string>

#include "train/trainer.h"

namespace qz::train {

// What the result of a run depends on, as text: recipe, seed, clips.
std::string Fingerprint(const Recipe& recipe, uint64_t seed, const std::vector<Clip>& trained,
                        const std::vector<Clip>& validation_clips);

// Writes all or nothing. Throws std::runtime_error naming the file and the cause.
void WriteState(const std::string& path, const std::string& fingerprint,
                const TrainingState& state);

// Nothing if there is no such file. Throws std::runtime_error if it is not whole or belongs to
// another run.
std::optional<TrainingState> ReadState(const std::string& path, const std::string& fingerprint);

}  // namespace qz::train
