// SPDX-License-Identifier: Apache-2.0
// The network on a stream of frames against whole windows of the same frames.

#include "network/stream_network.h"

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "model/check_weights.h"
#include "model/synthetic_features.h"
#include "model/synthetic_model.h"
#include "network/network.h"
#include "network/stream_engine.h"
#include "tests/support/random.h"

namespace qz::test {
namespace {

using config::kFeatureChannels;
using config::kFramesBetweenRuns;
using config::kOperatorCount;
using config::kOperators;
using config::kWindowFrames;
using network::Stream;
using Bytes = std::vector<int8_t>;
using Scores = std::array<float, config::kClasses>;
using DeviceStream = Stream<network::kDeviceTileRows>;
using ChunkStream = Stream<network::kChunkTileRows>;

constexpr size_t kRuns = 56;
constexpr size_t kFrames = kWindowFrames + (kRuns - 1) * kFramesBetweenRuns;

// Made once.
const model::PackedModel& SyntheticModel(uint64_t seed) {
  static std::map<uint64_t, model::PackedModel> models;
  model::PackedModel& made = models[seed];
  if (made.empty()) made = model::MakeSyntheticModel(seed);
  return made;
}

// Valid, and driven to the ends of every range: shaped weights, any biases and scales.
model::PackedModel ExtremeModel(uint64_t seed) {
  Random random(seed);
  model::PackedModel packed = SyntheticModel(1);
  for (const config::TableLayout& table : config::kTables) {
    for (int column = 0; column < table.outputs; ++column) {
      const int inputs = table.taps * table.inputs;
      const Bytes weights = ShapedFill<int8_t>(random, static_cast<uint32_t>(inputs), -127, 127);
      int32_t bias = 0;
      for (int i = 0; i < inputs; ++i) {
        const int8_t weight = weights[static_cast<size_t>(i)];
        bias += 128 * weight;
        model::Store(packed, table.WeightOffset(i / table.inputs, i % table.inputs, column),
                     weight);
      }
      const auto bits = static_cast<int>(random.Between(0, 31));
      const int64_t any = random.Between(INT32_MIN, INT32_MAX) >> bits;
      model::Store(packed, table.BiasOffset(column),
                   table.IsDepthwise() ? bias : static_cast<int32_t>(any));
      if (!table.HasScales() || table.IsDepthwise()) continue;
      const float scales[] = {0.0f, 1e30f, 1e-40f, 0x1p-10f, 0x1p-14f, 0x1p-16f, 0x1.8p-12f};
      model::Store(packed, table.ScaleOffset(column), scales[random.Next() % std::size(scales)]);
    }
  }
  EXPECT_EQ(model::CheckWeights(packed), std::vector<std::string>());
  return packed;
}

// Frames one after another: windows like those of audio, or shaped values.
Bytes Frames(uint64_t seed) {
  Random random(seed);
  Bytes frames;
  frames.reserve((kFrames + kWindowFrames) * kFeatureChannels);
  while (frames.size() < kFrames * kFeatureChannels) {
    const model::Tensor window = model::SyntheticWindow(seed * 1000 + frames.size());
    const Bytes shaped = ShapedFill<int8_t>(random, window.values.size());
    const Bytes& next = seed % 3 == 0 ? shaped : window.values;
    frames.insert(frames.end(), next.begin(), next.end());
  }
  frames.resize(kFrames * kFeatureChannels);
  return frames;
}

// Every operator's rows over a whole stream, and the scores of every run.
struct Record {
  std::array<Bytes, kOperatorCount> rows;
  std::vector<Scores> scores;
};

// Over whole windows. Rows that windows share are checked to be the same, and kept once.
Record RecordWindows(const Bytes& frames, const network::Weights& weights) {
  Record record;
  const auto arena = std::make_unique<network::Arena>();
  for (size_t run = 0; run < kRuns; ++run) {
    std::copy_n(&frames[run * kFramesBetweenRuns * kFeatureChannels],
                kWindowFrames * kFeatureChannels, network::InputOf(*arena));
    for (size_t op = 0; op < kOperatorCount; ++op) {
      network::RunOperator(op, *arena, weights);
      const config::Tensor& output = kOperators[op].output;
      const int8_t* values = network::BytesOf(*arena, output);
      const size_t row_bytes = output.Bytes() / output.rows;
      const size_t first = run * kFramesBetweenRuns / kOperators[op].frame_step * row_bytes;
      Bytes& rows = record.rows[op];
      EXPECT_TRUE(std::equal(rows.begin() + static_cast<ptrdiff_t>(first), rows.end(), values))
          << "run " << run << ", operator " << op;
      rows.resize(first);
      rows.insert(rows.end(), values, values + output.Bytes());
    }
    std::copy_n(network::ScoresOf(*arena), config::kClasses, record.scores.emplace_back().begin());
  }
  return record;
}

// A stream whose operators are observed, and one as others use it, whose scores are recorded.
template <size_t kTileRows>
class Recorder {
 public:
  explicit Recorder(const network::Weights& weights) : weights_(weights) {}

