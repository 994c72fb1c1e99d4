// SPDX-License-Identifier: Apache-2.0
// A model's arrays as a file: the form in which models go to and come from elsewhere.
#pragma once

#include <string>

#include "model/packing.h"

namespace qz::model {

// An .npz archive that holds for every table, for example w6:
//   w6.weight  int8 [taps][inputs][outputs]; without taps where there is one; depthwise
//              [taps][channels]
//   w6.bias    int32 [outputs], as in LayerArrays
//   w6.scale   float32 [outputs]; not of w17 and w18
// Throws base::InputError if the archive can't be read, and PackingError about arrays that are
// missing, unknown, or of another type or shape than expected.
ModelArrays ReadModelArrays(const std::string& path);

// Writes the same bytes for the same arrays, as base::WriteOutputFile does. Throws
// base::OutputError. The sizes are valid, as of arrays that come from Unpack.
void WriteModelArrays(const std::string& path, const ModelArrays& arrays);

}  // namespace qz::model
