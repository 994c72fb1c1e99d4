// SPDX-License-Identifier: Apache-2.0
// A folder with sound files.
#pragma once

#include <gtest/gtest.h>
#include <sndfile.h>

#include <string>
#include <vector>

#include "tests/support/temporary_folder.h"

namespace qz::test {

// Each function writes a file and gives its path.
class SoundFolder : public TemporaryFolder {
 public:
  std::string WriteRaw(const std::string& name, const std::vector<int16_t>& samples) const {
    return WriteBytes(name, {reinterpret_cast<const char*>(samples.data()), samples.size() * 2});
  }
  // A sound file in any of libsndfile's formats, of int16_t or float.
  template <typename T>
  std::string WriteSound(const std::string& name, int format, int rate_hz, int channels,
                         const std::vector<T>& samples) const {
    SF_INFO info = {};
    info.samplerate = rate_hz;
    info.channels = channels;
    info.format = format;
    SNDFILE* file = sf_open(Path(name).c_str(), SFM_WRITE, &info);
    const auto count = static_cast<sf_count_t>(samples.size());
    if constexpr (std::is_same_v<T, float>) {
      EXPECT_EQ(sf_write_float(file, samples.data(), count), count);
    } else {
      EXPECT_EQ(sf_write_short(file, samples.data(), count), count);
    }
    sf_close(file);
    return Path(name);
  }
};

}  // namespace qz::test
