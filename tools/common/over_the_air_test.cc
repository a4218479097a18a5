#include "tools/common/over_the_air.h"

#include <cmath>
#include <vector>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace vesk_tool {
namespace {

const std::vector<uint8_t> kMessage = {1, 2, 3, 4, 5, 6};

TEST(OverTheAirTest, PlaybackIsTheTransitionThenTheTokenRepeated) {
  const auto dsss = audio_modem::MakeDsssAudioModemEncoder(audio_modem::DsssEncoderConfig());
  const Playback playback = MakePlayback(*dsss, kMessage, 2, 2);
  // 5 ms at 48 kHz, then 17 frames of 2032 samples, twice.
  EXPECT_EQ(playback.transition_samples, 240u);
  EXPECT_EQ(playback.token_samples, 17u * 2032u);
  ASSERT_EQ(playback.samples.size(), 240u + 2u * 17u * 2032u);
  for (size_t i = 0; i < playback.token_samples; ++i) {
    ASSERT_EQ(playback.samples[240 + i], playback.samples[240 + playback.token_samples + i]);
  }
  // DTMF tokens start and end at silence: no transition.
  const auto dtmf = audio_modem::MakeDtmfAudioModemEncoder(audio_modem::DtmfEncoderConfig());
  const Playback tones = MakePlayback(*dtmf, {1, 2, 3, 4, 5}, 0, 3);
  EXPECT_EQ(tones.transition_samples, 0u);
  EXPECT_EQ(tones.samples.size(), 3 * tones.token_samples);
  // A token the encoder refuses plays nothing.
  base::ScopedLogCapture log;
  EXPECT_TRUE(MakePlayback(*dsss, {1, 2, 3}, 2, 3).samples.empty());
}

TEST(OverTheAirTest, SendsDeterministicallyAndJudgesTheReception) {
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(audio_modem::DsssEncoderConfig());
  OverTheAir air;
  air.repeat = 1;
  air.channel.snr_db = 10;
  air.channel.lead_in_s = 0.3;
  air.channel.max_random_lead_in_s = 0.2;
  air.channel.tail_s = 0.5;
  air.channel.seed = 7;
  const DecoderFactory make_decoder = [](int rate, int channels) {
    audio_modem::DsssDecoderConfig config;
    config.input_sample_rate = static_cast<float>(rate);
    config.num_channels = channels;
    return audio_modem::MakeDsssAudioModemDecoder(config);
  };
  const Reception first = SendOverTheAir(*encoder, kMessage, 2, air, make_decoder, {});
  EXPECT_EQ(first.transmit_rate, 48000.0f);
  EXPECT_EQ(first.token_samples, 17u * 2032u);
  EXPECT_EQ(first.heard.rate, 44100);
  EXPECT_GE(first.signal_start_s, 0.3);
  EXPECT_LT(first.signal_start_s, 0.5);
  ASSERT_EQ(first.found.size(), 1u);
  const TrialResult result = Judge(first, kMessage);
  EXPECT_TRUE(result.correct);
  EXPECT_EQ(result.wrong, 0);
  EXPECT_DOUBLE_EQ(result.found_delay_s, first.found[0].time_s - first.signal_start_s);
  // The same seed, the same room and the same reports.
  const Reception second = SendOverTheAir(*encoder, kMessage, 2, air, make_decoder, {});
  EXPECT_EQ(second.heard.samples, first.heard.samples);
  ASSERT_EQ(second.found.size(), 1u);
  EXPECT_EQ(second.found[0].time_s, first.found[0].time_s);
}

TEST(OverTheAirTest, JudgeCountsWrongTokensAndTimesTheFirstRightOne) {
  Reception reception;
  reception.signal_start_s = 0.5;
  reception.broadcaster_time_s = 0.7;
  reception.found = {{1.0, {9}}, {2.0, kMessage}, {3.0, kMessage}, {4.0, {8}}};
  const TrialResult result = Judge(reception, kMessage);
  EXPECT_TRUE(result.correct);
  EXPECT_EQ(result.wrong, 2);
  EXPECT_DOUBLE_EQ(result.found_delay_s, 1.5);
  EXPECT_DOUBLE_EQ(result.heard_delay_s, 0.2);
  reception.found.clear();
  reception.broadcaster_time_s = -1;
  const TrialResult nothing = Judge(reception, kMessage);
  EXPECT_FALSE(nothing.correct);
  EXPECT_EQ(nothing.found_delay_s, -1);
  EXPECT_EQ(nothing.heard_delay_s, -1);
}

TEST(OverTheAirTest, JudgeTellsTheSecondTransmittersTokenFromWrongOnes) {
  Reception reception;
  reception.second_message = SecondMessage(kMessage);
  EXPECT_EQ(reception.second_message, (std::vector<uint8_t>{254, 253, 252, 251, 250, 249}));
  reception.found = {{1.0, reception.second_message}, {2.0, {9}}};
  TrialResult result = Judge(reception, kMessage);
  EXPECT_FALSE(result.correct);
  EXPECT_TRUE(result.second_correct);
  EXPECT_EQ(result.wrong, 1);
  // Without a second transmitter its token would be wrong.
  reception.second_message.clear();
  result = Judge(reception, kMessage);
  EXPECT_FALSE(result.second_correct);
  EXPECT_EQ(result.wrong, 2);
}

TEST(OverTheAirTest, ASecondTransmitterSendsTheOtherToken) {
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(audio_modem::DsssEncoderConfig());
  OverTheAir air;
  air.repeat = 2;
  air.channel.snr_db = 10;
  air.channel.second_power_db = -6;
  air.channel.second_offset_s = 1.0;
  air.channel.tail_s = 2.0;
  const Reception reception =
      SendOverTheAir(*encoder, kMessage, 2, air,
                     [](int rate, int channels) {
                       audio_modem::DsssDecoderConfig config;
                       config.input_sample_rate = static_cast<float>(rate);
                       config.num_channels = channels;
                       return audio_modem::MakeDsssAudioModemDecoder(config);
                     },
                     {});
  EXPECT_EQ(reception.second_message, SecondMessage(kMessage));
  const TrialResult result = Judge(reception, kMessage);
  EXPECT_TRUE(result.correct);
  EXPECT_TRUE(result.second_correct);
  EXPECT_EQ(result.wrong, 0);
}

TEST(OverTheAirTest, OptionsSetTheRoomWithinTheSimulatorsRanges) {
  OverTheAir air;
  air.channel.lead_in_s = 0.5;
  OptionParser parser;
  AddOverTheAirOptions(&parser, &air);
  EXPECT_NE(parser.Help().find("silence before the signal, s (0 to 60; default 0.5)"),
            std::string::npos)
      << parser.Help();
  std::string error;
  ASSERT_TRUE(
      parser.Parse({"--repeat", "2",          "--snr", "inf",        "--reverb", "--rt60",
                    "0.5",      "--mic-rate", "48000", "--channels", "2",        "--speed",
                    "1.002",    "--babble",   "3",     "--lead-in",  "0.1",      "--random-lead-in",
                    "0",        "--tail",     "0.2"},
                   &error))
      << error;
  EXPECT_EQ(air.repeat, 2);
  EXPECT_TRUE(std::isinf(air.channel.snr_db));
  EXPECT_TRUE(air.channel.reverb);
  EXPECT_EQ(air.channel.rt60_s, 0.5);
  EXPECT_EQ(air.channel.mic_rate, 48000);
  EXPECT_EQ(air.channel.channels, 2);
  EXPECT_EQ(air.channel.speed, 1.002);
  EXPECT_EQ(air.channel.babble_sir_db, 3);
  EXPECT_EQ(air.channel.lead_in_s, 0.1);
  EXPECT_EQ(air.channel.max_random_lead_in_s, 0);
  EXPECT_EQ(air.channel.tail_s, 0.2);
  for (const std::vector<std::string>& bad :
       std::vector<std::vector<std::string>>{{"--channels", "3"},
                                             {"--speed", "0"},
                                             {"--repeat", "0"},
                                             {"--mic-rate", "4000"},
                                             {"--snr", "-inf"},
                                             {"--tail", "-1"},
                                             {"--speaker", "cheap"},
                                             {"--overdrive", "-1"},
                                             {"--tones", "0"},
                                             {"--walk", "4"},
                                             {"--second", "inf"},
                                             {"--music-harmonics", "0"}}) {
    EXPECT_FALSE(parser.Parse(bad, &error)) << bad[0];
  }
}

TEST(OverTheAirTest, ImpairmentOptionsSetTheChannel) {
  OverTheAir air;
  OptionParser parser;
  AddOverTheAirOptions(&parser, &air);
  std::string error;
  ASSERT_TRUE(parser.Parse({"--level",
                            "-30",
                            "--speaker",
                            "budget",
                            "--microphone",
                            "flagship",
                            "--overdrive",
                            "6",
                            "--agc",
                            "20",
                            "--agc-interval",
                            "2",
                            "--dropout",
                            "0.04",
                            "--dropout-every",
                            "0.5",
                            "--walk",
                            "1.2",
                            "--walk-closest",
                            "0.7",
                            "--tones",
                            "1200,18600",
                            "--random-tones",
                            "2",
                            "--tone-band-low",
                            "15500",
                            "--tone-band-high",
                            "21500",
                            "--tone-sir",
                            "-20",
                            "--impulses",
                            "2",
                            "--impulse-peak",
                            "30",
                            "--second",
                            "-6",
                            "--second-offset",
                            "0.2",
                            "--music",
                            "3",
                            "--music-harmonics",
                            "24"},
                           &error))
      << error;
  const vesk_channel::ChannelParams& c = air.channel;
  EXPECT_EQ(c.level_db, -30);
  EXPECT_EQ(c.speaker, vesk_channel::DeviceProfile::kBudgetPhone);
  EXPECT_EQ(c.microphone, vesk_channel::DeviceProfile::kFlagshipPhone);
  EXPECT_EQ(c.overdrive_db, 6);
  EXPECT_EQ(c.agc.step_db, 20);
  EXPECT_EQ(c.agc.interval_s, 2);
  EXPECT_EQ(c.dropouts.length_s, 0.04);
  EXPECT_EQ(c.dropouts.interval_s, 0.5);
  EXPECT_EQ(c.walk_speed_mps, 1.2);
  EXPECT_EQ(c.walk_closest_m, 0.7);
  EXPECT_EQ(c.tone_frequencies_hz, (std::vector<double>{1200, 18600}));
  EXPECT_EQ(c.random_tones, 2);
  EXPECT_EQ(c.random_tone_low_hz, 15500);
  EXPECT_EQ(c.random_tone_high_hz, 21500);
  EXPECT_EQ(c.tone_sir_db, -20);
  EXPECT_EQ(c.impulses.per_second, 2);
  EXPECT_EQ(c.impulses.peak_over_signal_db, 30);
  EXPECT_EQ(c.second_power_db, -6);
  EXPECT_EQ(c.second_offset_s, 0.2);
  EXPECT_EQ(c.music_sir_db, 3);
  EXPECT_EQ(c.music.harmonics, 24);
  EXPECT_EQ(OverTheAirError(air), "");
}

TEST(OverTheAirTest, OptionsThatDoNotFitTogetherAreRefused) {
  OverTheAir air;
  air.channel.tone_frequencies_hz = {23000};
  EXPECT_EQ(OverTheAirError(air),
            "--tones 23000: a tone must lie below half the microphone rate (22050 Hz)");
  air.channel.tone_frequencies_hz.clear();
  air.channel.random_tones = 1;
  EXPECT_EQ(OverTheAirError(air),
            "--random-tones: the tone band needs 0 < --tone-band-low <= --tone-band-high");
  air.channel.random_tone_low_hz = 15000;
  air.channel.random_tone_high_hz = 23000;
  EXPECT_EQ(OverTheAirError(air),
            "--tone-band-high 23000: must lie below half the microphone rate (22050 Hz)");
  air.channel.mic_rate = 48000;
  EXPECT_EQ(OverTheAirError(air), "");
  air.channel.second_power_db = 0;
  air.channel.second_offset_s = -0.5;
  EXPECT_EQ(OverTheAirError(air),
            "--second-offset -0.5: the second transmitter may start at most --lead-in (0.2 s) "
            "before the first");
}

}  // namespace
}  // namespace vesk_tool
