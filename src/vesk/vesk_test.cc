#include "vesk/vesk.h"

#include <cmath>
#include <cstring>
#include <functional>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "vesk/vesk_test_util.h"

namespace {

using vesk_test::Broadcast;
using vesk_test::Defaults;
using vesk_test::kFive;
using vesk_test::kSix;

vesk_decoder_options Options(int rate) {
  vesk_decoder_options options;
  EXPECT_EQ(vesk_decoder_options_defaults(&options), VESK_OK);
  options.microphone_rate_hz = rate;
  return options;
}

using vesk_test::Heard;
using vesk_test::TakeHeard;

// Feeds `pcm` in chunks of `chunk` samples, then flushes; every token heard.
std::vector<Heard> Decode(const vesk_config& config, const vesk_decoder_options& options,
                          const std::vector<int16_t>& pcm, size_t chunk) {
  vesk_decoder* decoder = nullptr;
  EXPECT_EQ(vesk_decoder_create(&config, &options, &decoder), VESK_OK) << vesk_last_error();
  std::vector<Heard> heard;
  for (size_t start = 0; start < pcm.size(); start += chunk) {
    EXPECT_EQ(
        vesk_decoder_process(decoder, pcm.data() + start, std::min(chunk, pcm.size() - start)),
        VESK_OK);
    TakeHeard(decoder, &heard);
  }
  EXPECT_EQ(vesk_decoder_flush(decoder), VESK_OK);
  TakeHeard(decoder, &heard);
  vesk_decoder_destroy(decoder);
  return heard;
}

TEST(VeskCTest, DefaultsAreTheProductConfigurations) {
  const vesk_config dsss = Defaults(VESK_MODEM_DSSS);
  EXPECT_EQ(dsss.message_bytes, 6);
  EXPECT_EQ(dsss.crc_check_bytes, 2);
  EXPECT_EQ(dsss.checksum_symbol, 0);
  EXPECT_EQ(dsss.dsss.number_of_taps, 7);
  EXPECT_EQ(dsss.dsss.coder_sample_rate_hz, 48000.0f);
  EXPECT_EQ(dsss.dsss.upsampling_factor, 16);
  EXPECT_EQ(dsss.dsss.baseband_decimation_factor, 4);
  EXPECT_EQ(dsss.dsss.carrier_frequency_hz, 18500.0f);
  EXPECT_EQ(dsss.dsss.broadcast_sample_rate_hz, 48000);
  EXPECT_EQ(dsss.dsss.transition_seconds, 0.005f);
  const vesk_config dtmf = Defaults(VESK_MODEM_DTMF);
  EXPECT_EQ(dtmf.message_bytes, 5);
  EXPECT_EQ(dtmf.crc_check_bytes, 0);
  EXPECT_EQ(dtmf.checksum_symbol, 1);
  EXPECT_EQ(dtmf.dtmf.sample_rate_hz, 44100.0f);
  EXPECT_EQ(dtmf.dtmf.tone_frequencies_hz, nullptr);
  EXPECT_EQ(dtmf.dtmf.attack_seconds, 0.025f);
  const vesk_decoder_options options = Options(44100);
  EXPECT_EQ(options.channels, 1);
  EXPECT_EQ(options.max_tokens_per_call, 2);
  EXPECT_EQ(options.poll_interval_seconds, 0.25);
  EXPECT_EQ(options.hold_seconds, 3.0);
  EXPECT_EQ(options.narrowband_excision, 1);
  EXPECT_STREQ(vesk_version(), VESK_VERSION_STRING);
}

// Encode with the defaults, play, decode: each modem, both DSSS coders,
// both microphone rates, and the listening mode.
TEST(VeskCTest, DefaultsRoundTrip) {
  struct Case {
    const char* name;
    vesk_modem modem;
    bool coder44100;
    int microphone_rate;
    bool listening;
  };
  for (const Case& c : {Case{"dsss 48k coder", VESK_MODEM_DSSS, false, 44100, false},
                        Case{"dsss 44.1k coder", VESK_MODEM_DSSS, true, 48000, false},
                        Case{"dtmf", VESK_MODEM_DTMF, false, 48000, false},
                        Case{"listening mode", VESK_MODEM_DSSS, false, 48000, true}}) {
    vesk_config config = Defaults(c.modem);
    if (c.coder44100) vesk_test::UseCoder44100(&config);
    // The loudspeaker plays at the microphone's rate.
    config.dsss.broadcast_sample_rate_hz = c.microphone_rate;
    config.dtmf.sample_rate_hz = static_cast<float>(c.microphone_rate);
    vesk_decoder_options options = Options(c.microphone_rate);
    options.listening_mode = c.listening;
    const std::vector<uint8_t>& message = c.modem == VESK_MODEM_DSSS ? kSix : kFive;
    const std::vector<Heard> heard = Decode(config, options, Broadcast(config, message), 4096);
    ASSERT_EQ(heard.size(), 1u) << c.name;
    EXPECT_EQ(heard[0].message, message) << c.name;
  }
}

// A steady tone 20 dB over the token in the modem's band (DSSS: 19 kHz;
// DTMF: 1200 Hz, 44.5 Hz below one of its tones): heard through the excision
// stage, not without it.
TEST(VeskCTest, NarrowbandExcisionHearsThroughASteadyToneAndCanBeTurnedOff) {
  for (const vesk_modem modem : {VESK_MODEM_DSSS, VESK_MODEM_DTMF}) {
    vesk_config config = Defaults(modem);
    config.dsss.broadcast_sample_rate_hz = 44100;
    const std::vector<uint8_t>& message = modem == VESK_MODEM_DSSS ? kSix : kFive;
    std::vector<int16_t> pcm = Broadcast(config, message);
    double power = 0;
    for (int16_t s : pcm) power += static_cast<double>(s) * s;
    const double rms = std::sqrt(power / pcm.size());
    const double hz = modem == VESK_MODEM_DSSS ? 19000 : 1200;
    for (size_t i = 0; i < pcm.size(); ++i) {
      const double tone = 10 * std::sqrt(2.0) * rms * std::sin(2 * M_PI * hz * i / 44100);
      pcm[i] = static_cast<int16_t>(std::lround(0.08 * (pcm[i] + tone)));
    }
    for (const int excision : {1, 0}) {
      vesk_decoder_options options = Options(44100);
      options.narrowband_excision = excision;
      const std::vector<Heard> heard = Decode(config, options, pcm, 4096);
      EXPECT_EQ(heard.size(), excision ? 1u : 0u) << modem << " " << excision;
      if (excision && !heard.empty()) {
        EXPECT_EQ(heard[0].message, message) << modem;
      }
    }
  }
}

TEST(VeskCTest, EncodedPcmIsTheFrontsAudioConverted) {
  const vesk_config config = Defaults(VESK_MODEM_DSSS);
  vesk_encoder* encoder = nullptr;
  ASSERT_EQ(vesk_encoder_create(&config, &encoder), VESK_OK);
  vesk_pcm pcm;
  ASSERT_EQ(vesk_encoder_encode(encoder, kSix.data(), kSix.size(), &pcm), VESK_OK);

  const auto front = audio_modem::MakeDsssAudioModemEncoder(audio_modem::DsssEncoderConfig());
  std::vector<float> audio, transition;
  front->Encode(kSix, &audio, 2);
  front->MakeStartTransition(audio, &transition);
  ASSERT_EQ(pcm.transition_samples, transition.size());
  ASSERT_EQ(pcm.token_samples, audio.size());
  EXPECT_EQ(pcm.transition_samples, 240u);  // 5 ms at 48 kHz.
  EXPECT_EQ(pcm.token_samples, 17u * 2032u);
  EXPECT_EQ(pcm.num_samples, pcm.transition_samples + pcm.token_samples);
  EXPECT_EQ(pcm.sample_rate_hz, 48000.0f);
  for (size_t i = 0; i < transition.size(); ++i) {
    ASSERT_EQ(pcm.samples[i], audio_dsp::FloatToPcm16(transition[i])) << i;
  }
  for (size_t i = 0; i < audio.size(); ++i) {
    ASSERT_EQ(pcm.samples[pcm.transition_samples + i], audio_dsp::FloatToPcm16(audio[i])) << i;
  }

  // Into the caller's buffer: the size is known in advance, a smaller buffer
  // is refused with the size it needs, the right one gets the same samples.
  size_t needed = 0;
  vesk_encoder* fresh = nullptr;
  ASSERT_EQ(vesk_encoder_create(&config, &fresh), VESK_OK);
  ASSERT_EQ(vesk_encoder_pcm_samples(fresh, &needed), VESK_OK);
  EXPECT_EQ(needed, pcm.num_samples);
  std::vector<int16_t> buffer(needed, 7);
  vesk_pcm into;
  EXPECT_EQ(
      vesk_encoder_encode_into(fresh, kSix.data(), kSix.size(), buffer.data(), needed - 1, &into),
      VESK_ERROR_BUFFER_TOO_SMALL);
  EXPECT_EQ(into.num_samples, needed);
  EXPECT_EQ(buffer[0], 7);
  ASSERT_EQ(vesk_encoder_encode_into(fresh, kSix.data(), kSix.size(), buffer.data(), needed, &into),
            VESK_OK);
  EXPECT_EQ(into.samples, buffer.data());
  EXPECT_EQ(into.transition_samples, pcm.transition_samples);
  EXPECT_EQ(std::memcmp(buffer.data(), pcm.samples, needed * sizeof(int16_t)), 0);
  vesk_pcm_free(&pcm);
  EXPECT_EQ(pcm.samples, nullptr);
  EXPECT_EQ(pcm.num_samples, 0u);
  vesk_encoder_destroy(fresh);
  vesk_encoder_destroy(encoder);
}

TEST(VeskCTest, ChunkSizesFromOneSampleToTenSecondsGiveTheSameTokens) {
  const vesk_config config = Defaults(VESK_MODEM_DSSS);
  vesk_decoder_options options = Options(48000);
  options.channels = 2;
  options.hold_seconds = 0;  // Every request's tokens, so times are compared too.
  std::vector<int16_t> stereo;
  for (const int16_t s : Broadcast(config, kSix)) stereo.insert(stereo.end(), {s, s});
  const std::vector<Heard> reference = Decode(config, options, stereo, 1);
  ASSERT_GE(reference.size(), 3u);
  EXPECT_EQ(reference[0].message, kSix);
  for (const size_t chunk : {size_t{3}, size_t{441}, size_t{4096}, size_t{96001}, size_t{960000}}) {
    EXPECT_EQ(Decode(config, options, stereo, chunk), reference) << "chunk " << chunk;
  }
}

// Float samples in -1 ... 1 are the 16-bit samples / 32768: fed either
// way, in any mix and any chunking, the decoder hears the same tokens at the
// same times.
TEST(VeskCTest, FloatInputIsTheSameStream) {
  const vesk_config config = Defaults(VESK_MODEM_DTMF);
  vesk_decoder_options options = Options(44100);
  options.hold_seconds = 0;
  const std::vector<int16_t> pcm = Broadcast(config, kFive);
  const std::vector<Heard> reference = Decode(config, options, pcm, pcm.size());
  ASSERT_GE(reference.size(), 3u);
  std::vector<float> floats;
  for (const int16_t s : pcm) floats.push_back(s / 32768.0f);
  for (const size_t chunk : {size_t{1}, size_t{4095}, size_t{10000}, floats.size()}) {
    vesk_decoder* decoder = nullptr;
    ASSERT_EQ(vesk_decoder_create(&config, &options, &decoder), VESK_OK);
    std::vector<Heard> heard;
    for (size_t start = 0, call = 0; start < floats.size(); start += chunk, ++call) {
      const size_t n = std::min(chunk, floats.size() - start);
      // Every third call takes the 16-bit path.
      ASSERT_EQ(call % 3 == 2 ? vesk_decoder_process(decoder, pcm.data() + start, n)
                              : vesk_decoder_process_float(decoder, floats.data() + start, n),
                VESK_OK);
      TakeHeard(decoder, &heard);
    }
    double seconds = 0;
    ASSERT_EQ(vesk_decoder_stream_seconds(decoder, &seconds), VESK_OK);
    EXPECT_EQ(seconds, pcm.size() / 44100.0) << "chunk " << chunk;
    ASSERT_EQ(vesk_decoder_flush(decoder), VESK_OK);
    const vesk_token* tokens = nullptr;
    size_t count = 0;
    ASSERT_EQ(vesk_decoder_take_tokens(decoder, &tokens, &count), VESK_OK);
    for (size_t i = 0; i < count; ++i) {
      heard.push_back(
          {std::vector<uint8_t>(tokens[i].message, tokens[i].message + tokens[i].message_bytes),
           tokens[i].time_seconds});
    }
    EXPECT_EQ(heard, reference) << "chunk " << chunk;
    vesk_decoder_destroy(decoder);
  }
}

TEST(VeskCTest, MinMicrophoneRateIsTwiceTheHighestCarrierOrTone) {
  float rate = 0;
  vesk_config dsss = Defaults(VESK_MODEM_DSSS);
  ASSERT_EQ(vesk_config_min_microphone_rate(&dsss, &rate), VESK_OK);
  EXPECT_EQ(rate, 37000.0f);
  dsss.dsss.carrier_frequency_hz = 12000;
  ASSERT_EQ(vesk_config_min_microphone_rate(&dsss, &rate), VESK_OK);
  EXPECT_EQ(rate, 24000.0f);
  // The default tone set tops out an octave above 1244.53 Hz.
  vesk_config dtmf = Defaults(VESK_MODEM_DTMF);
  ASSERT_EQ(vesk_config_min_microphone_rate(&dtmf, &rate), VESK_OK);
  EXPECT_NEAR(rate, 4 * 1244.53f, 0.05f);
  static const float kTones[] = {900, 3100, 1700};
  dtmf.dtmf.tone_frequencies_hz = kTones;
  dtmf.dtmf.num_tones = 3;
  ASSERT_EQ(vesk_config_min_microphone_rate(&dtmf, &rate), VESK_OK);
  EXPECT_EQ(rate, 6200.0f);
  // A waveform that cannot be used has no rate; *rate_hz is left alone.
  dtmf.dtmf.sustain_level = 2;
  rate = -1;
  EXPECT_EQ(vesk_config_min_microphone_rate(&dtmf, &rate), VESK_ERROR_CONFIG);
  EXPECT_STREQ(vesk_last_error(), "the sustain amplitude must lie in [0, 1]");
  dsss.dsss.bits_per_symbol = 3;
  EXPECT_EQ(vesk_config_min_microphone_rate(&dsss, &rate), VESK_ERROR_CONFIG);
  EXPECT_STREQ(vesk_last_error(), "bits per symbol must be 1, 2, 4 or 8");
  dsss = Defaults(VESK_MODEM_DSSS);
  dsss.crc_check_bytes = 1;
  EXPECT_EQ(vesk_config_min_microphone_rate(&dsss, &rate), VESK_ERROR_CONFIG);
  EXPECT_STREQ(vesk_last_error(), "crc_check_bytes must be 0 or 2");
  EXPECT_EQ(rate, -1.0f);
}

// Every refusal is a status and a sentence; nothing aborts.
TEST(VeskCTest, RefusedConfigurationsSayWhy) {
  using Edit = std::function<void(vesk_config*, vesk_decoder_options*)>;
  struct Case {
    vesk_modem modem;
    Edit edit;
    const char* error;  // What the sentence contains.
  };
  const float nan = std::numeric_limits<float>::quiet_NaN();
  const float inf = std::numeric_limits<float>::infinity();
  static const float kLoudTones[] = {1000, 2000, 22050};
  const std::vector<Case> cases = {
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->modem = 7; }, "modem"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->message_bytes = 0; }, "message_bytes"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->message_bytes = 255; }, "message_bytes"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->crc_check_bytes = 1; }, "crc_check_bytes"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->checksum_symbol = 2; }, "checksum_symbol"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.number_of_taps = 4; }, "taps"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.number_of_taps = 12; }, "taps"},
      {VESK_MODEM_DSSS,
       [](auto* c, auto*) {
         c->dsss.number_of_taps = 6;
         c->dsss.code_number = 3;
       },
       "code number"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.code_number = -1; }, "code number"},
      {VESK_MODEM_DSSS, [&](auto* c, auto*) { c->dsss.coder_sample_rate_hz = nan; }, "coder"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.coder_sample_rate_hz = 0; }, "coder"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.upsampling_factor = 0; }, "upsampling"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.upsampling_factor = 1000; }, "frame"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.baseband_decimation_factor = 3; }, "multiple"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.carrier_frequency_hz = 0; }, "carrier"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.carrier_frequency_hz = 24001; }, "carrier"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.bits_per_symbol = 3; }, "bits per symbol"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.min_cycles_per_frame = -1; }, "cycles"},
      {VESK_MODEM_DSSS, [](auto* c, auto*) { c->dsss.quadrature_carrier = -1; }, "quadrature"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.sample_rate_hz = 0; }, "sample rate"},
      {VESK_MODEM_DTMF, [&](auto* c, auto*) { c->dtmf.sample_rate_hz = inf; }, "sample rate"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.baseband_decimation_factor = 0; },
       "decimation"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.window_seconds = 0; }, "symbol duration"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.tones_per_symbol = 3; }, "2 tones"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.sample_rate_hz = 4000; }, "tone"},
      {VESK_MODEM_DTMF,
       [](auto* c, auto*) {
         c->dtmf.tone_frequencies_hz = kLoudTones;
         c->dtmf.num_tones = 3;
       },
       "tone"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.num_tones = 4; }, "NULL"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.num_tones = -1; }, "num_tones"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.attack_seconds = -0.01f; }, "envelope"},
      {VESK_MODEM_DTMF, [&](auto* c, auto*) { c->dtmf.release_seconds = nan; }, "envelope"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.sustain_seconds = 0.001f; }, "add up"},
      {VESK_MODEM_DTMF, [](auto* c, auto*) { c->dtmf.sustain_level = 1.5f; }, "sustain"},
  };
  const std::vector<Case> decoder_cases = {
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->microphone_rate_hz = 999; }, "microphone rate"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->microphone_rate_hz = 384001; }, "microphone rate"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->channels = 0; }, "channels"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->channels = 65; }, "channels"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->max_tokens_per_call = 0; }, "tokens per call"},
      {VESK_MODEM_DTMF, [](auto*, auto* o) { o->max_tokens_per_call = 7; }, "tokens per call"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->buffer_length_tokens = 0.5f; }, "buffer"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->acquisition_window_seconds = 0; }, "window"},
      {VESK_MODEM_DSSS,
       [](auto*, auto* o) {
         o->listening_mode = 1;
         o->microphone_rate_hz = 36000;
       },
       "36994"},
      {VESK_MODEM_DTMF, [](auto*, auto* o) { o->listening_mode = 1; }, "DSSS transmitters only"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->listening_mode = 2; }, "listening_mode"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->poll_interval_seconds = 0; }, "poll interval"},
      {VESK_MODEM_DSSS, [](auto*, auto* o) { o->hold_seconds = -1; }, "hold"},
      {VESK_MODEM_DTMF, [](auto*, auto* o) { o->narrowband_excision = 2; }, "narrowband_excision"},
  };
  for (const Case& c : cases) {
    vesk_config config = Defaults(c.modem);
    vesk_decoder_options options = Options(44100);
    c.edit(&config, &options);
    vesk_encoder* encoder = nullptr;
    EXPECT_EQ(vesk_encoder_create(&config, &encoder), VESK_ERROR_CONFIG) << c.error;
    EXPECT_NE(std::string(vesk_last_error()).find(c.error), std::string::npos) << vesk_last_error();
    EXPECT_EQ(encoder, nullptr);
    vesk_decoder* decoder = nullptr;
    EXPECT_EQ(vesk_decoder_create(&config, &options, &decoder), VESK_ERROR_CONFIG) << c.error;
    EXPECT_NE(std::string(vesk_last_error()).find(c.error), std::string::npos) << vesk_last_error();
    EXPECT_EQ(decoder, nullptr);
  }
  for (const Case& c : decoder_cases) {
    vesk_config config = Defaults(c.modem);
    vesk_decoder_options options = Options(44100);
    c.edit(&config, &options);
    vesk_decoder* decoder = nullptr;
    EXPECT_EQ(vesk_decoder_create(&config, &options, &decoder), VESK_ERROR_CONFIG) << c.error;
    EXPECT_NE(std::string(vesk_last_error()).find(c.error), std::string::npos) << vesk_last_error();
  }
  // A carrier too high for the broadcast rate is the transmitter's problem.
  vesk_config config = Defaults(VESK_MODEM_DSSS);
  config.dsss.broadcast_sample_rate_hz = 8000;
  vesk_encoder* encoder = nullptr;
  EXPECT_EQ(vesk_encoder_create(&config, &encoder), VESK_ERROR_CONFIG);
  EXPECT_STREQ(vesk_last_error(),
               "the carrier (18500 Hz) must lie below half the broadcast sample rate");
  vesk_decoder* decoder = nullptr;
  EXPECT_EQ(vesk_decoder_create(&config, nullptr, &decoder), VESK_OK);
  EXPECT_STREQ(vesk_last_error(), "");
  vesk_decoder_destroy(decoder);
}

