// Where every bias, weight and scale of the packed model lies: the one description from which the
// checker, the generator, the reference network and the embedder work.
//
// A packed model is the tables of kTables one after the other, 86,000 bytes, little-endian. A table
// is a row of blocks of output columns (depthwise tables: groups of channels); a block holds
//   int32 bias[columns]; int8 weight[taps][inputs][columns]; float32 scale[columns] (if scaled).
// Columns beyond the real ones fill up the last block; everything of theirs is zero.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>
#include <vector>

namespace qz::model {

using PackedModel = std::vector<uint8_t>;

enum class TableKind {
  kDepthwise,     // groups of 16 channels, each with its own taps and scale
  kGemm,          // blocks of 8 columns, one tap, a scale per column
  kIndirectGemm,  // blocks of 8 columns, three taps, a scale per column
  kPlainGemm,     // blocks of 8 columns, one tap, no scales: one fixed-point factor for all
};

struct TableLayout {
  std::string_view name;
  int op;  // the operator that reads the table
  TableKind kind;
  int taps;
  int inputs;   // input channels per tap; 1 in depthwise tables, where column c reads channel c
  int outputs;  // real output columns
  float fixed_scale;  // the scale of every column; 0 where each column has its own, or none
  size_t offset = 0;  // of the table's first byte in the packed model

  constexpr bool HasScales() const { return kind != TableKind::kPlainGemm; }
  constexpr int BlockColumns() const { return kind == TableKind::kDepthwise ? 16 : 8; }
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

inline constexpr size_t kTableCount = 12;
inline constexpr size_t kModelBytes = 86000;

constexpr std::array<TableLayout, kTableCount> MakeTables() {
  std::array<TableLayout, kTableCount> tables = {{
      {"w0", 0, TableKind::kDepthwise, 3, 1, 48, 0.0076417988f},
      {"w1", 1, TableKind::kGemm, 1, 48, 60, 0},
      {"w3", 3, TableKind::kDepthwise, 3, 1, 60, 0.0058224415f},
      {"w4", 4, TableKind::kGemm, 1, 60, 60, 0},
      {"w6", 6, TableKind::kIndirectGemm, 3, 60, 60, 0},
      {"w8", 8, TableKind::kIndirectGemm, 3, 60, 60, 0},
      {"w10", 10, TableKind::kIndirectGemm, 3, 60, 60, 0},
      {"w12", 12, TableKind::kIndirectGemm, 3, 60, 60, 0},
      {"w13", 13, TableKind::kIndirectGemm, 3, 60, 60, 0},
      {"w15", 15, TableKind::kIndirectGemm, 3, 60, 60, 0},
      {"w17", 17, TableKind::kPlainGemm, 1, 60, 64, 0},
      {"w18", 18, TableKind::kPlainGemm, 1, 64, 5, 0},
  }};
  size_t offset = 0;
  for (TableLayout& table : tables) {
    table.offset = offset;
    offset += table.Bytes();
  }
  return tables;
}

inline constexpr std::array<TableLayout, kTableCount> kTables = MakeTables();
static_assert(kTables.back().offset + kTables.back().Bytes() == kModelBytes);

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
