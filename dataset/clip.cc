// SPDX-License-Identifier: Apache-2.0
#include "dataset/clip.h"

#include <memory>

#include "audio/audio_input.h"

namespace qz::dataset {

std::vector<int16_t> ReadClip(const std::string& path) {
  constexpr size_t kBlockSamples = 32000;
  const std::unique_ptr<audio::AudioInput> input = audio::OpenAudio(path);
  std::vector<int16_t> samples;
  size_t held = 0;
  size_t got = 0;
  do {
    held += got;
    samples.resize(held + kBlockSamples);
    got = input->Read(samples.data() + held, kBlockSamples);
  } while (got > 0);
  samples.resize(held);
  return samples;
}

}  // namespace qz::dataset