TEST(VeskCTest, NullPointersAndWrongLengthsAreArgumentErrors) {
  const vesk_config config = Defaults(VESK_MODEM_DSSS);
  vesk_encoder* encoder = nullptr;
  vesk_decoder* decoder = nullptr;
  ASSERT_EQ(vesk_encoder_create(&config, &encoder), VESK_OK);
  ASSERT_EQ(vesk_decoder_create(&config, nullptr, &decoder), VESK_OK);
  vesk_config scratch;
  vesk_pcm pcm;
  size_t size = 0;
  int16_t sample = 0;
  float level = 0;
  const vesk_token* tokens = nullptr;
  int heard = 0;
  double seconds = 0;
  const std::vector<std::function<vesk_status()>> calls = {
      [&] { return vesk_config_defaults(nullptr, VESK_MODEM_DSSS); },
      [&] { return vesk_config_defaults(&scratch, -1); },
      [&] { return vesk_decoder_options_defaults(nullptr); },
      [&] { return vesk_encoder_create(nullptr, &encoder); },
      [&] { return vesk_encoder_create(&config, nullptr); },
      [&] { return vesk_encoder_encode(nullptr, kSix.data(), 6, &pcm); },
      [&] { return vesk_encoder_encode(encoder, nullptr, 6, &pcm); },
      [&] { return vesk_encoder_encode(encoder, kSix.data(), 6, nullptr); },
      [&] { return vesk_encoder_encode(encoder, kSix.data(), 5, &pcm); },
      [&] { return vesk_encoder_encode(encoder, kSix.data(), 0, &pcm); },
      [&] { return vesk_encoder_pcm_samples(nullptr, &size); },
      [&] { return vesk_encoder_pcm_samples(encoder, nullptr); },
      [&] { return vesk_encoder_encode_into(encoder, kSix.data(), 6, nullptr, 9, &pcm); },
      [&] { return vesk_encoder_encode_into(encoder, kSix.data(), 7, &sample, 1, &pcm); },
      [&] { return vesk_decoder_create(nullptr, nullptr, &decoder); },
      [&] { return vesk_decoder_create(&config, nullptr, nullptr); },
      [&] { return vesk_decoder_process(nullptr, &sample, 1); },
      [&] { return vesk_decoder_process(decoder, nullptr, 1); },
      [&] { return vesk_decoder_process_float(nullptr, &level, 1); },
      [&] { return vesk_decoder_process_float(decoder, nullptr, 1); },
      [&] { return vesk_config_min_microphone_rate(nullptr, &level); },
      [&] { return vesk_config_min_microphone_rate(&config, nullptr); },
      [&] { return vesk_decoder_flush(nullptr); },
      [&] { return vesk_decoder_take_tokens(decoder, nullptr, &size); },
      [&] { return vesk_decoder_take_tokens(decoder, &tokens, nullptr); },
      [&] { return vesk_decoder_broadcaster(nullptr, &heard); },
      [&] { return vesk_decoder_broadcaster(decoder, nullptr); },
      [&] { return vesk_decoder_stream_seconds(decoder, nullptr); },
      [&] { return vesk_decoder_wipe(nullptr); },
  };
  for (size_t i = 0; i < calls.size(); ++i) {
    EXPECT_EQ(calls[i](), VESK_ERROR_ARGUMENT) << "call " << i;
    EXPECT_STRNE(vesk_last_error(), "") << "call " << i;
  }
  EXPECT_STREQ(vesk_status_name(VESK_ERROR_ARGUMENT), "VESK_ERROR_ARGUMENT");
  EXPECT_STREQ(vesk_status_name(-3), "unknown status");
  // Zero samples are no error, and nothing happens.
  EXPECT_EQ(vesk_decoder_process(decoder, nullptr, 0), VESK_OK);
  EXPECT_STREQ(vesk_last_error(), "");
  EXPECT_EQ(vesk_decoder_process_float(decoder, nullptr, 0), VESK_OK);
  EXPECT_EQ(vesk_decoder_stream_seconds(decoder, &seconds), VESK_OK);
  EXPECT_EQ(seconds, 0.0);
  vesk_encoder_destroy(nullptr);
  vesk_decoder_destroy(nullptr);
  vesk_pcm_free(nullptr);
  vesk_encoder_destroy(encoder);
  vesk_decoder_destroy(decoder);
}

