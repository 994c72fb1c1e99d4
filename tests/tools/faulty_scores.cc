// SPDX-License-Identifier: Apache-2.0
// A network that loses three of its five scores: those that no client is ever told.

#include "network/mobilenet_backend.h"

extern "C" {

decltype(mobilenet_backend_invoke) __real_mobilenet_backend_invoke, __wrap_mobilenet_backend_invoke;

void __wrap_mobilenet_backend_invoke() {
  __real_mobilenet_backend_invoke();
  auto* const scores = const_cast<float*>(mobilenet_backend_output_ptr);
  for (int lost = 0; lost < 5; lost += 2) scores[lost] = 0;
}
}
