// The classifier's network: 382 feature frames in, five class scores out, by one call over static
// memory. One-dimensional convolutions over time shrink 382 time steps to one; two fully connected
// layers and a logistic function make scores of it. About 3.7 million multiply-adds a run.
//
// A run keeps nothing for the next, cannot fail and is not reentrant.
#pragma once

#include <cstdint>

extern "C" {

// Input: int8 [382][48], feature frames 10 ms apart, oldest first; values are front-end features
// minus 128, saturated (zero point -128). A run overwrites it: write all 18336 bytes before each.
extern int8_t* const mobilenet_backend_input_ptr;

// Output: float [5], the scores of classes 0 to 4, each k / 256 with k from 0 to 255. It lies where
// the input begins.
extern const float* const mobilenet_backend_output_ptr;

void mobilenet_backend_invoke(void);

}  // extern "C"
