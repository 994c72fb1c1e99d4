// SPDX-License-Identifier: Apache-2.0
#include "model/weight_layout.h"

namespace qz::model {

const TableLayout* FindTable(int op) {
  for (const TableLayout& table : kTables) {
    if (table.op == op) return &table;
  }
  return nullptr;
}

}  // namespace qz::model
