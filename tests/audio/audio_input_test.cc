// SPDX-License-Identifier: Apache-2.0
// What comes out of sound files of all kinds, and the errors of those that can't be used or were
// cut off.

#include "audio/audio_input.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>
#include <vector>

#include "audio/temporary_file.h"
#include "tests/support/random.h"
#include "tests/support/sound_folder.h"

namespace qz::audio {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

constexpr int kWav16 = SF_FORMAT_WAV | SF_FORMAT_PCM_16;
constexpr int kWavFloat = SF_FORMAT_WAV | SF_FORMAT_FLOAT;
constexpr int kFlac16 = SF_FORMAT_FLAC | SF_FORMAT_PCM_16;
constexpr int kOgg = SF_FORMAT_OGG | SF_FORMAT_VORBIS;
constexpr int kMp3 = SF_FORMAT_MPEG | SF_FORMAT_MPEG_LAYER_III;

// In odd amounts, so that block borders fall anywhere.
std::vector<int16_t> ReadFile(const std::string& path,
                              const std::optional<PcmFormat>& raw = std::nullopt) {
  const auto input = OpenAudio(path, raw);
  std::vector<int16_t> all;
  std::vector<int16_t> part(1237);
  while (const size_t got = input->Read(part.data(), part.size())) {
    all.insert(all.end(), part.begin(), part.begin() + static_cast<std::ptrdiff_t>(got));
  }
  return all;
}

std::string ErrorOf(const std::string& path, const std::optional<PcmFormat>& raw = std::nullopt) {
  try {
    ReadFile(path, raw);
  } catch (const AudioError& error) {
    return error.what();
  }
  return "no error";
}

std::vector<int16_t> Tone(double hz, int rate_hz, double seconds, double amplitude) {
  std::vector<int16_t> samples;
  for (int i = 0; i < seconds * rate_hz; ++i) {
    const double value = amplitude * std::sin(2 * M_PI * hz * i / rate_hz);
    samples.push_back(static_cast<int16_t>(std::lround(value)));
  }
  return samples;
}

// The largest difference of two sounds but at their ends, where a resampler knows no neighbours.
int Difference(const std::vector<int16_t>& a, const std::vector<int16_t>& b) {
  int max = 0;
  for (size_t i = 500; i < a.size() - 500; ++i) max = std::max(max, std::abs(a[i] - b[i]));
  return max;
}

class AudioInputTest : public testing::Test, protected test::SoundFolder {};

TEST_F(AudioInputTest, Mono16BitAt16KhzPassesThroughBitForBit) {
  auto samples = test::Random(1).Fill<int16_t>(20001, -32768, 32767);
  EXPECT_EQ(ReadFile(WriteSound("a.wav", kWav16, 16000, 1, samples)), samples);
  EXPECT_EQ(ReadFile(WriteSound("a.flac", kFlac16, 16000, 1, samples)), samples);
  EXPECT_EQ(ReadFile(WriteRaw("a.raw", samples), PcmFormat()), samples);
  EXPECT_EQ(OpenAudio(Path("a.wav"))->Description(),
            Path("a.wav") + ": 16000 Hz, 1 channel, 16 bits, taken as it is");
}

TEST_F(AudioInputTest, ChannelsAreAveraged) {
  // The sum would overflow 16 bits, a choice of one channel would show.
  const std::vector<int16_t> two = {32767, 32767, 3, 0, -32768, -32767, 5, 0, 0, 8};
  EXPECT_EQ(ReadFile(WriteSound("two.wav", kWav16, 16000, 2, two)),
            (std::vector<int16_t>{32767, 2, -32768, 2, 4}));
  const std::vector<int16_t> three = {32767, 32767, 32767, 3, 0, 0, -32768, -32768, -32765};
  const std::string path = WriteSound("three.wav", kWav16, 16000, 3, three);
  EXPECT_EQ(ReadFile(path), (std::vector<int16_t>{32767, 1, -32767}));
  EXPECT_THAT(OpenAudio(path)->Description(), HasSubstr("3 channels, mixed down to mono"));
}

TEST_F(AudioInputTest, FloatsSaturateAndRoundToEven) {
  std::vector<float> values = {32768, 3e38f, -32768, -3e38f, 0.5f, 1.5f, -0.6f, 32766.5f, -2.5f};
  for (float& value : values) value /= 32768;
  const std::string path = WriteSound("f.wav", kWavFloat, 16000, 1, values);
  EXPECT_EQ(ReadFile(path),
            (std::vector<int16_t>{32767, 32767, -32768, -32768, 0, 2, -1, 32766, -2}));
  EXPECT_THAT(OpenAudio(path)->Description(), HasSubstr("rounded to 16 bits"));
}

TEST_F(AudioInputTest, ResamplingKeepsToneLevelAndLength) {
  for (const int rate_hz : {8000, 44100, 96000}) {
    SCOPED_TRACE(rate_hz);
    const auto tone = Tone(1000, rate_hz, 3, 12000);
    const std::string path = WriteSound("tone.wav", kWav16, rate_hz, 1, tone);
    const auto input = OpenAudio(path);
    EXPECT_EQ(input->ExpectedSamples(), 48000u);
    EXPECT_THAT(input->Description(), HasSubstr(" Hz, 1 channel, resampled to 16000 Hz mono"));
    const auto samples = ReadFile(path);
    ASSERT_NEAR(static_cast<double>(samples.size()), 48000, 4);
    EXPECT_LE(Difference(Tone(1000, 16000, 3, 12000), samples), 2);
  }
  // 11 kHz must not fold back to 5 kHz.
  const auto high = WriteSound("high.wav", kWav16, 44100, 1, Tone(11000, 44100, 2, 16000));
  EXPECT_LE(Difference(Tone(0, 16000, 2, 0), ReadFile(high)), 2);
}

TEST_F(AudioInputTest, UnusableFilesAreNamedInOneLine) {
  const auto noise = test::Random(2).Fill<int16_t>(30000, -32768, 32767);
  const auto cut = [&](const std::string& name, int format, uintmax_t bytes) {
    std::string path = WriteSound(name, format, 16000, 1, noise);
    std::filesystem::resize_file(path, bytes);
    return path;
  };
  std::vector<float> frames(20000, 0.25f);
  frames[2 * 9000 + 1] = std::numeric_limits<float>::quiet_NaN();
  const std::pair<std::string, std::string> cases[] = {
      {Path("missing.wav"), "can't be opened: No such file or directory"},
      {Path("."), "is a folder"},
      {WriteBytes("empty.wav", ""), "empty: 0 bytes"},
      {WriteSound<int16_t>("none.wav", kWav16, 16000, 1, {}), "no audio: 0 frames"},
      {WriteBytes("text.wav", std::string(5000, 'x')), "not a readable sound file: "},
      {cut("head.wav", kWav16, 44), "no audio: truncated: the header promises 60000 bytes"},
      {cut("head.ogg", kOgg, 3000), "no audio: truncated: its last Ogg page is cut off"},
      {WriteSound("slow.wav", kWav16, 999, 1, noise), "999 Hz, expected 1000 to 768000"},
      {WriteSound<int16_t>("wide.wav", kWav16, 16000, 65, {}), "65 channels, expected 1 "},
      {WriteSound("nan.wav", kWavFloat, 16000, 2, frames),
       "frame 9000, channel 1: the sample is not a number"},
      {WriteSound<float>("infinite.wav", kWavFloat, 16000, 1, {0, 0, 0, 0, -HUGE_VALF}),
       "frame 4, channel 0: the sample is infinite"},
  };
  for (const auto& [path, wrong] : cases) {
    EXPECT_THAT(ErrorOf(path),
                AllOf(HasSubstr(path + ": "), HasSubstr(wrong), Not(HasSubstr("\n"))));
  }
  EXPECT_EQ(ErrorOf(WriteBytes("odd.raw", "abcde"), PcmFormat()),
            Path("odd.raw") + ": ends after 5 bytes, in the middle of a 16-bit sample");
}

// What a file gives before its error, and the error.
std::pair<size_t, std::string> ReadToError(const std::string& path) {
  const auto input = OpenAudio(path);
  std::vector<int16_t> part(1000);
  size_t total = 0;
  try {
    while (const size_t got = input->Read(part.data(), part.size())) total += got;
  } catch (const AudioError& error) {
    return {total, error.what()};
  }
  return {total, "no error"};
}

TEST_F(AudioInputTest, CutFilesGiveWhatIsThereAndThenAnError) {
  constexpr size_t kSamples = 160000;
  const auto noise = test::Random(2).Fill<int16_t>(kSamples, -9000, 9000);
  const struct {
    std::string name;
    int format;
    std::string error;
  } cases[] = {
      {"a.wav", kWav16, "truncated: the header promises 320000 bytes of audio, the file holds "},
      {"a.aiff", SF_FORMAT_AIFF | SF_FORMAT_PCM_16, "truncated: the header promises 320008 bytes"},
      {"a.au", SF_FORMAT_AU | SF_FORMAT_PCM_16, "truncated: the header promises 320000 bytes"},
      {"a.ogg", kOgg, "truncated: its last Ogg page is cut off"},
      {"a.opus", SF_FORMAT_OGG | SF_FORMAT_OPUS, "truncated: its last Ogg page is cut off"},
      {"a.flac", kFlac16, "corrupt: "},
      {"a.mp3", kMp3, "truncated: the header promises "},
  };
  for (const auto& [name, format, error] : cases) {
    SCOPED_TRACE(name);
    const std::string path = WriteSound(name, format, 16000, 1, noise);
    EXPECT_EQ(ReadToError(path), std::make_pair(kSamples, std::string("no error")));
    std::filesystem::resize_file(path, std::filesystem::file_size(path) * 3 / 5);
    const auto [samples, message] = ReadToError(path);
    EXPECT_NEAR(static_cast<double>(samples), kSamples * 0.6, kSamples * 0.12);
    EXPECT_THAT(message, AllOf(HasSubstr(path + ": frame "), HasSubstr(error)));
  }
}

TEST_F(AudioInputTest, OggPagesAndMpegFramesShowWhereAFileWasCut) {
  const auto noise = test::Random(2).Fill<int16_t>(160000, -9000, 9000);
  const std::string no_error = "no error";
  // Whole pages without the end-of-stream mark are a complete stream; whatever follows is not of
  // it.
  WriteSound("a.ogg", kOgg, 16000, 1, noise);
  const std::string ogg = Contents("a.ogg");
  const size_t last_page = ogg.rfind("OggS");
  EXPECT_EQ(ErrorOf(WriteBytes("unmarked.ogg", ogg.substr(0, last_page))), no_error);
  EXPECT_EQ(ErrorOf(WriteBytes("tagged.ogg", ogg + "TAG of another kind")), no_error);
  for (const size_t more : {size_t{2}, size_t{20}, ogg.size() - last_page - 1}) {
    EXPECT_THAT(ErrorOf(WriteBytes("cut.ogg", ogg.substr(0, last_page + more))),
                HasSubstr("truncated: its last Ogg page is cut off"))
        << more;
  }

  // Without its first frame, which states how many there are, and which has no sync word inside.
  WriteSound("a.mp3", kMp3, 32000, 1, noise);
  const std::string mp3 = Contents("a.mp3");
  const size_t first = mp3.find("\xFF\xFB");
  ASSERT_NE(first, std::string::npos);
  const std::string plain = mp3.substr(mp3.find("\xFF\xFB", first + 190));
  const std::string id3 = "ID3\4" + std::string(5, '\0') + "\5" + "title";
  EXPECT_EQ(ErrorOf(WriteBytes("plain.mp3", plain)), no_error);
  EXPECT_EQ(ErrorOf(WriteBytes("tagged.mp3", id3 + plain + "TAG" + std::string(125, ' '))),
            no_error);
  EXPECT_THAT(ErrorOf(WriteBytes("cut.mp3", id3 + plain.substr(0, plain.size() - 9))),
              HasSubstr("truncated: its last MPEG frame is cut off"));
}

// A stream that is written while it is read.
class Pipe {
 public:
  Pipe() { EXPECT_EQ(pipe(ends_), 0); }
  Pipe(const Pipe&) = delete;
  Pipe& operator=(const Pipe&) = delete;
  ~Pipe() {
    close(ends_[0]);
    End();
  }

