// SPDX-License-Identifier: Apache-2.0
// The device's stream, frame by frame: all of it that the module links.

#include "network/stream_network.h"

#include "network/stream_engine.h"

namespace qz::network {

template bool Push(const int8_t*, const Weights&, Stream<kDeviceTileRows>*);

}  // namespace qz::network
