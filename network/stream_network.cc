// SPDX-License-Identifier: Apache-2.0
// The device's stream.

#include "network/stream_network.h"

#include "network/stream_engine.h"

namespace qz::network {

template bool Push(const int8_t*, const Weights&, Stream<kDeviceTileRows>*);
template Pushed PushFrames(const int8_t*, size_t, const Weights&, Stream<kDeviceTileRows>*);

}  // namespace qz::network
