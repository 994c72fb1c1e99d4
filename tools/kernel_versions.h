// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace qz::tools {

// Which implementation of each kernel runs in the module that is built beside this program, on this
// processor: a heading and a line for each, without a line break at the end. Verbose: also the
// kernels' symbols, a line each.
std::string KernelVersions(bool verbose);

}  // namespace qz::tools
