// SPDX-License-Identifier: Apache-2.0
// The vendor extension of the runtime that raises the processor clock while a nanoapp has work to
// do.
#ifndef QZ_PLATFORM_CHREX_H_
#define QZ_PLATFORM_CHREX_H_

#include <stdbool.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

// 1 raises the clock, 0 releases it; false when the platform can't. Where there is no such clock, a
// no-op.
bool chrexClockRateChangeRequest(uint32_t request);

#ifdef __cplusplus
}
#endif

#endif  // QZ_PLATFORM_CHREX_H_
