// SPDX-License-Identifier: Apache-2.0
// Links the front end into a program of another project, and runs one frame of silence.

#include <algorithm>
#include <cstdio>

#include "config/detector.h"
#include "frontend/audio_frontend.h"

int main() {
  audio_frontend_reset();
  std::fill_n(audio_frontend_input_ptr, qz::config::kFrameSamples, int16_t{0});
  audio_frontend_invoke();
  std::printf("%d\n", audio_frontend_output_ptr[0]);
}
