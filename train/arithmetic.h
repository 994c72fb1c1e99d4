// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace qz::train {

// To be called once before any training: makes results independent of this machine's caches, and
// keeps large blocks of memory in the process.
void SettleArithmetic();

}  // namespace qz::train
