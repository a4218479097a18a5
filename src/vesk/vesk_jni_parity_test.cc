// The C interface and the JNI entry points (called through a fake JNIEnv)
// hear the same tokens and the same broadcaster answers on the same audio,
// and encode the same PCM.

#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

#include "gtest/gtest.h"
#include "location/pellam/cpp/audio/jni/fake_jni_env.h"
#include "vesk/vesk.h"
#include "vesk/vesk_test_util.h"

namespace {

using vesk_test::Broadcast;
using vesk_test::Defaults;

// What one request heard.
struct Request {
  bool broadcaster;
  std::vector<std::vector<uint8_t>> tokens;
  bool operator==(const Request& other) const {
    return broadcaster == other.broadcaster && tokens == other.tokens;
  }
};

size_t BlockSamples(const vesk_decoder_options& options) {
  return static_cast<size_t>(
             std::round(options.poll_interval_seconds * options.microphone_rate_hz)) *
         options.channels;
}

// Through the C interface, one request per block, every token reported.
std::vector<Request> ThroughC(const vesk_config& config, vesk_decoder_options options,
                              const std::vector<int16_t>& pcm) {
  options.hold_seconds = 0;
  vesk_decoder* decoder = nullptr;
  EXPECT_EQ(vesk_decoder_create(&config, &options, &decoder), VESK_OK) << vesk_last_error();
  std::vector<Request> requests;
  const size_t block = BlockSamples(options);
  for (size_t start = 0; start + block <= pcm.size(); start += block) {
    EXPECT_EQ(vesk_decoder_process(decoder, pcm.data() + start, block), VESK_OK);
    Request request;
    int heard = 0;
    EXPECT_EQ(vesk_decoder_broadcaster(decoder, &heard), VESK_OK);
    request.broadcaster = heard != 0;
    const vesk_token* tokens = nullptr;
    size_t count = 0;
    EXPECT_EQ(vesk_decoder_take_tokens(decoder, &tokens, &count), VESK_OK);
    for (size_t i = 0; i < count; ++i) {
      request.tokens.emplace_back(tokens[i].message, tokens[i].message + tokens[i].message_bytes);
    }
    requests.push_back(request);
  }
  vesk_decoder_destroy(decoder);
  return requests;
}

// Through the JNI entry points, as the Java decoder drives them: pieces of at
// most 4096 frames from a direct buffer, and a request after each block.
std::vector<Request> ThroughJni(const vesk_config& config, const vesk_decoder_options& options,
                                const std::vector<int16_t>& pcm) {
  vesk_jni::FakeJniEnv jni;
  JNIEnv* env = jni.env();
  jobject thiz = jni.PlainObject();
  jobject receiver = jni.Receiver();
  constexpr int kId = 3;
  const int token_bytes = config.message_bytes + config.crc_check_bytes;
  if (config.modem == VESK_MODEM_DSSS) {
    const vesk_dsss_waveform& w = config.dsss;
    EXPECT_TRUE(Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDsss(
        env, thiz, kId, token_bytes, config.checksum_symbol, options.design_baseband_filter,
        w.number_of_taps, w.code_number, w.coder_sample_rate_hz, w.upsampling_factor,
        w.carrier_frequency_hz, w.bits_per_symbol, w.min_cycles_per_frame,
        w.baseband_decimation_factor, w.quadrature_carrier, options.acquisition_window_seconds,
        options.broadcaster_threshold, options.max_tokens_per_call,
        static_cast<float>(options.microphone_rate_hz), options.channels,
        options.buffer_length_tokens, options.listening_mode));
  } else {
    const vesk_dtmf_waveform& w = config.dtmf;
    EXPECT_TRUE(Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDtmf(
        env, thiz, kId, token_bytes, config.checksum_symbol, w.sample_rate_hz,
        w.baseband_decimation_factor, w.window_seconds, w.tones_per_symbol, 0,
        options.max_tokens_per_call, static_cast<float>(options.microphone_rate_hz),
        options.channels, w.attack_seconds, w.decay_seconds, w.sustain_seconds, w.release_seconds,
        w.sustain_level, options.buffer_length_tokens,
        jni.FloatArray(
            std::vector<float>(w.tone_frequencies_hz, w.tone_frequencies_hz + w.num_tones))));
  }
  std::vector<Request> requests;
  const size_t block = BlockSamples(options);
  const size_t piece = 4096 * static_cast<size_t>(options.channels);
  std::vector<int16_t> direct(piece);
  jobject buffer = jni.DirectBuffer(direct.data(), static_cast<int64_t>(direct.size() * 2));
  for (size_t start = 0; start + block <= pcm.size(); start += block) {
    for (size_t at = start; at < start + block; at += piece) {
      const size_t n = std::min(piece, start + block - at);
      std::memcpy(direct.data(), pcm.data() + at, n * sizeof(int16_t));
      if (options.listening_mode) {
        Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamplesWithZintar(
            env, thiz, kId, buffer, 0, static_cast<jint>(2 * n));
      } else {
        Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamples(
            env, thiz, kId, buffer, 0, static_cast<jint>(2 * n));
      }
    }
    Request request;
    request.broadcaster =
        Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeDetectBroadcaster(env, thiz,
                                                                                     kId);
    jni.added_tokens.clear();
    Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetTokens(
        env, thiz, kId, receiver, config.message_bytes, config.crc_check_bytes);
    request.tokens = jni.added_tokens;
    requests.push_back(request);
  }
  Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeRelease(env, thiz, kId);
  return requests;
}

TEST(VeskJniParityTest, DecodersHearTheSameOnTheSameAudio) {
  struct Case {
    const char* name;
    vesk_modem modem;
    bool coder44100;
    int rate;
    int channels;
    bool listening;
  };
  for (const Case& c : {Case{"dsss 48k coder", VESK_MODEM_DSSS, false, 48000, 1, false},
                        Case{"dsss 44.1k coder, stereo", VESK_MODEM_DSSS, true, 44100, 2, false},
                        Case{"dtmf", VESK_MODEM_DTMF, false, 44100, 1, false},
                        Case{"listening mode, stereo", VESK_MODEM_DSSS, false, 48000, 2, true}}) {
    vesk_config config = Defaults(c.modem);
    if (c.coder44100) vesk_test::UseCoder44100(&config);
    config.dsss.broadcast_sample_rate_hz = c.rate;
    vesk_decoder_options options;
    vesk_decoder_options_defaults(&options);
    options.microphone_rate_hz = c.rate;
    options.channels = c.channels;
    options.listening_mode = c.listening;
    std::vector<int16_t> pcm;
    for (const int16_t s :
         Broadcast(config, c.modem == VESK_MODEM_DSSS ? vesk_test::kSix : vesk_test::kFive)) {
      pcm.insert(pcm.end(), c.channels, s);
    }
    const std::vector<Request> through_c = ThroughC(config, options, pcm);
    const std::vector<Request> through_jni = ThroughJni(config, options, pcm);
    ASSERT_EQ(through_c.size(), through_jni.size()) << c.name;
    int with_tokens = 0;
    for (size_t i = 0; i < through_c.size(); ++i) {
      EXPECT_EQ(through_c[i], through_jni[i]) << c.name << ", request " << i;
      with_tokens += !through_c[i].tokens.empty();
    }
    EXPECT_GE(with_tokens, 3) << c.name;
  }
}

TEST(VeskJniParityTest, EncodersMakeTheSamePcm) {
  vesk_config config = Defaults(VESK_MODEM_DSSS);
  vesk_test::UseCoder44100(&config);
  vesk_encoder* encoder = nullptr;
  ASSERT_EQ(vesk_encoder_create(&config, &encoder), VESK_OK);
  vesk_pcm pcm;
  ASSERT_EQ(vesk_encoder_encode(encoder, vesk_test::kSix.data(), 6, &pcm), VESK_OK);

  vesk_jni::FakeJniEnv jni;
  jobject thiz = jni.PlainObject();
  const vesk_dsss_waveform& w = config.dsss;
  ASSERT_TRUE(Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeInitializeDsss(
      jni.env(), thiz, 8, false, false, w.number_of_taps, w.code_number, w.coder_sample_rate_hz,
      w.upsampling_factor, w.carrier_frequency_hz, w.bits_per_symbol, w.min_cycles_per_frame,
      w.baseband_decimation_factor, w.quadrature_carrier, w.broadcast_sample_rate_hz,
      w.transition_seconds));
  Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeEncode(
      jni.env(), thiz, jni.ByteArray(vesk_test::kSix), jni.Receiver(), 2);
  Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeRelease(jni.env(), thiz);
  ASSERT_EQ(jni.encode_results.size(), 1u);
  const vesk_jni::FakeJniEnv::EncodeResults& results = jni.encode_results[0];
  EXPECT_EQ(results.sample_rate, pcm.sample_rate_hz);
  ASSERT_EQ(results.transition.size(), 2 * pcm.transition_samples);
  ASSERT_EQ(results.audio.size(), 2 * pcm.token_samples);
  // Little-endian 16-bit samples on the Java side.
  std::vector<int16_t> java(pcm.num_samples);
  for (size_t i = 0; i < pcm.transition_samples; ++i) {
    java[i] = static_cast<int16_t>(results.transition[2 * i] | results.transition[2 * i + 1] << 8);
  }
  for (size_t i = 0; i < pcm.token_samples; ++i) {
    java[pcm.transition_samples + i] =
        static_cast<int16_t>(results.audio[2 * i] | results.audio[2 * i + 1] << 8);
  }
  EXPECT_EQ(java, std::vector<int16_t>(pcm.samples, pcm.samples + pcm.num_samples));
  vesk_pcm_free(&pcm);
  vesk_encoder_destroy(encoder);
}

}  // namespace
