// A folder for the files of one test, removed with it; and how to fill it.
#pragma once

#include <gtest/gtest.h>
#include <sndfile.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

namespace qz::test {

class TemporaryFolder {
 public:
  TemporaryFolder() {
    std::string path = (std::filesystem::temp_directory_path() / "qz-test-XXXXXX").string();
    if (mkdtemp(path.data()) == nullptr) std::abort();
    path_ = path;
  }
  TemporaryFolder(const TemporaryFolder&) = delete;
  TemporaryFolder& operator=(const TemporaryFolder&) = delete;
  ~TemporaryFolder() { std::filesystem::remove_all(path_); }

  std::string Path(const std::string& name) const { return (path_ / name).string(); }

  // Each writes a file and gives its path.
  std::string WriteBytes(const std::string& name, const std::string& bytes) const {
    std::ofstream(Path(name), std::ios::binary) << bytes;
    return Path(name);
  }
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
    if (file == nullptr) std::abort();
    const auto count = static_cast<sf_count_t>(samples.size());
    if constexpr (std::is_same_v<T, float>) {
      EXPECT_EQ(sf_write_float(file, samples.data(), count), count);
    } else {
      EXPECT_EQ(sf_write_short(file, samples.data(), count), count);
    }
    sf_close(file);
    return Path(name);
  }

 private:
  std::filesystem::path path_;
};

}  // namespace qz::test
