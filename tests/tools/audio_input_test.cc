// What comes out of sound files of all kinds, and what is said of those that can't be used.

#include "audio_input.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cmath>
#include <limits>
#include <vector>

#include "random.h"
#include "sound_folder.h"

namespace qz::tools {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;

constexpr int kWav16 = SF_FORMAT_WAV | SF_FORMAT_PCM_16;
constexpr int kWavFloat = SF_FORMAT_WAV | SF_FORMAT_FLOAT;
constexpr int kFlac16 = SF_FORMAT_FLAC | SF_FORMAT_PCM_16;

// Odd amounts, so that block borders fall anywhere.
std::vector<int16_t> ReadAll(AudioInput* input) {
  std::vector<int16_t> all;
  std::vector<int16_t> part(1237);
  while (const size_t got = input->Read(part.data(), part.size())) {
    all.insert(all.end(), part.begin(), part.begin() + static_cast<std::ptrdiff_t>(got));
  }
  return all;
}

std::vector<int16_t> ReadFile(const std::string& path, bool raw = false) {
  return ReadAll(OpenAudio(path, raw).get());
}

std::string ErrorOf(const std::string& path, bool raw = false) {
  try {
    ReadFile(path, raw);
  } catch (const AudioError& error) {
    return error.what();
  }
  return "no error";
}

std::vector<int16_t> Tone(double hz, int rate_hz, int seconds, double amplitude) {
  std::vector<int16_t> samples(static_cast<size_t>(rate_hz) * static_cast<size_t>(seconds));
  for (size_t i = 0; i < samples.size(); ++i) {
    const double angle = 2 * M_PI * hz * static_cast<double>(i) / rate_hz;
    samples[i] = static_cast<int16_t>(std::lround(amplitude * std::sin(angle)));
  }
  return samples;
}

// The amplitude of one frequency in samples at 16 kHz.
double AmplitudeAt(double hz, const std::vector<int16_t>& samples) {
  double re = 0;
  double im = 0;
  for (size_t i = 0; i < samples.size(); ++i) {
    const double angle = 2 * M_PI * hz * static_cast<double>(i) / 16000;
    re += samples[i] * std::cos(angle);
    im += samples[i] * std::sin(angle);
  }
  return 2 * std::hypot(re, im) / static_cast<double>(samples.size());
}

class AudioInputTest : public testing::Test {
 protected:
  test::SoundFolder folder_;
};

TEST_F(AudioInputTest, Mono16BitAt16KhzPassesThroughBitForBit) {
  auto samples = test::Random(1).Fill<int16_t>(20001, -32768, 32767);
  EXPECT_EQ(ReadFile(folder_.WriteSound("a.wav", kWav16, 16000, 1, samples)), samples);
  EXPECT_EQ(ReadFile(folder_.WriteSound("a.flac", kFlac16, 16000, 1, samples)), samples);
  EXPECT_EQ(ReadFile(folder_.WriteRaw("a.raw", samples), true), samples);
  EXPECT_EQ(OpenAudio(folder_.Path("a.wav"), false)->Description(),
            folder_.Path("a.wav") + ": 16000 Hz, 1 channel, 16 bits, taken as it is");
}

TEST_F(AudioInputTest, ChannelsAreAveraged) {
  // Three channels: the sum would overflow 16 bits, a choice of one channel would show.
  const std::vector<int16_t> frames = {32767, 32767, 32767, 3, 0, 0, -32768, -32768, -32765};
  const std::string path = folder_.WriteSound("three.wav", kWav16, 16000, 3, frames);
  EXPECT_EQ(ReadFile(path), (std::vector<int16_t>{32767, 1, -32767}));
  EXPECT_THAT(OpenAudio(path, false)->Description(), HasSubstr("3 channels, mixed down to mono"));
}

TEST_F(AudioInputTest, LoudAndFineValuesSaturateAndRoundToEven) {
  const float lsb = 1.0f / 32768;
  const std::string path =
      folder_.WriteSound<float>("f.wav", kWavFloat, 16000, 1,
                                {1.0f, 3e38f, -1.0f, -3e38f, 0.5f * lsb, 1.5f * lsb, -0.6f * lsb});
  EXPECT_EQ(ReadFile(path), (std::vector<int16_t>{32767, 32767, -32768, -32768, 0, 2, -1}));
  EXPECT_THAT(OpenAudio(path, false)->Description(), HasSubstr("rounded to 16 bits"));
}

TEST_F(AudioInputTest, ResamplingKeepsToneLevelAndLength) {
  for (const int rate_hz : {8000, 44100, 96000}) {
    SCOPED_TRACE(rate_hz);
    const auto tone = Tone(1000, rate_hz, 3, 12000);
    const std::string path = folder_.WriteSound("tone.wav", kWav16, rate_hz, 1, tone);
    const auto input = OpenAudio(path, false);
    EXPECT_EQ(input->ExpectedSamples(), 48000u);
    EXPECT_THAT(input->Description(), HasSubstr(" Hz, 1 channel, resampled to 16000 Hz mono"));
    const auto samples = ReadAll(input.get());
    EXPECT_NEAR(static_cast<double>(samples.size()), 48000, 4);
    EXPECT_NEAR(AmplitudeAt(1000, samples), 12000, 30);
    EXPECT_LT(AmplitudeAt(1010, samples), 30);
  }
  // 11 kHz in 44.1 kHz must not fold back to 5 kHz.
  const auto high = folder_.WriteSound("high.wav", kWav16, 44100, 1, Tone(11000, 44100, 2, 16000));
  EXPECT_LT(AmplitudeAt(5000, ReadFile(high)), 2);
}

TEST_F(AudioInputTest, SamplesThatAreNoNumbersAreNamed) {
  std::vector<float> frames(20000, 0.25f);
  frames[2 * 9000 + 1] = std::numeric_limits<float>::quiet_NaN();
  EXPECT_EQ(ErrorOf(folder_.WriteSound("nan.wav", kWavFloat, 16000, 2, frames)),
            folder_.Path("nan.wav") + ": frame 9000, channel 1: the sample is not a number");
}

TEST_F(AudioInputTest, UnusableFilesAreNamedInOneLine) {
  const auto noise = test::Random(2).Fill<int16_t>(30000, -32768, 32767);
  const auto cut = [&](const std::string& path, uintmax_t bytes) {
    std::filesystem::resize_file(path, bytes);
    return path;
  };
  const std::string missing = folder_.Path("missing.wav");
  const std::string folder = folder_.Path("folder");
  std::filesystem::create_directory(folder);
  struct Case {
    std::string path;
    std::string wrong;
  };
  const std::vector<Case> cases = {
      {missing, "can't be opened: No such file or directory"},
      {folder, "is a folder"},
      {folder_.WriteBytes("empty.wav", ""), "empty: 0 bytes"},
      {folder_.WriteSound<int16_t>("none.wav", kWav16, 16000, 1, {}), "no audio: 0 frames"},
      {folder_.WriteBytes("text.wav", std::string(5000, 'x')), "not a readable sound file: "},
      {cut(folder_.WriteSound("cut.wav", kWav16, 16000, 1, noise), 30044),
       "truncated: the header promises 60000 bytes of audio, the file holds 30000"},
      {cut(folder_.WriteSound("cut.aiff", SF_FORMAT_AIFF | SF_FORMAT_PCM_16, 16000, 1, noise),
           30000),
       "truncated: the header promises 60008 bytes"},
      {cut(folder_.WriteSound("cut.ogg", SF_FORMAT_OGG | SF_FORMAT_VORBIS, 16000, 1, noise), 9000),
       "truncated: the page that ends the stream is missing"},
      {cut(folder_.WriteSound("cut.flac", kFlac16, 16000, 1, noise), 30000), ": frame "},
      {folder_.WriteSound("slow.wav", kWav16, 999, 1, noise), "999 Hz, should be 1000 to 768000"},
      {folder_.WriteSound<int16_t>("wide.wav", kWav16, 16000, 65, {}),
       "65 channels, should be 1 to 64"},
  };
  for (const Case& unusable : cases) {
    EXPECT_THAT(ErrorOf(unusable.path), AllOf(HasSubstr(unusable.path + ": "),
                                              HasSubstr(unusable.wrong), Not(HasSubstr("\n"))));
  }
}

TEST_F(AudioInputTest, WavOfUnknownLengthGoesToTheEnd) {
  // As written to a pipe: the size of the audio is a guess near 2^31 or 2^32.
  const std::vector<int16_t> samples = {1, -2, 3};
  std::string bytes = "RIFF\xFF\xFF\xFF\xFFWAVEfmt ";
  const char rest[] =
      "\x10\0\0\0\x01\0\x01\0\x80\x3E\0\0\0\x7D\0\0\x02\0\x10\0data\xFF\xFF\xFF\xFF";
  bytes.append(rest, sizeof(rest) - 1);
  bytes.append(reinterpret_cast<const char*>(samples.data()), 6);
  EXPECT_EQ(ReadFile(folder_.WriteBytes("pipe.wav", bytes)), samples);
}

TEST_F(AudioInputTest, RawStreamsArriveInAnyPiecesOfWholeSamples) {
  int ends[2];
  ASSERT_EQ(pipe(ends), 0);
  EXPECT_EQ(ErrorOf(folder_.WriteBytes("odd.raw", "abcde"), true),
            folder_.Path("odd.raw") + ": ends after 5 bytes, in the middle of a 16-bit sample");
  const auto input = OpenAudio("/dev/fd/" + std::to_string(ends[0]), true);
  std::vector<int16_t> samples(100);
  ASSERT_EQ(write(ends[1], "\x01\x02\x03", 3), 3);
  EXPECT_EQ(input->Read(samples.data(), 100), 1u);
  ASSERT_EQ(write(ends[1], "\x04\x05\x06", 3), 3);
  EXPECT_EQ(input->Read(samples.data() + 1, 99), 2u);
  close(ends[1]);
  EXPECT_EQ(input->Read(samples.data() + 3, 97), 0u);
  close(ends[0]);
  samples.resize(3);
  EXPECT_EQ(samples, (std::vector<int16_t>{0x0201, 0x0403, 0x0605}));
}

}  // namespace
}  // namespace qz::tools
