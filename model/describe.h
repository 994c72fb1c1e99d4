// SPDX-License-Identifier: Apache-2.0
// The detector's description for scripts, as JSON.
#pragma once

#include <string>

namespace qz::model {

// {"frame_samples": …, "operators": [{"kind": "depthwise", "rows": …, …}, …]}: sizes in bytes, rows
// in frames of the window.
std::string DescriptionJson();

}  // namespace qz::model
