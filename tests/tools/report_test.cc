// The parts of a run that need no nanoapp: buffers cut from a stream, and how reports look.

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <numeric>

#include "buffer_cutter.h"
#include "report_format.h"

namespace qz::tools {
namespace {

TEST(BufferCutterTest, CutsAnyPiecesIntoWholeBuffersAndPadsTheLast) {
  std::vector<int16_t> stream(2 * kBufferSamples + 5000);
  std::iota(stream.begin(), stream.end(), int16_t{1});
  std::vector<int16_t> delivered;
  BufferCutter cutter([&](const int16_t* buffer) {
    delivered.insert(delivered.end(), buffer, buffer + kBufferSamples);
  });
  EXPECT_EQ(cutter.Finish(), 0u);
  for (size_t place = 0; place < stream.size();) {
    const size_t count = std::min({cutter.room_samples(), size_t{777}, stream.size() - place});
    std::copy_n(stream.data() + place, count, cutter.room());
    cutter.Commit(count);
    place += count;
    EXPECT_EQ(delivered.size(), place / kBufferSamples * kBufferSamples);
  }
  EXPECT_EQ(cutter.Finish(), kBufferSamples - 5000);
  stream.resize(3 * kBufferSamples);
  EXPECT_EQ(delivered, stream);
  EXPECT_EQ(cutter.Finish(), 0u);
}

TEST(ReportFormatTest, JsonKeepsEveryBit) {
  const uint64_t time_ns = (uint64_t{1} << 63) + 1;
  const hub::SoundReport report{time_ns, 7, 202208271, {{17, 255.0f / 256}}};
  const auto object = nlohmann::json::parse(MakeJsonFormat()->Detection(0x11, report));
  EXPECT_EQ(object["type"], "detection");
  EXPECT_EQ(object["endpoint"], 0x11);
  EXPECT_EQ(object["timestamp_ns"].get<uint64_t>(), time_ns);
  EXPECT_EQ(object["response_time_ns"], 7);
  EXPECT_EQ(object["model_version"], 202208271);
  EXPECT_EQ(object["results"][0]["category"], 17);
  EXPECT_EQ(object["results"][0]["confidence"].get<double>(), 255.0 / 256);
}

}  // namespace
}  // namespace qz::tools
