// SPDX-License-Identifier: Apache-2.0
// A packed model in memory: its bytes, and where in them the description's tables have their values
// (config/weight_tables.h).
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "config/weight_tables.h"

namespace qz::model {

using config::kModelBytes;
using config::kTableCount;
using config::kTables;
using config::OperatorKind;
using config::TableLayout;

using PackedModel = std::vector<uint8_t>;

// The table that operator `op` reads; null if it reads none.
const TableLayout* FindTable(int op);

template <typename T>
T Load(const PackedModel& model, size_t offset) {
  T value;
  std::memcpy(&value, model.data() + offset, sizeof(T));
  return value;
}

template <typename T>
void Store(PackedModel& model, size_t offset, T value) {
  std::memcpy(model.data() + offset, &value, sizeof(T));
}

}  // namespace qz::model
