// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

// The entry points: reached by the runtime through the info record only.
extern "C" {

// Builds the one AppManager, once; always true.
bool nanoappStart(void);
void nanoappHandleEvent(uint32_t sender_instance_id, uint16_t event_type, const void* event_data);
// Gives the audio back and destroys the AppManager.
void nanoappEnd(void);
}