TEST(VeskCTest, EachThreadKeepsItsOwnLastError) {
  vesk_config config = Defaults(VESK_MODEM_DSSS);
  config.message_bytes = 0;
  vesk_encoder* encoder = nullptr;
  ASSERT_EQ(vesk_encoder_create(&config, &encoder), VESK_ERROR_CONFIG);
  std::string other;
  std::thread([&] { other = vesk_last_error(); }).join();
  EXPECT_EQ(other, "");
  EXPECT_NE(std::string(vesk_last_error()), "");
}

TEST(VeskCTest, BroadcasterAndWipe) {
  const vesk_config config = Defaults(VESK_MODEM_DSSS);
  vesk_decoder_options options = Options(48000);
  std::vector<int16_t> pcm = Broadcast(config, kSix);
  pcm.resize(pcm.size() - 48000);  // End while the token is still heard.
  vesk_decoder* decoder = nullptr;
  ASSERT_EQ(vesk_decoder_create(&config, &options, &decoder), VESK_OK);
  int heard = -1;
  ASSERT_EQ(vesk_decoder_broadcaster(decoder, &heard), VESK_OK);
  EXPECT_EQ(heard, 0);
  ASSERT_EQ(vesk_decoder_process(decoder, pcm.data(), pcm.size()), VESK_OK);
  ASSERT_EQ(vesk_decoder_broadcaster(decoder, &heard), VESK_OK);
  EXPECT_EQ(heard, 1);
  double seconds = 0;
  ASSERT_EQ(vesk_decoder_stream_seconds(decoder, &seconds), VESK_OK);
  EXPECT_EQ(seconds, static_cast<double>(pcm.size()) / 48000);
  const vesk_token* tokens = nullptr;
  size_t count = 0;
  ASSERT_EQ(vesk_decoder_take_tokens(decoder, &tokens, &count), VESK_OK);
  ASSERT_EQ(count, 1u);
  // Wiped, the decoder hears the same token as a new sighting.
  ASSERT_EQ(vesk_decoder_wipe(decoder), VESK_OK);
  ASSERT_EQ(vesk_decoder_broadcaster(decoder, &heard), VESK_OK);
  EXPECT_EQ(heard, 0);
  ASSERT_EQ(vesk_decoder_process(decoder, pcm.data(), pcm.size()), VESK_OK);
  ASSERT_EQ(vesk_decoder_take_tokens(decoder, &tokens, &count), VESK_OK);
  EXPECT_EQ(count, 1u);
  ASSERT_EQ(vesk_decoder_take_tokens(decoder, &tokens, &count), VESK_OK);
  EXPECT_EQ(count, 0u);
  vesk_decoder_destroy(decoder);
}

}  // namespace
