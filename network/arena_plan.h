// Where the network's tensors lie, and the row lists by which kernels find their rows there.
// Tensors are int8, row-major without gaps: rows are time steps. A tensor's place is free again as
// soon as its one reader has run.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

namespace qz {

struct Tensor {
  size_t offset;  // in the arena
  size_t rows;
  size_t channels;

  constexpr size_t Bytes() const { return rows * channels; }
  constexpr size_t End() const { return offset + Bytes(); }
};

constexpr size_t kArenaBytes = 41040;

// Bytes kept readable behind the arena: kernels for some processors load 16 bytes at a time, and
// operator 2 pools a tensor that ends where the arena does. The plain kernels read none of them.
constexpr size_t kReadAheadBytes = 16;

// The outputs of operators 0 to 18, in the order in which they run.
constexpr Tensor kInput{18240, 382, 48};
constexpr Tensor kOut0{0, 380, 48};
constexpr Tensor kOut1{18240, 380, 60};
constexpr Tensor kOut2{0, 190, 60};
constexpr Tensor kOut3{11408, 188, 60};
constexpr Tensor kOut4{22688, 188, 60};
constexpr Tensor kOut5{0, 94, 60};
constexpr Tensor kOut6{5648, 92, 60};
constexpr Tensor kOut7{11168, 46, 60};
constexpr Tensor kOut8{13936, 44, 60};
constexpr Tensor kOut9{16576, 22, 60};
constexpr Tensor kOut10{17904, 20, 60};
constexpr Tensor kOut11{19104, 10, 60};
constexpr Tensor kOut12{19712, 8, 60};
constexpr Tensor kOut13{20192, 6, 60};
constexpr Tensor kOut14{20560, 3, 60};
constexpr Tensor kOut15{0, 1, 60};
constexpr Tensor kOut17{64, 1, 64};
constexpr Tensor kOut18{18272, 1, 5};
constexpr Tensor kScores{18240, 1, 5 * sizeof(float)};

constexpr bool PlanHolds() {
  const Tensor plan[] = {kInput, kOut0,  kOut1,  kOut2,  kOut3,  kOut4,  kOut5,
                         kOut6,  kOut7,  kOut8,  kOut9,  kOut10, kOut11, kOut12,
                         kOut13, kOut14, kOut15, kOut17, kOut18, kScores};
  const Tensor* before = nullptr;
  for (const Tensor& tensor : plan) {
    if (tensor.offset % 16 != 0 || tensor.End() > kArenaBytes) return false;
    if (before && before->End() > tensor.offset && tensor.End() > before->offset) return false;
    before = &tensor;
  }
  return true;
}
static_assert(PlanHolds(),
              "every tensor aligned, inside the arena and apart from its operator's input");

constexpr size_t kConvolutionTaps = 3;
constexpr size_t kRowsPerTile = 4;
constexpr size_t kTileEntries = kConvolutionTaps * kRowsPerTile;

// Depthwise convolution: one address a row. Output row j uses entries j, j + 1 and j + 2.
template <size_t kRows>
constexpr std::array<const int8_t*, kRows> RowList(const int8_t* arena, Tensor in) {
  std::array<const int8_t*, kRows> list{};
  for (size_t row = 0; row < kRows; ++row) list[row] = arena + in.offset + row * in.channels;
  return list;
}

// Convolution: for each tile of 4 output rows, the addresses of the rows that tap 0 meets, then
// those of taps 1 and 2. In a last tile of fewer rows the missing ones repeat the last.
template <size_t kTiles>
constexpr std::array<const int8_t*, kTiles * kTileEntries> TileList(const int8_t* arena,
                                                                    Tensor in) {
  std::array<const int8_t*, kTiles * kTileEntries> list{};
  const size_t last_row = in.rows - kConvolutionTaps;
  for (size_t i = 0; i < list.size(); ++i) {
    const size_t out_row = i / kTileEntries * kRowsPerTile + i % kRowsPerTile;
    const size_t tap = i % kTileEntries / kRowsPerTile;
    const size_t row = (out_row < last_row ? out_row : last_row) + tap;
    list[i] = arena + in.offset + row * in.channels;
  }
  return list;
}

// Max pool of neighbouring rows: offsets from the pooled tensor's first byte. Output row p uses
// entries 2p and 2p + 1.
template <size_t kRows>
constexpr std::array<uintptr_t, kRows> OffsetList(Tensor in) {
  std::array<uintptr_t, kRows> list{};
  for (size_t row = 0; row < kRows; ++row) list[row] = row * in.channels;
  return list;
}

}  // namespace qz
