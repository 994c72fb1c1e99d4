// SPDX-License-Identifier: Apache-2.0
// The names of a kernel's implementations.
//
// A kernel is called by the name that its component's header declares. Where the build compiles an
// implementation beside others it defines QZ_VARIANT, and the implementation's name is the kernel's
// name, two underscores and that variant: orra_u32_vlog_ukernel__scalar_x1__avx2. Elsewhere the
// implementation has the kernel's own name.
#pragma once

// NOLINTBEGIN(bugprone-macro-parentheses): names can't be in parentheses.
#ifdef QZ_VARIANT
#define QZ_JOIN_NAME(kernel, variant) kernel##__##variant
#define QZ_JOIN_EXPANDED(kernel, variant) QZ_JOIN_NAME(kernel, variant)
#define QZ_KERNEL_NAME(kernel) QZ_JOIN_EXPANDED(kernel, QZ_VARIANT)
#else
#define QZ_KERNEL_NAME(kernel) kernel
#endif

// Begins the definition of an implementation; parameters and body follow. The declaration in front
// makes parameters that differ from the kernel's an error.
#define QZ_KERNEL(kernel)                             \
  extern "C" decltype(kernel) QZ_KERNEL_NAME(kernel); \
  extern "C" void QZ_KERNEL_NAME(kernel)
// NOLINTEND(bugprone-macro-parentheses)