  void Push(const int8_t* frames, size_t count) {
    while (count > 0) {
      const network::Pushed pushed = engine().PushFrames(frames, count);
      const network::Pushed same = network::PushFrames(frames, count, weights_, unobserved_.get());
      ASSERT_EQ(pushed.frames, same.frames);
      ASSERT_EQ(pushed.scores, same.scores);
      frames += pushed.frames * kFeatureChannels;
      count -= pushed.frames;
      frames_ += pushed.frames;
      ASSERT_EQ(pushed.scores,
                frames_ >= kWindowFrames && (frames_ - kWindowFrames) % kFramesBetweenRuns == 0)
          << "after frame " << frames_;
      // Computed in other steps, and the same: what is kept of every stage.
      ASSERT_TRUE(damaged_ ||
                  std::equal(stream_->bytes, stream_->bytes + Stream<kTileRows>::kRowBytes,
                             unobserved_->bytes));
      if (!pushed.scores) continue;
      std::copy_n(unobserved_->scores, config::kClasses, record_.scores.emplace_back().begin());
    }
  }

  const Record& record() const { return record_; }
  void FlipBit(size_t byte) {
    stream_->bytes[byte] ^= INT8_MIN;
    damaged_ = true;
  }

 private:
  auto engine() {
    return network::StreamEngine(
        weights_, stream_.get(), [this](size_t op, const auto* rows, size_t count) {
          const auto* bytes = reinterpret_cast<const int8_t*>(rows);
          const size_t size = count * kOperators[op].channels * sizeof *rows;
          Bytes& all = record_.rows[op];
          all.insert(all.end(), bytes, bytes + size);
        });
  }

