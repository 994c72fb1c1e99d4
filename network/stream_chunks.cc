// SPDX-License-Identifier: Apache-2.0
// Frames by the chunk: apart, so that the module does without.

#include "network/stream_engine.h"
#include "network/stream_network.h"

namespace qz::network {

template bool Push(const int8_t*, const Weights&, Stream<kChunkTileRows>*);
template Pushed PushFrames(const int8_t*, size_t, const Weights&, Stream<kDeviceTileRows>*);
template Pushed PushFrames(const int8_t*, size_t, const Weights&, Stream<kChunkTileRows>*);

}  // namespace qz::network
