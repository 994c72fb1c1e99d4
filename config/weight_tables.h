// SPDX-License-Identifier: Apache-2.0
// Where every bias, weight and scale of the packed model lies, as it follows from the description.
//
// A packed model is the tables of kTables one after the other, little-endian. A table is a row of
// blocks of output columns (depthwise tables: groups of channels); a block holds
//   int32 bias[columns]; int8 weight[taps][inputs][columns]; float32 scale[columns] (if scaled).
// Columns beyond the real ones fill up the last block; everything of theirs is zero.
#pragma once

#include <array>
#include <cstddef>
#include <string_view>

#include "config/network.h"

namespace qz::config {

struct TableLayout {
  std::string_view name;
  int op = 0;  // the operator that reads the table
  OperatorKind kind = OperatorKind::kPointwise;
  int taps = 0;
  int inputs = 0;         // input channels per tap; 1 in depthwise tables: column c reads channel c
  int outputs = 0;        // real output columns
  float fixed_scale = 0;  // the scale of every column; 0 where each column has its own, or none
  int input_zero_point = 0;
  size_t offset = 0;  // of the table's first byte in the packed model

  constexpr bool IsDepthwise() const { return kind == OperatorKind::kDepthwise; }
  constexpr bool HasScales() const { return kind != OperatorKind::kFullyConnected; }
  constexpr int BlockColumns() const { return IsDepthwise() ? 16 : 8; }
  constexpr int Blocks() const { return (outputs + BlockColumns() - 1) / BlockColumns(); }
  constexpr int PaddedColumns() const { return Blocks() * BlockColumns(); }
  constexpr size_t WeightBytes() const { return Size(taps) * Size(inputs) * Size(BlockColumns()); }
  constexpr size_t BlockBytes() const {
    return Size(BlockColumns()) * (HasScales() ? 8 : 4) + WeightBytes();
  }
  constexpr size_t Bytes() const { return Size(Blocks()) * BlockBytes(); }

  // Byte offsets in the packed model. column < PaddedColumns(), tap < taps, input < inputs.
  constexpr size_t BiasOffset(int column) const {
    return BlockOffset(column) + 4 * Size(column % BlockColumns());
  }
  constexpr size_t WeightOffset(int tap, int input, int column) const {
    return BlockOffset(column) + 4 * Size(BlockColumns()) +
           Size((tap * inputs + input) * BlockColumns() + column % BlockColumns());
  }
  constexpr size_t ScaleOffset(int column) const {
    return BiasOffset(column) + 4 * Size(BlockColumns()) + WeightBytes();
  }

 private:
  static constexpr size_t Size(int value) { return static_cast<size_t>(value); }
  constexpr size_t BlockOffset(int column) const {
    return offset + Size(column / BlockColumns()) * BlockBytes();
  }
};

constexpr size_t CountTables() {
  size_t count = 0;
  for (const Operator& op : kOperators) count += op.HasTable() ? 1 : 0;
  return count;
}
constexpr size_t kTableCount = CountTables();

constexpr std::array<TableLayout, kTableCount> MakeTables() {
  std::array<TableLayout, kTableCount> tables{};
  size_t offset = 0, next = 0;
  for (size_t i = 0; i < kOperatorCount; ++i) {
    const Operator& op = kOperators[i];
    if (!op.HasTable()) continue;
    TableLayout& table = tables[next++];
    table.name = op.table;
    table.op = static_cast<int>(i);
    table.kind = op.kind;
    table.taps = static_cast<int>(op.taps);
    table.outputs = static_cast<int>(op.channels);
    table.inputs = table.IsDepthwise() ? 1 : static_cast<int>(op.input.channels);
    table.fixed_scale = static_cast<float>(op.scale);
    table.input_zero_point = op.input.zero_point;
    table.offset = offset;
    offset += table.Bytes();
  }
  return tables;
}
inline constexpr std::array<TableLayout, kTableCount> kTables = MakeTables();
constexpr size_t kModelBytes = kTables.back().offset + kTables.back().Bytes();

// The index in kTables of the table that operator `op` reads; kTableCount if it reads none.
constexpr size_t TableIndex(size_t op) {
  size_t index = 0;
  while (index < kTableCount && kTables[index].op != static_cast<int>(op)) ++index;
  return index;
}

constexpr bool TablesHold() {
  for (const TableLayout& table : kTables) {
    if (table.offset % kTensorAlignment != 0) return false;
    if (table.IsDepthwise() && table.input_zero_point != -128) return false;
  }
  return true;
}
static_assert(TablesHold(), "tables aligned; depthwise operators read rectified tensors");

}  // namespace qz::config
