// SPDX-License-Identifier: Apache-2.0
// The kernels' implementations on a PC: a struct of function pointers for each kind of processor,
// as kernels/kernel_table.h has them.
#pragma once

#include "kernels/kernel_table.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/signal/signal_kernels.h"

// NOLINTBEGIN(bugprone-macro-parentheses): names can't be in parentheses.
#define QZ_DECLARE(source, title, neon, avx2, avx512vnni, kernel)                              \
  extern "C" decltype(kernel) kernel##__reference, kernel##__reference_avx2, kernel##__##avx2, \
      kernel##__##avx512vnni;
QZ_SIGNAL_KERNELS(QZ_DECLARE)
QZ_QUANTISED_KERNELS(QZ_DECLARE)
#undef QZ_DECLARE

namespace qz {

// A pointer each, of the kernel's name.
#define QZ_POINTER(source, title, neon, avx2, avx512vnni, kernel) decltype(::kernel)* kernel;
struct SignalKernels {
  QZ_SIGNAL_KERNELS(QZ_POINTER)
};
struct QuantisedKernels {
  QZ_QUANTISED_KERNELS(QZ_POINTER)
};
#undef QZ_POINTER

#define QZ_REFERENCE(source, title, neon, avx2, avx512vnni, kernel) kernel##__reference,
#define QZ_AVX2(source, title, neon, avx2, avx512vnni, kernel) kernel##__##avx2,
#define QZ_AVX512VNNI(source, title, neon, avx2, avx512vnni, kernel) kernel##__##avx512vnni,
constexpr SignalKernels kSignalReference = {QZ_SIGNAL_KERNELS(QZ_REFERENCE)};
constexpr SignalKernels kSignalAvx2 = {QZ_SIGNAL_KERNELS(QZ_AVX2)};
constexpr SignalKernels kSignalAvx512Vnni = {QZ_SIGNAL_KERNELS(QZ_AVX512VNNI)};
constexpr QuantisedKernels kQuantisedReference = {QZ_QUANTISED_KERNELS(QZ_REFERENCE)};
constexpr QuantisedKernels kQuantisedAvx2 = {QZ_QUANTISED_KERNELS(QZ_AVX2)};
constexpr QuantisedKernels kQuantisedAvx512Vnni = {QZ_QUANTISED_KERNELS(QZ_AVX512VNNI)};
#undef QZ_REFERENCE
#undef QZ_AVX2
#undef QZ_AVX512VNNI
// NOLINTEND(bugprone-macro-parentheses)

}  // namespace qz
