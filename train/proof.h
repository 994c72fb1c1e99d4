// The proof that what was trained is what the device computes: the trainer's integer network and
// the module's own network give the same tensors, byte for byte.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "digest.h"
#include "matrix.h"
#include "quantised_network.h"

namespace qz::train {

struct Proof {
  uint64_t runs = 0;   // of the network, compared with all their tensors
  uint64_t bytes = 0;  // compared
  uint64_t trainer_digest = model::kDigestOfNothing;  // of all tensors in order
  uint64_t module_digest = model::kDigestOfNothing;
  std::string difference;  // the first: run, operator, row, channel, values; empty if none
};

// Over every window of every clip's features (0 to 255): the trainer by its parameters, the module
// by what they were packed into, which has passed the checker.
Proof Prove(const QuantisedParameters& parameters, const model::PackedModel& model,
            const std::vector<Batch>& judged);

// For people; `difference` included.
std::string Sentence(const Proof& proof);

}  // namespace qz::train
