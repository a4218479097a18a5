#include <cstdio>
#include <sstream>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tools/vesk/commands.h"
#include "tools/vesk/wav_io.h"

namespace vesk_tool {
namespace {

std::string TempPath(const std::string& name) { return ::testing::TempDir() + "/" + name; }

int RunEncodeCommand(const std::vector<std::string>& args, std::string* out, std::string* err) {
  std::ostringstream o, e;
  const int status = RunEncode(args, o, e);
  *out = o.str();
  *err = e.str();
  return status;
}

TEST(EncodeCommandTest, WritesTransitionAndRepeatedToken) {
  const std::string path = TempPath("encode_test.wav");
  std::string out, err;
  ASSERT_EQ(RunEncodeCommand({"--message", "010203040506", "--repeat", "2", path}, &out, &err), 0)
      << err;
  PcmAudio audio;
  ASSERT_TRUE(ReadAudioFile(path, &audio, &err)) << err;
  EXPECT_EQ(audio.sample_rate, 48000);
  EXPECT_EQ(audio.channels, 1);
  ASSERT_EQ(audio.samples.size(), 240u + 2 * 17 * 2032);
  // The two repetitions are identical, and the token peaks at half scale.
  for (size_t i = 0; i < 17 * 2032; i += 97) {
    ASSERT_EQ(audio.samples[240 + i], audio.samples[240 + 17 * 2032 + i]);
  }
  int peak = 0;
  for (int16_t s : audio.samples) peak = std::max(peak, std::abs(static_cast<int>(s)));
  EXPECT_EQ(peak, 16384);
  EXPECT_NE(out.find("CRC-16"), std::string::npos);
  std::remove(path.c_str());
}

TEST(EncodeCommandTest, PresetAndOverrides) {
  const std::string path = TempPath("encode_44k.wav");
  std::string out, err;
  ASSERT_EQ(RunEncodeCommand({"--preset", "44k", "--no-crc", "--message", "0102030405060708",
                              "--repeat", "1", "--transition", "0", path},
                             &out, &err),
            0)
      << err;
  PcmAudio audio;
  ASSERT_TRUE(ReadAudioFile(path, &audio, &err));
  EXPECT_EQ(audio.samples.size(), 35249u);  // 17 x 1905 samples at 44.1 kHz, resampled to 48 kHz.
  std::remove(path.c_str());
}

TEST(EncodeCommandTest, BadInputIsAUsageErrorNotACrash) {
  std::string out, err;
  const std::string path = TempPath("never.wav");
  for (const std::vector<std::string>& args :
       std::vector<std::vector<std::string>>{{path, "--taps", "4"},
                                             {path, "--code", "3", "--taps", "6"},
                                             {path, "--decimation", "5"},
                                             {path, "--bits", "3"},
                                             {path, "--carrier", "30000"},
                                             {path, "--message", "xyz"},
                                             {path, "--preset", "96k"},
                                             {"--repeat", "0", path},
                                             {}}) {
    EXPECT_EQ(RunEncodeCommand(args, &out, &err), 2) << (args.empty() ? "" : args.back());
    EXPECT_FALSE(err.empty());
  }
  EXPECT_EQ(RunEncodeCommand({"/nonexistent-dir/x.wav"}, &out, &err), 1);
}

}  // namespace
}  // namespace vesk_tool
