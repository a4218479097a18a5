// The DTMF modem end to end, deterministically: the product transmitter's
// token through the channel simulator into the product receiver, fed as an
// app feeds it (16-bit PCM in chunks, tokens requested every 0.25 s).

#include <cstdint>
#include <vector>

#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/channel/channel_simulator.h"
#include "tools/channel/noise.h"
#include "tools/common/over_the_air.h"
#include "tools/common/stream_decoding.h"

namespace {

using audio_modem::DtmfDecoderConfig;

struct Heard {
  int correct = 0;  // Reports of the sent token.
  int wrong = 0;    // Reports of anything else.
};

// Plays 3 message bytes + 2 CRC bytes `repeat` times through `channel` and
// decodes them with a receiver of the same waveform.
Heard Loopback(const DtmfDecoderConfig& config, const vesk_channel::ChannelParams& channel,
               int chunk_bytes, int repeat = 3) {
  audio_modem::DtmfEncoderConfig encoder_config;
  static_cast<audio_modem::DtmfWaveformConfig&>(encoder_config) = config;
  const auto encoder = audio_modem::MakeDtmfAudioModemEncoder(encoder_config);
  const std::vector<uint8_t> message = {static_cast<uint8_t>(channel.seed * 37), 0xA5, 0x0F};
  vesk_tool::OverTheAir air;
  air.repeat = repeat;
  air.channel = channel;
  air.channel.lead_in_s = 0.3;
  air.channel.max_random_lead_in_s = 0.5;
  air.channel.tail_s = 0.5;
  vesk_tool::StreamDecodingOptions options;
  options.chunk_bytes = chunk_bytes;
  const vesk_tool::Reception reception = vesk_tool::SendOverTheAir(
      *encoder, message, 2, air,
      [&](int rate, int channels) {
        DtmfDecoderConfig receiver = config;
        receiver.input_sample_rate = static_cast<float>(rate);
        receiver.num_channels = channels;
        return audio_modem::MakeDtmfAudioModemDecoder(receiver);
      },
      options);
  Heard result;
  for (const vesk_tool::FoundToken& found : reception.found) {
    (found.bytes == message ? result.correct : result.wrong) += 1;
  }
  return result;
}

TEST(DtmfLoopbackTest, CleanAtBothRatesMonoAndStereoAnyChunkSize) {
  for (const int rate : {44100, 48000}) {
    for (const int channels : {1, 2}) {
      for (const int chunk_bytes : {512, 16384}) {
        vesk_channel::ChannelParams channel;
        channel.mic_rate = rate;
        channel.channels = channels;
        channel.seed = static_cast<uint64_t>(rate + channels + chunk_bytes);
        const Heard heard = Loopback(DtmfDecoderConfig(), channel, chunk_bytes);
        EXPECT_EQ(heard.correct, 1) << rate << " Hz, " << channels << " ch, " << chunk_bytes;
        EXPECT_EQ(heard.wrong, 0) << rate << " Hz, " << channels << " ch, " << chunk_bytes;
      }
    }
  }
}

TEST(DtmfLoopbackTest, MinusTenDecibelsWithThreeRepetitions) {
  for (uint64_t seed = 1; seed <= 4; ++seed) {
    vesk_channel::ChannelParams channel;
    channel.snr_db = -10.0;
    channel.seed = seed;
    const Heard heard = Loopback(DtmfDecoderConfig(), channel, 4096);
    EXPECT_EQ(heard.correct, 1) << "seed " << seed;
    EXPECT_EQ(heard.wrong, 0) << "seed " << seed;
  }
}

TEST(DtmfLoopbackTest, OwnToneListsOfTwoAndThreeTonesPerSymbol) {
  DtmfDecoderConfig config;
  config.tone_frequencies = {800, 1000, 1250, 1600, 2000, 2500};
  config.tones_per_symbol = 2;  // 15 symbols.
  vesk_channel::ChannelParams channel;
  channel.snr_db = 0.0;
  channel.seed = 3;
  Heard heard = Loopback(config, channel, 4096);
  EXPECT_EQ(heard.correct, 1);
  EXPECT_EQ(heard.wrong, 0);
  config.tone_frequencies = {700, 1100, 1500, 1900, 2300};
  config.tones_per_symbol = 3;  // 10 symbols, as many as pairs.
  heard = Loopback(config, channel, 4096);
  EXPECT_EQ(heard.correct, 1);
  EXPECT_EQ(heard.wrong, 0);
}

TEST(DtmfLoopbackTest, NoTokenFromNoise) {
  const auto decoder = audio_modem::MakeDtmfAudioModemDecoder(DtmfDecoderConfig());
  vesk_tool::StreamDecoder stream(decoder.get(), 44100, 1, 5, 0,
                                  vesk_tool::StreamDecodingOptions());
  const std::vector<int16_t> noise = vesk_channel::MakeNoise(20.0, 44100, 1000.0, 5);
  EXPECT_TRUE(stream.Feed(noise.data(), static_cast<int64_t>(noise.size())).empty());
}

}  // namespace
