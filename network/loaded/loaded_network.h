// The module's own network, its source compiled once more, over tables that a program loads: for
// those who judge models that no module was built with. One static instance, single-threaded.
#pragma once

#include <cstddef>
#include <cstdint>

namespace qz {

constexpr size_t kLoadedTableBytes = 86000;

// The packed tables w0 to w18, one after the other; all zero at first. From the next run on
// mobilenet_backend_invoke() goes by what stands here. Tables that the checker of models passes
// keep the network within its contracts.
extern "C" {
alignas(16) extern unsigned char loaded_tables[kLoadedTableBytes];
}

}  // namespace qz