  std::string path() const { return "/dev/fd/" + std::to_string(ends_[0]); }
  void Write(const std::string& bytes) const {
    ASSERT_EQ(write(ends_[1], bytes.data(), bytes.size()), static_cast<ssize_t>(bytes.size()));
  }
  void End() {
    if (ends_[1] >= 0) close(std::exchange(ends_[1], -1));
  }

 private:
  int ends_[2] = {-1, -1};
};

// What a program writes to a pipe, in which all of `bytes` have room.
std::string StreamOf(Pipe* pipe, const std::string& bytes) {
  pipe->Write(bytes);
  pipe->End();
  return pipe->path();
}

// A WAV of 16 bits, mono at 16 kHz, that states `size` as that of its audio, little-endian.
std::string Wav(const std::string& size, const std::string& audio) {
  const char head[] =
      "RIFF\xFF\xFF\xFF\xFFWAVELIST\x03\0\0\0abc\0fmt \x10\0\0\0\x01\0\x01\0\x80\x3E\0\0\0\x7D\0\0"
      "\x02\0\x10\0data";
  return std::string(head, sizeof(head) - 1) + size + audio;
}

TEST_F(AudioInputTest, WavOfUnknownLengthGoesToTheEndAndAStreamPlaysAsItComes) {
  // As written to a pipe: the size of the audio is a guess near 2^31 or 2^32, or 0.
  const std::string audio("\x01\0\xFE\xFF\x03\0", 6);
  for (const uint32_t size : {0xFFFFFFFFu, 0x7FFFF000u, 0u, 6u}) {
    SCOPED_TRACE(size);
    const std::string wav = Wav({reinterpret_cast<const char*>(&size), 4}, audio);
    EXPECT_EQ(ReadFile(WriteBytes("pipe.wav", wav)), (std::vector<int16_t>{1, -2, 3}));
    Pipe pipe;
    pipe.Write(wav);
    const auto input = OpenAudio(pipe.path());  // whose end is still to come
    std::vector<int16_t> samples(10);
    EXPECT_EQ(input->Read(samples.data(), 10), 3u);
    EXPECT_THAT(samples, testing::ElementsAre(1, -2, 3, 0, 0, 0, 0, 0, 0, 0));
    EXPECT_EQ(input->ExpectedSamples(), size == 6 ? 3u : 0u);
    if (size != 6) pipe.End();
    EXPECT_EQ(input->Read(samples.data(), 10), 0u);
  }

  // Nothing but a title behind the samples, and the file's size counts it: a size of 0 is meant.
  std::string none = Wav(std::string(4, '\0'), std::string("LIST\x04\0\0\0INFO", 12));
  none.replace(4, 4, std::string{static_cast<char>(none.size() - 8), 0, 0, 0});
  Pipe pipe;
  for (const auto& path : {WriteBytes("none.wav", none), StreamOf(&pipe, none)}) {
    EXPECT_THAT([&] { ReadFile(path); },
                testing::ThrowsMessage<AudioError>(HasSubstr(": no audio: 0 frames")));
  }
}

TEST_F(AudioInputTest, RawSamplesArriveInAnyPiecesOfWholeOnes) {
  Pipe pipe;
  pipe.Write("abcdefghijklmnopq");
  const auto input = OpenAudio(pipe.path(), PcmFormat());
  std::vector<int16_t> samples(100);
  EXPECT_EQ(input->Read(samples.data(), 100), 8u);
  pipe.Write("r");
  EXPECT_EQ(input->Read(samples.data(), 100), 1u);
  EXPECT_EQ(samples[0], 'q' + 256 * 'r');
  pipe.End();
  EXPECT_EQ(input->Read(samples.data(), 100), 0u);
}

TEST_F(AudioInputTest, StreamsAndHeaderlessSamplesGiveWhatFilesGive) {
  const auto noise = test::Random(6).Fill<int16_t>(2 * 1000, -32768, 32767);
  const struct {
    std::string name;
    int format;
  } encodings[] = {{"u8", SF_FORMAT_PCM_U8},  {"s8", SF_FORMAT_PCM_S8},  {"s16", SF_FORMAT_PCM_16},
                   {"s24", SF_FORMAT_PCM_24}, {"s32", SF_FORMAT_PCM_32}, {"f32", SF_FORMAT_FLOAT},
                   {"f64", SF_FORMAT_DOUBLE}};
  size_t raw_encodings = 0;
  for (const auto& [name, format] : encodings) {
    for (const int container : {SF_FORMAT_WAV, SF_FORMAT_WAVEX, SF_FORMAT_AU}) {
      SF_INFO info = {0, 44100, 2, container | format, 0, 0};
      if (sf_format_check(&info) == 0) continue;
      const std::string path = WriteSound("a", container | format, 44100, 2, noise);
      Pipe pipe;
      const auto streamed = ReadFile(StreamOf(&pipe, Contents("a")));
      EXPECT_GT(streamed.size(), 360u);
      EXPECT_EQ(streamed, ReadFile(path)) << name << " " << container;
    }
    for (const bool big : {false, true}) {
      PcmFormat raw;
      raw.rate_hz = 44100;
      raw.channels = 2;
      if (!SetPcmEncoding(name + (name.size() == 2 ? "" : big ? "be" : "le"), &raw)) continue;
      ++raw_encodings;
      const int endian = big ? SF_ENDIAN_BIG : SF_ENDIAN_LITTLE;
      const auto path = WriteSound("raw", SF_FORMAT_RAW | format | endian, 44100, 2, noise);
      const int file_format = SF_FORMAT_AIFF | format;
      EXPECT_EQ(ReadFile(path, raw), ReadFile(WriteSound("a", file_format, 44100, 2, noise)))
          << PcmEncodingName(raw);
    }
  }
  EXPECT_EQ(raw_encodings, PcmEncodingNames().size() + 2);  // two of them have no byte order

  // What needs seeking is copied first.
  for (const int format : {kFlac16, kOgg, SF_FORMAT_WAV | SF_FORMAT_ULAW}) {
    const std::string path = WriteSound("a", format, 44100, 2, noise);
    Pipe pipe;
    EXPECT_EQ(ReadFile(StreamOf(&pipe, Contents("a"))), ReadFile(path)) << format;
  }
}

TEST_F(AudioInputTest, UnusableStreamsAndFormatsAreNamedInOneLine) {
  const std::string m4a(
      "\0\0\0\x20"
      "ftypM4A \0\0\0\0",
      16);
  const std::string aac("\xFF\xF1\x50\x80\x02\x1F\xFC\xDE\x02\0Lavc60", 16);
  const std::pair<std::string, std::string> streams[] = {
      {"", "empty: 0 bytes"},
      {std::string(5000, 'x'),
       "no header that is known in a stream; headerless samples need --raw"},
      {Wav({"\x80\0\0\0", 4}, "1234567"),
       "frame 3: truncated: the header promises 128 bytes of audio, the stream held 7"},
      {Wav({"\x80\0\0\0", 4}, ""), "truncated: the header promises 128 bytes"},
      {Wav({"\0\0\0\0", 4}, ""), "no audio: 0 frames"},
      {"RIFF1234WAVEfmt \xFF\xFF\xFF\xFF", "not a readable sound file: "},
      {m4a, "is MPEG-4 audio (m4a, mp4), which qz does not read; convert it: ffmpeg -i "},
      {aac, "is AAC, which qz does not read; convert it: ffmpeg -i "},
  };
  for (const auto& [bytes, error] : streams) {
    Pipe pipe;
    EXPECT_THAT(ErrorOf(StreamOf(&pipe, bytes)),
                AllOf(StartsWith("/dev/fd/"), HasSubstr(error), Not(HasSubstr("\n"))));
  }
  EXPECT_THAT(ErrorOf(WriteBytes("a 'b'.m4a", m4a)),
              HasSubstr("ffmpeg -i '" + Path("a '\\''b'\\''.m4a") + "' -ac 1 -ar 16000 audio.wav"));
  for (const std::string& head : {Wav("1234", ""), "fLaC" + m4a, "ID3\x04" + m4a, m4a}) {
    EXPECT_THAT(ErrorOf(WriteBytes("a.raw", head), PcmFormat()),
                HasSubstr("; --raw expects headerless samples"));
  }
  // A sample of -1 is no sync word of MPEG audio.
  EXPECT_EQ(ErrorOf(WriteBytes("a.raw", "\xFF\xFF\xFF\xFB"), PcmFormat()), "no error");

  Pipe pipe;
  pipe.Write("abcdef");
  EXPECT_THAT(
      [&] {
        CopyToTemporaryFile("a", base::FileDescriptor(open(pipe.path().c_str(), O_RDONLY)), "head",
                            9);
      },
      testing::ThrowsMessage<AudioError>(HasSubstr("a: exceeds the 9 bytes")));
}

}  // namespace
}  // namespace qz::audio
