// SPDX-License-Identifier: Apache-2.0
// Constant tables of the signal kernels, generated from their rules by make_signal_tables.py.
#pragma once

#include <cstdint>

extern "C" {

// Twiddles of the radix-4 stage whose quarters are 4 entries long: row m - 1, column k holds
// e^(-2 pi j m k / 16) as (real, imaginary), Q15 with 32767 for 1.0.
extern const int16_t vrd_table_fft256_samples4_twiddle[3][4][2];

// Entry i is log2(1 + i/128) - i/128, Q16: what log2 lies above the chord of its octave. It is 0 at
// both ends and largest, 5641, at i = 57.
extern const uint16_t vrd_table_vlog[129];

}  // extern "C"
