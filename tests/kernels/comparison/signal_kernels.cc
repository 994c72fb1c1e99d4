#include "signal_kernels.h"

#include "comparison.h"

#define QZ_TEXTS(texts, name)              \
  extern "C" decltype(name) name##__plain; \
  constexpr Texts texts { name, name##__plain }

namespace {

template <typename Function>
struct Texts {
  Function* running;
  Function* plain;
};
template <typename Function>
Texts(Function*, Function*) -> Texts<Function>;

QZ_TEXTS(kWindow, orra_s16_window_shift12_ukernel__neon_x32);
QZ_TEXTS(kPeak, orra_s16_rmaxabs_ukernel__neon_x32);
QZ_TEXTS(kLeftShift, orra_i16_vlshift_ukernel__neon_x32);
QZ_TEXTS(kFirstStage, orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4);
QZ_TEXTS(kSecondStage, orra_cs16_bfly4_samples4_ukernel__neon);
QZ_TEXTS(kLaterStage, orra_cs16_bfly4_ukernel__neon_x4);
QZ_TEXTS(kSplit, orra_cs16_fftr_ukernel__asm_aarch32_neon_x4);
QZ_TEXTS(kPower, orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8);
QZ_TEXTS(kFilterbank, orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2);
QZ_TEXTS(kSquareRoot, orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1);
QZ_TEXTS(kSubtraction, orra_u32_filterbank_subtract_ukernel__scalar_x2);
QZ_TEXTS(kLogarithm, orra_u32_vlog_ukernel__scalar_x1);

}  // namespace

namespace qz::test {
namespace {

size_t Pick(Random& random, size_t low, size_t high) {
  return static_cast<size_t>(random.Between(static_cast<int64_t>(low), static_cast<int64_t>(high)));
}

// A shaped fill, or values most of which are at either extreme, in no order.
std::vector<int16_t> Samples(Random& random, size_t count) {
  if (random.Next() % 2) return ShapedFill<int16_t>(random, count);
  std::vector<int16_t> samples = random.Fill<int16_t>(count, -32768, 32767);
  for (int16_t& x : samples) {
    if (random.Next() % 4) x = random.Next() % 2 ? 32767 : -32768;
  }
  return samples;
}

// `values` bits of any number up to all, so that every magnitude comes up.
template <typename T>
std::vector<T> Magnitudes(Random& random, size_t count) {
  std::vector<T> values(count);
  for (T& value : values) value = static_cast<T>(random.Next()) >> random.Next() % (8 * sizeof(T));
  return values;
}

std::string CompareWindow(Random& random) {
  const size_t rows = Pick(random, 1, 3), count = Pick(random, 1, 70);
  const Input<int16_t> in(random, Samples(random, rows * count), 0);
  const Input<int16_t> weights(random, Samples(random, count), 0);
  Outputs<int16_t> out(random, rows * count);
  const uint32_t shift = static_cast<uint32_t>(random.Next() % 40);
  kWindow.running(rows, 2 * count, in.data(), weights.data(), out.running(), shift);
  kWindow.plain(rows, 2 * count, in.data(), weights.data(), out.plain(), shift);
  return WithArguments(out.Difference(), {{"rows", rows}, {"count", count}});
}

std::string ComparePeak(Random& random) {
  const size_t count = Pick(random, 1, 70);
  const Input<int16_t> in(random, Samples(random, count), 0);
  Outputs<uint16_t> out(random, 1);
  kPeak.running(2 * count, in.data(), out.running());
  kPeak.plain(2 * count, in.data(), out.plain());
  return WithArguments(out.Difference(), {{"count", count}});
}

// The output lies `lead` samples before the input: from the same place to clear of it.
std::string CompareLeftShift(Random& random) {
  const size_t count = Pick(random, 1, 70), lead = Pick(random, 0, random.Next() % 2 ? 9 : 80);
  const auto shift = static_cast<uint32_t>(Pick(random, 0, random.Next() % 8 ? 15 : 300));
  Outputs<int16_t> data(random, Samples(random, lead + count));
  kLeftShift.running(count, data.running() + lead, data.running(), shift);
  kLeftShift.plain(count, data.plain() + lead, data.plain(), shift);
  return WithArguments(data.Difference(), {{"count", count}, {"lead", lead}, {"shift", shift}});
}

std::string CompareFirstStage(Random& random) {
  const size_t butterflies = Pick(random, 1, 20);
  Outputs<int16_t> data(random, Samples(random, 8 * butterflies));
  kFirstStage.running(butterflies, 0, data.running(), nullptr, 0);
  kFirstStage.plain(butterflies, 0, data.plain(), nullptr, 0);
  return WithArguments(data.Difference(), {{"butterflies", butterflies}});
}

std::string CompareSecondStage(Random& random) {
  const size_t groups = Pick(random, 1, 6);
  Outputs<int16_t> data(random, Samples(random, 32 * groups));
  kSecondStage.running(groups, 16, data.running(), nullptr, 0);
  kSecondStage.plain(groups, 16, data.plain(), nullptr, 0);
  return WithArguments(data.Difference(), {{"groups", groups}});
}

std::string CompareLaterStage(Random& random) {
  const size_t groups = Pick(random, 1, 5), quarter = 4 * Pick(random, 1, 8);
  const size_t stride = Pick(random, 1, 5);
  const auto twiddle_values = Samples(random, 2 * (3 * (quarter - 1) * stride + 1));
  const Input<int16_t> twiddles(random, twiddle_values, 0);
  Outputs<int16_t> data(random, Samples(random, 8 * groups * quarter));
  kLaterStage.running(groups, 4 * quarter, data.running(), twiddles.data(), 4 * stride);
  kLaterStage.plain(groups, 4 * quarter, data.plain(), twiddles.data(), 4 * stride);
  return WithArguments(data.Difference(),
                       {{"groups", groups}, {"quarter", quarter}, {"stride", stride}});
}

std::string CompareSplit(Random& random) {
  const size_t count = 8 * Pick(random, 1, 12);
  const Input<int16_t> twiddles(random, Samples(random, count), 0);
  Outputs<int16_t> data(random, Samples(random, 2 * (count + 1)));
  kSplit.running(count, data.running(), twiddles.data());
  kSplit.plain(count, data.plain(), twiddles.data());
  return WithArguments(data.Difference(), {{"count", count}});
}

std::string ComparePower(Random& random) {
  const size_t count = Pick(random, 1, 40);
  const Input<int16_t> in(random, Samples(random, 2 * count), 0);
  Outputs<uint32_t> out(random, count);
  kPower.running(4 * count, in.data(), out.running());
  kPower.plain(4 * count, in.data(), out.plain());
  return WithArguments(out.Difference(), {{"count", count}});
}

std::string CompareFilterbank(Random& random) {
  const size_t rows = Pick(random, 1, 8);
  const auto width_values =
      random.Fill<uint8_t>(rows + 1, 1, random.Next() % 8 ? random.Between(1, 9) : 255);
  size_t bins = 0;
  for (const uint8_t width : width_values) bins += width;
  const Input<uint8_t> widths(random, width_values, 0);
  const Input<uint32_t> in(random, ShapedFill<uint32_t>(random, bins), 0);
  const Input<uint16_t> weights(random, ShapedFill<uint16_t>(random, 2 * bins), 0);
  Outputs<uint64_t> out(random, rows);
  kFilterbank.running(rows, in.data(), widths.data(), weights.data(), out.running());
  kFilterbank.plain(rows, in.data(), widths.data(), weights.data(), out.plain());
  return WithArguments(out.Difference(), {{"rows", rows}, {"bins", bins}});
}

std::string CompareSquareRoot(Random& random) {
  const size_t count = Pick(random, 1, 9);
  const auto shift = static_cast<uint32_t>(Pick(random, 0, 40));
  const Input<uint64_t> in(random, Magnitudes<uint64_t>(random, count), 0);
  Outputs<uint32_t> out(random, count);
  kSquareRoot.running(8 * count, in.data(), out.running(), shift);
  kSquareRoot.plain(8 * count, in.data(), out.plain(), shift);
  return WithArguments(out.Difference(), {{"count", count}, {"shift", shift}});
}

std::string CompareSubtraction(Random& random) {
  const size_t count = 2 * Pick(random, 1, 9);
  const auto f = Magnitudes<uint32_t>(random, 5);
  const auto scale_bits = static_cast<uint32_t>(Pick(random, 0, 31));
  const auto fraction_bits = static_cast<uint32_t>(Pick(random, 0, 63));
  const Input<uint32_t> in(random, Magnitudes<uint32_t>(random, count), 0);
  Outputs<uint32_t> noise(random, Magnitudes<uint32_t>(random, count)), out(random, count);
  kSubtraction.running(count, in.data(), f[0], f[1], f[2], f[3], f[4], scale_bits, fraction_bits,
                       noise.running(), out.running());
  kSubtraction.plain(count, in.data(), f[0], f[1], f[2], f[3], f[4], scale_bits, fraction_bits,
                     noise.plain(), out.plain());
  return WithArguments(
      noise.Difference() + out.Difference(),
      {{"count", count}, {"scale_bits", scale_bits}, {"fraction_bits", fraction_bits}});
}

std::string CompareLogarithm(Random& random) {
  const size_t count = Pick(random, 0, 9);
  const auto shift = static_cast<uint32_t>(Pick(random, 0, 40));
  const auto scale = static_cast<uint32_t>(Pick(random, 0, 5000));
  const Input<uint32_t> in(random, Magnitudes<uint32_t>(random, count), 0);
  Outputs<uint16_t> out(random, count);
  kLogarithm.running(count, in.data(), shift, scale, out.running());
  kLogarithm.plain(count, in.data(), shift, scale, out.plain());
  return WithArguments(out.Difference(), {{"count", count}, {"shift", shift}, {"scale", scale}});
}

// One call as the front end makes it. Only the scalar kernels' counts depend on the values.
int16_t samples[514];
int16_t table[2 * 256];
uint16_t weights[2 * 237];
uint32_t levels[237];
uint64_t energies[48];
uint16_t features[48];
// The segments of the front end's filterbank.
constexpr uint8_t kWidths[49] = {1, 1, 2, 1, 2, 1, 2, 2, 1, 2,  2,  2,  3,  2,  2, 3, 2,
                                 3, 3, 3, 4, 3, 3, 4, 4, 4, 4,  5,  5,  5,  5,  5, 6, 6,
                                 6, 7, 7, 7, 7, 8, 9, 8, 9, 10, 10, 11, 11, 11, 13};

template <decltype(kWindow.running) kKernel>
void RunWindow() {
  kKernel(1, 800, samples, table, samples, 12);
}

template <decltype(kPeak.running) kKernel>
void RunPeak() {
  kKernel(800, samples, features);
}

template <decltype(kLeftShift.running) kKernel>
void RunLeftShift() {
  kKernel(400, samples, table, 3);
}

template <decltype(kFirstStage.running) kKernel>
void RunFirstStage() {
  kKernel(4, 0, samples, nullptr, 0);
}

template <decltype(kSecondStage.running) kKernel>
void RunSecondStage() {
  kKernel(4, 16, samples, nullptr, 0);
}

// Both calls of a frame.
template <decltype(kLaterStage.running) kKernel>
void RunLaterStages() {
  kKernel(4, 64, samples, table, 16);
  kKernel(1, 256, samples, table, 4);
}

template <decltype(kSplit.running) kKernel>
void RunSplit() {
  kKernel(256, samples, table);
}

template <decltype(kPower.running) kKernel>
void RunPower() {
  kKernel(948, samples, levels);
}

template <decltype(kFilterbank.running) kKernel>
void RunFilterbank() {
  kKernel(48, levels, kWidths, weights, energies);
}

template <decltype(kSquareRoot.running) kKernel>
void RunSquareRoot() {
  for (uint64_t& energy : energies) energy = 1;
  kKernel(sizeof energies, energies, levels, 3);
}

template <decltype(kSubtraction.running) kKernel>
void RunSubtraction() {
  kKernel(48, levels, 655, 655, 15729, 15729, 819, 0, 14, levels + 48, levels + 96);
}

template <decltype(kLogarithm.running) kKernel>
void RunLogarithm() {
  for (uint32_t& level : levels) level = 1;
  kKernel(48, levels, 3, 16, features);
}

}  // namespace

std::vector<Kernel> SignalKernels() {
  return {
      QZ_KERNEL(orra_s16_window_shift12_ukernel__neon_x32, "window", CompareWindow, RunWindow),
      QZ_KERNEL(orra_s16_rmaxabs_ukernel__neon_x32, "peak", ComparePeak, RunPeak),
      QZ_KERNEL(orra_i16_vlshift_ukernel__neon_x32, "left_shift", CompareLeftShift, RunLeftShift),
      QZ_KERNEL(orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4, "fft_butterflies",
                CompareFirstStage, RunFirstStage),
      QZ_KERNEL(orra_cs16_bfly4_samples4_ukernel__neon, "fft_butterflies", CompareSecondStage,
                RunSecondStage),
      QZ_KERNEL(orra_cs16_bfly4_ukernel__neon_x4, "fft_butterflies", CompareLaterStage,
                RunLaterStages),
      QZ_KERNEL(orra_cs16_fftr_ukernel__asm_aarch32_neon_x4, "fft_real_split", CompareSplit,
                RunSplit),
      QZ_KERNEL(orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8, "power_spectrum", ComparePower,
                RunPower),
      QZ_KERNEL(orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2, "filterbank",
                CompareFilterbank, RunFilterbank),
      QZ_KERNEL(orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1, "square_root",
                CompareSquareRoot, RunSquareRoot),
      QZ_KERNEL(orra_u32_filterbank_subtract_ukernel__scalar_x2, "noise_subtraction",
                CompareSubtraction, RunSubtraction),
      QZ_KERNEL(orra_u32_vlog_ukernel__scalar_x1, "logarithm", CompareLogarithm, RunLogarithm),
  };
}

}  // namespace qz::test
