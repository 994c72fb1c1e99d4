// SPDX-License-Identifier: Apache-2.0
#include "train/arithmetic.h"

#include <malloc.h>

#include <Eigen/Core>

namespace qz::train {

void SettleArithmetic() {
  // Eigen cuts products, and so orders sums, by the sizes of the caches.
  Eigen::setCpuCacheSizes(32 << 10, 512 << 10, 8 << 20);
  // Blocks of some MB are allocated and freed all the time; mapped anew each time they cost page
  // faults.
  mallopt(M_MMAP_THRESHOLD, 1 << 30);
  mallopt(M_TRIM_THRESHOLD, 1 << 30);
}

}  // namespace qz::train
