// SPDX-License-Identifier: Apache-2.0
// Feature windows that look like audio, without any: what the synthetic model is calibrated on.
#pragma once

#include <cstdint>

#include "model/reference_network.h"

namespace qz::model {

// One network input of features minus 128, the same bytes on every machine. A feature is
// about 16 x ln(8 x amplitude) of one of 48 mel bands after noise subtraction, so it is 0 in
// silence, otherwise 33 or more, and moves by 11 per 6 dB. A window holds a tilted, restless
// background with noise-subtracted gaps and up to seven events: voiced syllables, tones that fade
// as the noise estimate learns them, strokes, sweeps and steady roars.
Tensor SyntheticWindow(uint64_t seed);

}  // namespace qz::model
