#include "tools/common/audio_input.h"

#include <fcntl.h>
#include <sndfile.h>
#include <unistd.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_tool {
namespace {

using Raw = AudioInputOptions::Raw;

void PutLe(std::vector<uint8_t>* bytes, uint32_t value, int size) {
  for (int i = 0; i < size; ++i) bytes->push_back(static_cast<uint8_t>(value >> (8 * i)));
}

// A canonical WAV file written by hand (not by libsndfile): RIFF header, a
// 16-byte "fmt " chunk and the "data" chunk.
std::vector<uint8_t> Wav(int format_tag, int channels, int rate, int bits,
                         const std::vector<uint8_t>& data) {
  std::vector<uint8_t> wav = {'R', 'I', 'F', 'F'};
  PutLe(&wav, static_cast<uint32_t>(36 + data.size()), 4);
  for (const char c : std::string("WAVEfmt ")) wav.push_back(static_cast<uint8_t>(c));
  PutLe(&wav, 16, 4);
  PutLe(&wav, static_cast<uint32_t>(format_tag), 2);
  PutLe(&wav, static_cast<uint32_t>(channels), 2);
  PutLe(&wav, static_cast<uint32_t>(rate), 4);
  PutLe(&wav, static_cast<uint32_t>(rate * channels * bits / 8), 4);
  PutLe(&wav, static_cast<uint32_t>(channels * bits / 8), 2);
  PutLe(&wav, static_cast<uint32_t>(bits), 2);
  for (const char c : std::string("data")) wav.push_back(static_cast<uint8_t>(c));
  PutLe(&wav, static_cast<uint32_t>(data.size()), 4);
  wav.insert(wav.end(), data.begin(), data.end());
  return wav;
}

constexpr int kPcm = 1;
constexpr int kFloat = 3;

DecodedAudio Read(const std::vector<uint8_t>& bytes, Raw raw = Raw::kNever) {
  AudioInputOptions options;
  options.raw = raw;
  DecodedAudio audio;
  std::string error;
  EXPECT_TRUE(ReadAudio(bytes.data(), bytes.size(), options, &audio, &error)) << error;
  return audio;
}

std::string ReadError(const std::vector<uint8_t>& bytes, const AudioInputOptions& options) {
  DecodedAudio audio;
  std::string error;
  EXPECT_FALSE(ReadAudio(bytes.data(), bytes.size(), options, &audio, &error));
  return error;
}

TEST(AudioInputTest, IntegerPcmKeepsItsTop16Bits) {
  // 8-bit WAV samples are unsigned around 0x80.
  EXPECT_EQ(Read(Wav(kPcm, 1, 8000, 8, {0x80, 0xFF, 0x00, 0x81})).samples,
            (std::vector<int16_t>{0, 32512, -32768, 256}));
  EXPECT_EQ(Read(Wav(kPcm, 1, 8000, 16, {0x01, 0x02, 0xFF, 0xFF})).samples,
            (std::vector<int16_t>{0x0201, -1}));
  EXPECT_EQ(Read(Wav(kPcm, 2, 8000, 16, {0x00, 0x80, 0xFF, 0x7F, 0x34, 0x12, 0x00, 0x00})).samples,
            (std::vector<int16_t>{-32768, 32767, 0x1234, 0}));
  // 24 and 32 bits: an arithmetic shift, so -1 stays -1 (rounded down).
  EXPECT_EQ(
      Read(Wav(kPcm, 1, 8000, 24, {0x56, 0x34, 0x12, 0xFF, 0xFF, 0xFF, 0x00, 0x00, 0x80})).samples,
      (std::vector<int16_t>{0x1234, -1, -32768}));
  std::vector<uint8_t> ints;
  for (const uint32_t v : {0x7FFFFFFFu, 0x00010000u, 0xFFFF8000u, 0x80000000u}) PutLe(&ints, v, 4);
  EXPECT_EQ(Read(Wav(kPcm, 1, 8000, 32, ints)).samples,
            (std::vector<int16_t>{32767, 1, -1, -32768}));
}

TEST(AudioInputTest, FloatSamplesFollowTheLibrarysPcmRuleAndCountClipping) {
  const float nan = std::numeric_limits<float>::quiet_NaN();
  const std::vector<float> floats = {0.5f,      -0.5f, 1.0f,  -1.0f, 0.99999f,
                                     -0.00002f, 1.5f,  -2.0f, nan};
  std::vector<uint8_t> data(floats.size() * 4);
  std::memcpy(data.data(), floats.data(), data.size());
  const DecodedAudio audio = Read(Wav(kFloat, 1, 48000, 32, data));
  // x 32768 truncated toward zero, clamped; NaN gives -32768.
  EXPECT_EQ(audio.samples,
            (std::vector<int16_t>{16384, -16384, 32767, -32768, 32767, 0, 32767, -32768, -32768}));
  EXPECT_EQ(audio.clipped_samples, 3);  // 1.5, -2.0 and NaN.
  const std::vector<double> doubles = {0.25, -1.0, 3.0};
  std::vector<uint8_t> data64(doubles.size() * 8);
  std::memcpy(data64.data(), doubles.data(), data64.size());
  const DecodedAudio wide = Read(Wav(kFloat, 1, 48000, 64, data64));
  EXPECT_EQ(wide.samples, (std::vector<int16_t>{8192, -32768, 32767}));
  EXPECT_EQ(wide.clipped_samples, 1);
}

TEST(AudioInputTest, RatesAndChannelsOutsideTheToolsRangeAreErrors) {
  const std::vector<uint8_t> frame(2 * 9, 0);
  for (const int rate : {kMinInputRate, kMaxInputRate}) {
    EXPECT_EQ(Read(Wav(kPcm, 1, rate, 16, {0, 0})).sample_rate, rate);
  }
  EXPECT_EQ(Read(Wav(kPcm, kMaxInputChannels, 8000, 16, std::vector<uint8_t>(16, 0))).channels, 8);
  AudioInputOptions options;
  EXPECT_EQ(ReadError(Wav(kPcm, 1, 7999, 16, {0, 0}), options),
            "a sample rate of 7999 Hz is not supported (8000 to 192000 Hz)");
  EXPECT_EQ(ReadError(Wav(kPcm, 9, 8000, 16, frame), options),
            "9 channels are not supported (1 to 8)");
  options.raw = Raw::kAlways;
  options.raw_rate = 200000;
  EXPECT_EQ(ReadError({0, 0}, options),
            "a sample rate of 200000 Hz is not supported (8000 to 192000 Hz)");
}

TEST(AudioInputTest, HeaderlessInputIsRawLittleEndianPcm) {
  AudioInputOptions options;
  options.raw = Raw::kIfUnrecognised;
  options.raw_rate = 16000;
  options.raw_channels = 2;
  // Text is no audio format: raw, three whole stereo frames and 3 bytes over.
  const std::string text = "hello, world!!!";
  std::string error;
  std::unique_ptr<AudioInput> input =
      AudioInput::Open(MakeMemorySource(reinterpret_cast<const uint8_t*>(text.data()), text.size()),
                       options, &error);
  ASSERT_NE(input, nullptr) << error;
  EXPECT_TRUE(input->raw());
  EXPECT_EQ(input->format(), "raw 16-bit PCM");
  EXPECT_EQ(input->sample_rate(), 16000);
  EXPECT_EQ(input->frames(), 3);
  std::vector<int16_t> samples;
  ASSERT_EQ(input->Read(100, &samples), 3);
  EXPECT_EQ(samples[0], 'h' | ('e' << 8));
  EXPECT_EQ(samples[3], ' ' | ('w' << 8));
  EXPECT_EQ(input->Read(100, &samples), 0);
  EXPECT_EQ(input->ignored_bytes(), 3);
  // A frame sync at the start (a sample of -1) is raw PCM, not MPEG.
  options.raw_channels = 1;
  const std::vector<uint8_t> minus_one = {0xFF, 0xFF, 0xFF, 0xFF, 0x02, 0x00};
  DecodedAudio audio;
  ASSERT_TRUE(ReadAudio(minus_one.data(), minus_one.size(), options, &audio, &error)) << error;
  EXPECT_EQ(audio.samples, (std::vector<int16_t>{-1, -1, 2}));
  // Forced raw reads a WAV's header as samples: 44 bytes, 22 samples.
  EXPECT_EQ(Read(Wav(kPcm, 1, 8000, 16, {7, 0}), Raw::kAlways).samples.size(), 23u);
}

TEST(AudioInputTest, UnreadableInputIsAnErrorNotRaw) {
  AudioInputOptions options;
  options.raw = Raw::kIfUnrecognised;
  std::vector<uint8_t> damaged = Wav(kPcm, 1, 8000, 16, {1, 0});
  damaged.resize(30);  // The "fmt " chunk cut short.
  EXPECT_NE(ReadError(damaged, options).find("unreadable audio"), std::string::npos);
  options.raw = Raw::kNever;
  EXPECT_EQ(ReadError({1, 2, 3, 4, 5, 6}, options),
            "not an audio format that libsndfile recognises");
}

TEST(AudioInputTest, PipesAreReadOnceAndKeepTheirStartForRawInput) {
  for (const bool wav : {true, false}) {
    const std::vector<uint8_t> pcm = {1, 0, 2, 0, 3, 0, 0xFE, 0xFF};
    const std::vector<uint8_t> bytes = wav ? Wav(kPcm, 1, 22050, 16, pcm) : pcm;
    int fds[2];
    ASSERT_EQ(pipe(fds), 0);
    ASSERT_EQ(write(fds[1], bytes.data(), bytes.size()), static_cast<ssize_t>(bytes.size()));
    close(fds[1]);
    AudioInputOptions options;
    options.raw = Raw::kIfUnrecognised;
    std::string error;
    std::unique_ptr<AudioInput> input =
        AudioInput::Open(MakeFdSource(fds[0], true), options, &error);
    ASSERT_NE(input, nullptr) << error;
    EXPECT_EQ(input->raw(), !wav);
    EXPECT_EQ(input->sample_rate(), wav ? 22050 : 44100);
    EXPECT_EQ(input->frames(), -1);  // A pipe's length is unknown.
    std::vector<int16_t> samples;
    ASSERT_EQ(input->Read(10, &samples), 4);
    EXPECT_EQ(samples, (std::vector<int16_t>{1, 2, 3, -2}));
  }
}

TEST(AudioInputTest, FilesOfOtherFormatsAndTheirLength) {
  // A FLAC file written by libsndfile, read back through a descriptor.
  const std::string path =
      ::testing::TempDir() + "/audio_input_test_" + std::to_string(getpid()) + ".flac";
  SF_INFO info = {};
  info.samplerate = 44100;
  info.channels = 2;
  info.format = SF_FORMAT_FLAC | SF_FORMAT_PCM_16;
  SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
  ASSERT_NE(file, nullptr) << sf_strerror(nullptr);
  std::vector<int16_t> written(2000);
  for (size_t i = 0; i < written.size(); ++i) written[i] = static_cast<int16_t>(i * 31 - 20000);
  ASSERT_EQ(sf_write_short(file, written.data(), 2000), 2000);
  sf_close(file);
  std::string error;
  std::unique_ptr<AudioInput> input =
      AudioInput::Open(MakeFdSource(open(path.c_str(), O_RDONLY), true), {}, &error);
  ASSERT_NE(input, nullptr) << error;
  EXPECT_EQ(input->format(), "FLAC (Free Lossless Audio Codec), Signed 16 bit PCM");
  EXPECT_EQ(input->frames(), 1000);
  std::vector<int16_t> samples, all;
  while (input->Read(300, &samples) > 0) all.insert(all.end(), samples.begin(), samples.end());
  EXPECT_EQ(all, written);
  unlink(path.c_str());
}

}  // namespace
}  // namespace vesk_tool
