#include "network/mobilenet_backend.h"

#include <algorithm>

#include "kernels/quantised/quantised_kernels.h"
#include "logistic_table.h"
#include "model_weights.h"
#include "network/arena_plan.h"
#include "network/operators.h"

namespace {

using namespace qz;

// Every tensor is of bytes but the output, which is of floats.
union alignas(16) Arena {
  int8_t bytes[kArenaBytes + kReadAheadBytes];
  float floats[(kArenaBytes + kReadAheadBytes) / sizeof(float)];
};
Arena arena;

constexpr auto ind0 = RowList<kInput.rows>(arena.bytes, kInput);
constexpr auto ind2 = OffsetList<kOut1.rows>(kOut1);
constexpr auto ind3 = RowList<kOut2.rows>(arena.bytes, kOut2);
constexpr auto ind5 = OffsetList<kOut4.rows>(kOut4);
constexpr auto ind6 = TileList<23>(arena.bytes, kOut5);
constexpr auto ind7 = OffsetList<kOut6.rows>(kOut6);
constexpr auto ind8 = TileList<11>(arena.bytes, kOut7);
constexpr auto ind9 = OffsetList<kOut8.rows>(kOut8);
constexpr auto ind10 = TileList<5>(arena.bytes, kOut9);
constexpr auto ind11 = OffsetList<kOut10.rows>(kOut10);
constexpr auto ind12 = TileList<2>(arena.bytes, kOut11);
constexpr auto ind13 = TileList<2>(arena.bytes, kOut12);
constexpr auto ind14 = OffsetList<kOut13.rows>(kOut13);
constexpr auto ind15 = TileList<1>(arena.bytes, kOut14);

constexpr int8_t kMin = -128;
constexpr int8_t kMax = 127;
// Of outputs whose range starts at the real 0, which cuts off what is negative.
constexpr int16_t kFromZero = -128;
constexpr size_t kBlockStride = 8;

int8_t* At(Tensor tensor) { return arena.bytes + tensor.offset; }

void Depthwise(const int8_t* const* in_rows, const void* w, Tensor out, int16_t zero_point) {
  const orra_fp32_requant_params params{zero_point, kMin, kMax};
  orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
      out.channels, out.rows, in_rows, w, At(out), sizeof(const int8_t*), 0, 0, nullptr, &params);
}

void Pointwise(Tensor in, const void* w, Tensor out) {
  const orra_fp32_requant_params params{kFromZero, kMin, kMax};
  for (size_t row = 0; row < out.rows; row += kMaxRows) {
    orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
        std::min(out.rows - row, kMaxRows), out.channels, in.channels, At(in) + row * in.channels,
        in.channels, w, At(out) + row * out.channels, out.channels, kBlockStride, &params);
  }
}

void Convolution(Tensor in, const int8_t* const* in_tiles, const void* w, Tensor out) {
  const orra_fp32_requant_params params{kFromZero, kMin, kMax};
  for (size_t row = 0; row < out.rows; row += kMaxRows) {
    orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
        std::min(out.rows - row, kMaxRows), out.channels, in.channels,
        kTileEntries * sizeof(const int8_t*), in_tiles + row / kRowsPerTile * kTileEntries, w,
        At(out) + row * out.channels, out.channels, kBlockStride, 0, nullptr, &params);
  }
}

void MaxPool(Tensor in, const uintptr_t* in_offsets, Tensor out) {
  constexpr size_t kPoolSize = 2;
  const orra_s8_clamp_params params{kMin, kMax};
  orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
      out.rows, kPoolSize, out.channels, reinterpret_cast<const int8_t* const*>(in_offsets),
      reinterpret_cast<uintptr_t>(At(in)), At(out), 0, 0, &params);
}

void FullyConnected(Tensor in, const void* w, Tensor out, int32_t multiplier, int32_t post_shift,
                    int16_t zero_point) {
  const orra_rndnu_requant_params params{0, multiplier, post_shift, zero_point, kMin, kMax};
  orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
      1, out.channels, in.channels, At(in), in.channels, w, At(out), out.channels, kBlockStride,
      &params);
}

void Logistic(Tensor in_out) {
  uint8_t* bytes = reinterpret_cast<uint8_t*>(At(in_out));
  orra_x8_lut_ukernel__scalar_x2(in_out.channels, bytes, bytes,
                                 reinterpret_cast<const uint8_t*>(w19));
}

void Dequantise(Tensor in, Tensor out) {
  const orra_dequant_params params{{128, 128}, 1.0f / 256};
  orra_qs8_f32_vcvt_ukernel__neon_x32(in.channels, At(in),
                                      arena.floats + out.offset / sizeof(float), &params);
}

}  // namespace

// constexpr, here and of the lists: complete when the module is loaded, with no code run for it.
constexpr int8_t* mobilenet_backend_input_ptr = arena.bytes + kInput.offset;
constexpr const float* mobilenet_backend_output_ptr = arena.floats + kScores.offset / sizeof(float);

namespace qz {

// Operator 16 has nothing to do: the one row left is read as a vector where it lies.
constexpr Operator kOperators[kOperatorCount] = {
    {[] { Depthwise(ind0.data(), w0, kOut0, 15); }, kOut0},
    {[] { Pointwise(kOut0, w1, kOut1); }, kOut1},
    {[] { MaxPool(kOut1, ind2.data(), kOut2); }, kOut2},
    {[] { Depthwise(ind3.data(), w3, kOut3, 36); }, kOut3},
    {[] { Pointwise(kOut3, w4, kOut4); }, kOut4},
    {[] { MaxPool(kOut4, ind5.data(), kOut5); }, kOut5},
    {[] { Convolution(kOut5, ind6.data(), w6, kOut6); }, kOut6},
    {[] { MaxPool(kOut6, ind7.data(), kOut7); }, kOut7},
    {[] { Convolution(kOut7, ind8.data(), w8, kOut8); }, kOut8},
    {[] { MaxPool(kOut8, ind9.data(), kOut9); }, kOut9},
    {[] { Convolution(kOut9, ind10.data(), w10, kOut10); }, kOut10},
    {[] { MaxPool(kOut10, ind11.data(), kOut11); }, kOut11},
    {[] { Convolution(kOut11, ind12.data(), w12, kOut12); }, kOut12},
    {[] { Convolution(kOut12, ind13.data(), w13, kOut13); }, kOut13},
    {[] { MaxPool(kOut13, ind14.data(), kOut14); }, kOut14},
    {[] { Convolution(kOut14, ind15.data(), w15, kOut15); }, kOut15},
    {[] {}, kOut15},
    // The factors 0.0207705330 and 0.0022462329.
    {[] { FullyConnected(kOut15, w17, kOut17, 1427340160, -5, kFromZero); }, kOut17},
    {[] { FullyConnected(kOut17, w18, kOut18, 1234879616, -8, 82); }, kOut18},
    {[] { Logistic(kOut18); }, kOut18},
    {[] { Dequantise(kOut18, kScores); }, kScores},
};

}  // namespace qz

void mobilenet_backend_invoke(void) {
  for (const Operator& each : kOperators) each.run();
}