  const network::Weights& weights_;
  std::unique_ptr<Stream<kTileRows>> stream_ = std::make_unique<Stream<kTileRows>>();
  std::unique_ptr<Stream<kTileRows>> unobserved_ = std::make_unique<Stream<kTileRows>>();
  Record record_;
  size_t frames_ = 0;
  bool damaged_ = false;
};

// Empty, or the first operator whose rows differ, or the scores.
std::string Difference(const Record& expected, const Record& stream) {
  for (size_t op = 0; op < kOperatorCount; ++op) {
    const Bytes& rows = stream.rows[op];
    const auto at =
        std::mismatch(rows.begin(), rows.end(), expected.rows[op].begin(), expected.rows[op].end());
    if (at.first == rows.end() && at.second == expected.rows[op].end()) continue;
    return "operator " + std::to_string(op) + ", byte " + std::to_string(at.first - rows.begin());
  }
  return stream.scores == expected.scores ? "" : "scores";
}

template <size_t kTileRows>
std::string DifferenceInChunks(const Record& expected, const Bytes& frames,
                               const network::Weights& weights, size_t max_chunk) {
  Random random(max_chunk);
  Recorder<kTileRows> recorder(weights);
  for (size_t frame = 0; frame < kFrames;) {
    const size_t count = std::min(random.Pick(1, max_chunk), kFrames - frame);
    recorder.Push(&frames[frame * kFeatureChannels], count);
    if (testing::Test::HasFatalFailure()) return "cadence";
    frame += count;
  }
  return Difference(expected, recorder.record());
}

TEST(StreamNetwork, EqualsWholeWindowsRowByRow) {
  size_t different_scores = 0;
  for (uint64_t seed = 1; seed <= 8; ++seed) {
    const model::PackedModel packed = seed <= 3 ? SyntheticModel(seed) : ExtremeModel(seed);
    const network::Weights weights = network::WeightsOf(packed.data());
    const Bytes frames = Frames(seed);
    const Record windows = RecordWindows(frames, weights);
    ASSERT_EQ(windows.scores.size(), kRuns);
    different_scores += windows.scores.front() != windows.scores.back() ? 1 : 0;
    ASSERT_EQ(DifferenceInChunks<network::kDeviceTileRows>(windows, frames, weights, 1), "")
        << "model " << seed;
    ASSERT_EQ(DifferenceInChunks<network::kDeviceTileRows>(windows, frames, weights, 200), "")
        << "model " << seed;
    ASSERT_EQ(DifferenceInChunks<network::kChunkTileRows>(windows, frames, weights, 200), "")
        << "model " << seed;
  }
  EXPECT_GE(different_scores, 2u) << "scores that do not vary test little";
}

TEST(StreamNetwork, StreamsDoNotTouchEachOther) {
  constexpr size_t kStreams = 8;
  const network::Weights weights = network::WeightsOf(SyntheticModel(1).data());
  std::vector<Bytes> frames;
  std::vector<std::vector<Scores>> expected, scores(kStreams);
  frames.reserve(kStreams);
  expected.reserve(kStreams);
  for (uint64_t i = 0; i < kStreams; ++i) {
    frames.push_back(Frames(i + 1));
    expected.push_back(RecordWindows(frames.back(), weights).scores);
  }
  std::array<DeviceStream, kStreams> streams{};
  std::array<size_t, kStreams> next{};
  Random random(1);
  for (size_t pushed = 0; pushed < kStreams * kFrames;) {
    const size_t i = random.Next() % kStreams;
    if (next[i] == kFrames) continue;
    ++pushed;
    if (!network::Push(&frames[i][next[i]++ * kFeatureChannels], weights, &streams[i])) continue;
    std::copy_n(streams[i].scores, config::kClasses, scores[i].emplace_back().begin());
  }
  EXPECT_EQ(scores, expected);
}

// A flipped bit shows in the rows of later operators, but no longer than the frames under it are
// seen.
TEST(StreamNetwork, ADamagedRowIsGoneAfterAWindow) {
  const network::Weights weights = network::WeightsOf(SyntheticModel(1).data());
  const Bytes frames = Frames(1);
  const Record expected = RecordWindows(frames, weights);
  for (size_t stage = 0; stage < network::kStageCount; ++stage) {
    Recorder<network::kDeviceTileRows> recorder(weights);
    constexpr size_t kBefore = kWindowFrames + 3 * kFramesBetweenRuns;
    recorder.Push(frames.data(), kBefore);
    const std::array<Bytes, kOperatorCount> before = recorder.record().rows;
    recorder.FlipBit(DeviceStream::kStages[stage].offset + 7);
    constexpr size_t kSeen = (kWindowFrames / kFramesBetweenRuns + 1) * kFramesBetweenRuns;
    for (size_t frame = kBefore; frame < kFrames; ++frame) {
      // Only what is observed: the other stream's scores stay as they are.
      recorder.Push(&frames[frame * kFeatureChannels], 1);
    }
    EXPECT_NE(Difference(expected, recorder.record()), "") << "stage " << stage;
    for (size_t op = 0; op < kOperatorCount; ++op) {
      const size_t row_bytes = kOperators[op].output.Bytes() / kOperators[op].output.rows;
      const size_t last = before[op].size() + kSeen / kOperators[op].frame_step * row_bytes;
      const Bytes& rows = recorder.record().rows[op];
      ASSERT_LT(last, rows.size());
      EXPECT_TRUE(std::equal(rows.begin() + static_cast<ptrdiff_t>(last), rows.end(),
                             expected.rows[op].begin() + static_cast<ptrdiff_t>(last)))
          << "stage " << stage << ", operator " << op;
    }
  }
}

// A count of rows that is out of its range stops a build with checks. The device's writes nothing
// outside the state.
TEST(StreamNetwork, ADamagedCountWritesNothingOutside) {
  const network::Weights weights = network::WeightsOf(SyntheticModel(1).data());
  const Bytes frames = Frames(1);
  for (size_t stage = 0; stage < network::kStageCount; ++stage) {
    struct {
      DeviceStream stream;
      std::array<uint8_t, 4096> behind;
    } memory{};
    memory.stream.held[stage] = 0x80;
    const auto push_all = [&] {
      for (size_t i = 0; i < 2 * kWindowFrames; ++i) {
        network::Push(&frames[i * kFeatureChannels], weights, &memory.stream);
      }
    };
#ifdef QZ_WITHOUT_CHECKS
    push_all();
    EXPECT_EQ(memory.behind, (std::array<uint8_t, 4096>{})) << "stage " << stage;
#else
    EXPECT_DEATH(push_all(), "") << "stage " << stage;
#endif
  }
}

// Frames and state end where pages that can't be accessed begin.
TEST(StreamNetwork, ReadsNothingBehindFramesAndState) {
  const network::Weights weights = network::WeightsOf(SyntheticModel(1).data());
  const Bytes frames = Frames(3);
  const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  const auto end_of_pages = [page](size_t bytes) {
    const size_t size = (bytes + page - 1) / page * page;
    void* const pages =
        mmap(nullptr, size + page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    EXPECT_NE(pages, MAP_FAILED);
    auto* const end = static_cast<int8_t*>(pages) + size;
    EXPECT_EQ(mprotect(end, page, PROT_NONE), 0);
    return end - bytes;
  };
  static_assert(offsetof(DeviceStream, bytes) + sizeof(DeviceStream::bytes) == sizeof(DeviceStream),
                "the read-ahead is the last");
  auto* const stream = new (end_of_pages(sizeof(DeviceStream))) DeviceStream{};
  int8_t* const frame = end_of_pages(kFeatureChannels);
  size_t runs = 0;
  for (size_t i = 0; i < kWindowFrames + kFramesBetweenRuns; ++i) {
    std::copy_n(&frames[i * kFeatureChannels], kFeatureChannels, frame);
    runs += network::Push(frame, weights, stream) ? 1 : 0;
  }
  EXPECT_EQ(runs, 2u);
}

}  // namespace
}  // namespace qz::test
