#include "social/tandry/audio/fuzz_modem_config.h"

#include <cstring>
#include <random>
#include <vector>

#include "gtest/gtest.h"

namespace audio_modem {
namespace {

std::vector<uint8_t> Written(const FuzzModemConfig& config) {
  base::FuzzSeed seed;
  WriteFuzzModemConfig(config, &seed);
  return seed.bytes();
}

FuzzModemConfig Read(const std::vector<uint8_t>& bytes) {
  base::FuzzInput input(bytes.data(), bytes.size());
  return ReadFuzzModemConfig(&input);
}

TEST(FuzzModemConfigTest, ProductConfigurationsReadBackAndAreAccepted) {
  const FuzzModemConfig dsss = Read(Written(FuzzModemConfig::Dsss()));
  EXPECT_EQ(Written(dsss), Written(FuzzModemConfig::Dsss()));
  EXPECT_EQ(DsssEncoderConfigError(dsss.ToDsssEncoderConfig()), "");
  EXPECT_EQ(DsssDecoderConfigError(dsss.ToDsssDecoderConfig()), "");
  EXPECT_EQ(dsss.ToDsssDecoderConfig().token_length_bytes, 8);
  EXPECT_EQ(dsss.ToDsssDecoderConfig().waveform.upsampling_factor, 16);

  FuzzModemConfig dtmf = FuzzModemConfig::Dtmf();
  dtmf.dtmf_waveform.tone_frequencies = {700, 900, 1100, 1300};  // Not among the edges.
  const FuzzModemConfig back = Read(Written(dtmf));
  EXPECT_TRUE(back.dtmf);
  EXPECT_EQ(back.dtmf_waveform.tone_frequencies, dtmf.dtmf_waveform.tone_frequencies);
  EXPECT_EQ(DtmfDecoderConfigError(back.ToDtmfDecoderConfig()), "");
  EXPECT_EQ(back.ToDtmfDecoderConfig().bytes_in_token, 5);
  EXPECT_TRUE(back.ToDtmfDecoderConfig().append_checksum_symbol);
}

// Whatever bytes a fuzzer invents, writing what was read gives bytes that
// read back the same (NaN payloads included).
TEST(FuzzModemConfigTest, AnyInputReadsWritesAndReadsAgainAlike) {
  std::mt19937 random(7);
  for (int trial = 0; trial < 200; ++trial) {
    std::vector<uint8_t> bytes(random() % 200);
    for (uint8_t& b : bytes) b = static_cast<uint8_t>(random());
    const std::vector<uint8_t> once = Written(Read(bytes));
    EXPECT_EQ(Written(Read(once)), once) << "trial " << trial;
  }
}

TEST(FuzzModemConfigTest, DecoderCallsReadBackAsWritten) {
  std::vector<int16_t> samples(3 * 1000);
  for (size_t i = 0; i < samples.size(); ++i) samples[i] = static_cast<int16_t>(i * 37 - 9000);
  base::FuzzSeed seed;
  WriteFuzzDecoderCalls(samples, 3, 400, &seed);
  base::FuzzInput input(seed.bytes().data(), seed.bytes().size());
  std::vector<int16_t> fed;
  int tokens = 0, broadcaster = 0, wipes = 0;
  FuzzDecoderCalls calls;
  calls.process = [&](const FuzzProcessCall& call) {
    EXPECT_EQ(call.cut, 0u);
    EXPECT_EQ(call.flags, 0);
    EXPECT_LE(call.samples.size(), 3u * 400u);
    fed.insert(fed.end(), call.samples.begin(), call.samples.end());
  };
  calls.tokens = [&] { ++tokens; };
  calls.broadcaster = [&] { ++broadcaster; };
  calls.wipe = [&](uint8_t) { ++wipes; };
  RunFuzzDecoderCalls(&input, 3, calls);
  EXPECT_EQ(fed, samples);
  EXPECT_EQ(tokens, 3);  // 400 + 400 + 200 frames.
  EXPECT_EQ(broadcaster, 3);
  EXPECT_EQ(wipes, 0);
}

}  // namespace
}  // namespace audio_modem
