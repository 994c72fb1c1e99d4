// SPDX-License-Identifier: Apache-2.0
#include "network/stream_network.h"

#include "network/stream_engine.h"

namespace qz::network {
namespace {

struct Unobserved {
  template <typename Value>
  void operator()(size_t, const Value*, size_t) const {}
};

}  // namespace

template <size_t kTileRows>
bool Push(const int8_t* frame, const Weights& weights, Stream<kTileRows>* stream) {
  return PushFrames(frame, 1, weights, stream).scores;
}

template <size_t kTileRows>
Pushed PushFrames(const int8_t* frames, size_t count, const Weights& weights,
                  Stream<kTileRows>* stream) {
  return StreamEngine(weights, stream, Unobserved()).PushFrames(frames, count);
}

template bool Push(const int8_t*, const Weights&, Stream<kDeviceTileRows>*);
template bool Push(const int8_t*, const Weights&, Stream<kChunkTileRows>*);
template Pushed PushFrames(const int8_t*, size_t, const Weights&, Stream<kDeviceTileRows>*);
template Pushed PushFrames(const int8_t*, size_t, const Weights&, Stream<kChunkTileRows>*);

}  // namespace qz::network
