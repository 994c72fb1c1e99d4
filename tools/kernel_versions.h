#pragma once

#include <string>

namespace qz::tools {

// Which text of each kernel runs in the module that is built beside this program, on this
// processor: a heading and a line for each, without a line break at the end.
std::string KernelVersions();

}  // namespace qz::tools
