// SPDX-License-Identifier: Apache-2.0
// The check that what was trained is what the device computes: the trainer's integer network and
// the module's network give the same tensors, byte for byte.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "base/digest.h"
#include "train/matrix.h"
#include "train/quantised_network.h"

namespace qz::train {

struct EquivalenceCheck {
  uint64_t runs = 0;                             // of the network, compared with all their tensors
  uint64_t bytes = 0;                            // compared
  uint64_t trainer_digest = base::kEmptyDigest;  // of all tensors in order
  uint64_t module_digest = base::kEmptyDigest;
  std::string difference;  // the first: run, operator, row, channel, values; empty if none
};

// Over every window of every clip's features (0 to 255): the trainer by its parameters, the module
// by what they were packed into, which has passed the checker.
EquivalenceCheck Prove(const QuantisedParameters& parameters, const model::PackedModel& model,
                       const std::vector<Batch>& validated);

// For people; `difference` included.
std::string Message(const EquivalenceCheck& check);

}  // namespace qz::train
