#include "tools/common/audio_output.h"

#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tools/common/audio_input.h"

namespace vesk_tool {
namespace {

uint32_t Le(const std::vector<uint8_t>& bytes, size_t at, int size) {
  uint32_t value = 0;
  for (int i = size - 1; i >= 0; --i) value = value << 8 | bytes[at + i];
  return value;
}

// Offset of the body of chunk `id` in a RIFF file, or 0.
size_t FindChunk(const std::vector<uint8_t>& wav, const char* id) {
  for (size_t at = 12; at + 8 <= wav.size(); at += 8 + Le(wav, at + 4, 4)) {
    if (std::memcmp(wav.data() + at, id, 4) == 0) return at + 8;
  }
  return 0;
}

TEST(AudioOutputTest, SixteenBitWavHasTheCanonicalLayout) {
  const std::vector<int16_t> samples = {1, -2, 300, -32768, 32767, 0};
  const std::vector<uint8_t> wav = WavBytes(samples, 44100, 2);
  ASSERT_GE(wav.size(), 44u);
  EXPECT_EQ(std::string(wav.begin(), wav.begin() + 4), "RIFF");
  EXPECT_EQ(Le(wav, 4, 4), wav.size() - 8);
  EXPECT_EQ(std::string(wav.begin() + 8, wav.begin() + 12), "WAVE");
  const size_t fmt = FindChunk(wav, "fmt ");
  ASSERT_NE(fmt, 0u);
  EXPECT_EQ(Le(wav, fmt, 2), 1u);  // Integer PCM.
  EXPECT_EQ(Le(wav, fmt + 2, 2), 2u);
  EXPECT_EQ(Le(wav, fmt + 4, 4), 44100u);
  EXPECT_EQ(Le(wav, fmt + 8, 4), 44100u * 4);
  EXPECT_EQ(Le(wav, fmt + 14, 2), 16u);
  const size_t data = FindChunk(wav, "data");
  ASSERT_NE(data, 0u);
  ASSERT_EQ(Le(wav, data - 4, 4), 12u);
  for (size_t i = 0; i < samples.size(); ++i) {
    EXPECT_EQ(static_cast<int16_t>(Le(wav, data + 2 * i, 2)), samples[i]);
  }
}

TEST(AudioOutputTest, FloatWavKeepsTheValuesAndIsReproducible) {
  const std::vector<float> samples = {0.5f, -0.25f, 1.0e-7f, 1.5f};
  const std::vector<uint8_t> wav = WavBytes(samples, 48000, 1);
  const size_t fmt = FindChunk(wav, "fmt ");
  ASSERT_NE(fmt, 0u);
  EXPECT_EQ(Le(wav, fmt, 2), 3u);  // IEEE float.
  EXPECT_EQ(Le(wav, fmt + 14, 2), 32u);
  EXPECT_EQ(FindChunk(wav, "PEAK"), 0u);  // It would carry a time stamp.
  const size_t data = FindChunk(wav, "data");
  ASSERT_NE(data, 0u);
  std::vector<float> back(samples.size());
  std::memcpy(back.data(), wav.data() + data, back.size() * 4);
  EXPECT_EQ(back, samples);
  EXPECT_EQ(WavBytes(samples, 48000, 1), wav);
  // And the tools read it back with the library's rule.
  DecodedAudio audio;
  std::string error;
  ASSERT_TRUE(ReadAudio(wav.data(), wav.size(), {}, &audio, &error)) << error;
  EXPECT_EQ(audio.samples, (std::vector<int16_t>{16384, -8192, 0, 32767}));
  EXPECT_EQ(audio.clipped_samples, 1);
}

TEST(AudioOutputTest, WritesFilesAndReportsFailures) {
  const std::string path =
      ::testing::TempDir() + "/audio_output_test_" + std::to_string(getpid()) + ".bin";
  const std::vector<uint8_t> bytes = {1, 2, 3, 0, 255};
  std::string error;
  ASSERT_TRUE(WriteBytes(path, bytes, &error)) << error;
  FILE* file = std::fopen(path.c_str(), "rb");
  ASSERT_NE(file, nullptr);
  std::vector<uint8_t> back(16);
  back.resize(std::fread(back.data(), 1, back.size(), file));
  std::fclose(file);
  std::remove(path.c_str());
  EXPECT_EQ(back, bytes);
  EXPECT_FALSE(WriteBytes("/nonexistent-dir/x.wav", bytes, &error));
  EXPECT_EQ(error, "cannot write /nonexistent-dir/x.wav: No such file or directory");
}

}  // namespace
}  // namespace vesk_tool
