// The DTMF modem end to end, deterministically: the product transmitter's
// token through the channel simulator into the product receiver, fed as an
// app feeds it (16-bit PCM in chunks, tokens requested every 0.25 s).

#include <cstdint>
#include <vector>

#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/channel/channel_simulator.h"
#include "tools/vesk/stream_decoding.h"

namespace {

using audio_modem::DtmfDecoderConfig;

struct Heard {
  int correct = 0;  // Reports of the sent token.
  int wrong = 0;    // Reports of anything else.
};

// Plays 3 message bytes + 2 CRC bytes `repeat` times through `channel` and
// decodes them with a receiver of the same waveform.
Heard Loopback(const DtmfDecoderConfig& config, vesk_channel::ChannelParams channel,
               int chunk_bytes, int repeat = 3) {
  audio_modem::DtmfEncoderConfig encoder_config;
  static_cast<audio_modem::DtmfWaveformConfig&>(encoder_config) = config;
  const auto encoder = audio_modem::MakeDtmfAudioModemEncoder(encoder_config);
  const std::vector<uint8_t> message = {static_cast<uint8_t>(channel.seed * 37), 0xA5, 0x0F};
  std::vector<float> token, played;
  encoder->Encode(message, &token, 2);
  for (int r = 0; r < repeat; ++r) played.insert(played.end(), token.begin(), token.end());
  channel.lead_in_s = 0.3;
  channel.max_random_lead_in_s = 0.5;
  channel.tail_s = 0.5;
  const vesk_channel::ChannelOutput heard =
      vesk_channel::PlayThroughChannel(played, encoder->GetSampleRate(), channel);

  DtmfDecoderConfig receiver = config;
  receiver.input_sample_rate = static_cast<float>(heard.rate);
  receiver.num_channels = heard.channels;
  const auto decoder = audio_modem::MakeDtmfAudioModemDecoder(receiver);
  vesk_tool::StreamDecodingOptions options;
  options.chunk_bytes = chunk_bytes;
  vesk_tool::StreamDecoder stream(decoder.get(), heard.rate, heard.channels, 3, 2, options);
  Heard result;
  for (const vesk_tool::FoundToken& found :
       stream.Feed(heard.samples.data(), static_cast<int64_t>(heard.samples.size()))) {
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
