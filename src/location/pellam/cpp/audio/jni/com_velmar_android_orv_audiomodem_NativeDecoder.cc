// JNI entry points of com.velmar.android.orv.audiomodem.NativeDecoder.
//
// Decoders live in the process-wide registry under ids that the Java side
// chooses. Samples arrive as 16-bit PCM in direct byte buffers; tokens go
// back through the receiver's addToken(byte[]). The entry points only
// convert, look up and delegate. No lock guards the registry: the host must
// not overlap an initialisation or release with any other call.

#include <jni.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <utility>

#include "base/logging.h"
#include "location/pellam/cpp/audio/jni/decoder_registry.h"
#include "location/pellam/cpp/audio/jni/jni_entry_points.h"
#include "location/pellam/cpp/audio/jni/jni_util.h"
#include "social/tandry/audio/audio_modem_decoder.h"

namespace {

using audio_modem::AudioModemDecoder;

// The decoder of `id`; null (logged) for an empty slot, which the host must
// not address: such calls are ignored rather than crashing.
AudioModemDecoder* FindDecoder(int id, const char* caller) {
  AudioModemDecoder* decoder = vesk_jni::GlobalDecoderRegistry().Lookup(id);
  if (decoder == nullptr)
    LOG(ERROR) << caller << " called for decoder id " << id << " which holds no decoder.";
  return decoder;
}

// The checked region of a direct buffer of 16-bit samples; the checks are
// fatal because a wrong region would read memory that is not the host's.
const int16_t* SamplesOf(JNIEnv* env, jobject buffer, jint offset, jint length, int* count) {
  void* const direct_buffer = env->GetDirectBufferAddress(buffer);
  const int64_t capacity_bytes = env->GetDirectBufferCapacity(buffer);
  const int64_t offset_bytes = offset;
  const int64_t length_bytes = length;
  CHECK(direct_buffer != nullptr);
  CHECK(length_bytes % 2 == 0);
  CHECK(length_bytes + offset_bytes <= capacity_bytes);
  CHECK(offset_bytes >= 0);
  CHECK(offset_bytes % 2 == 0);
  CHECK(length_bytes >= 0);
  *count = static_cast<int>(length_bytes / 2);
  return reinterpret_cast<const int16_t*>(static_cast<const uint8_t*>(direct_buffer) +
                                          offset_bytes);
}

}  // namespace

extern "C" {

JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDsss(
    JNIEnv* /*env*/, jobject /*thiz*/, jint id, jint token_length_bytes,
    jboolean use_checksum_symbol, jboolean design_baseband_filter, jint number_of_taps,
    jint code_number, jfloat sample_rate, jint upsampling_factor, jfloat carrier_frequency,
    jint bits_per_symbol, jint min_cycles_per_frame, jint baseband_decimation_factor,
    jboolean use_quadrature_carrier, jfloat acquisition_window_seconds,
    jfloat broadcaster_threshold, jint max_tokens_per_call, jfloat input_sample_rate,
    jint num_channels, jfloat buffer_length_tokens, jboolean use_zintar) {
  audio_modem::DsssDecoderConfig config;
  config.token_length_bytes = token_length_bytes;
  config.use_checksum_symbol = use_checksum_symbol;
  config.design_baseband_filter = design_baseband_filter;
  config.waveform = vesk_jni::DsssWaveformFromJava(
      number_of_taps, code_number, sample_rate, upsampling_factor, carrier_frequency,
      bits_per_symbol, min_cycles_per_frame, baseband_decimation_factor, use_quadrature_carrier);
  config.acquisition_window_seconds = acquisition_window_seconds;
  config.broadcaster_threshold = broadcaster_threshold;
  config.max_tokens_per_call = max_tokens_per_call;
  config.input_sample_rate = input_sample_rate;
  config.num_channels = num_channels;
  config.buffer_length_tokens = buffer_length_tokens;
  config.use_zintar = use_zintar;
  vesk_jni::GlobalDecoderRegistry().Store(id, audio_modem::MakeDsssAudioModemDecoder(config));
  return JNI_TRUE;
}

// Returns false, keeping the id's previous decoder, when the envelope is
// refused (logged) or a Java exception is pending after reading the tone
// array. An empty or null tone array selects the default tone set. The
// eighth Java argument is ignored: nothing has ever read it.
JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDtmf(
    JNIEnv* env, jobject /*thiz*/, jint id, jint bytes_in_token, jboolean append_checksum_symbol,
    jfloat sample_rate, jint baseband_decimation_factor, jfloat window_duration,
    jint tones_per_symbol, jint /*ignored*/, jint max_tokens_per_call, jfloat input_sample_rate,
    jint num_channels, jfloat attack_time, jfloat decay_time, jfloat sustain_time,
    jfloat release_time, jfloat sustain_amplitude, jfloat buffer_length_tokens,
    jfloatArray tone_frequencies) {
  audio_modem::DtmfDecoderConfig config;
  config.bytes_in_token = bytes_in_token;
  config.append_checksum_symbol = append_checksum_symbol;
  config.sample_rate = sample_rate;
  config.baseband_decimation_factor = baseband_decimation_factor;
  config.window_duration = window_duration;
  config.tones_per_symbol = tones_per_symbol;
  config.max_tokens_per_call = max_tokens_per_call;
  config.input_sample_rate = input_sample_rate;
  config.num_channels = num_channels;
  config.attack_time = attack_time;
  config.decay_time = decay_time;
  config.sustain_time = sustain_time;
  config.release_time = release_time;
  config.sustain_amplitude = sustain_amplitude;
  config.buffer_length_tokens = buffer_length_tokens;

  // An empty array keeps the default tone set.
  if (!vesk_jni::ReadFloatArray(env, tone_frequencies, &config.tone_frequencies)) return JNI_FALSE;

  std::unique_ptr<AudioModemDecoder> decoder = audio_modem::MakeDtmfAudioModemDecoder(config);
  if (!decoder) return JNI_FALSE;
  vesk_jni::GlobalDecoderRegistry().Store(id, std::move(decoder));
  return JNI_TRUE;
}

JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamples(
    JNIEnv* env, jobject /*thiz*/, jint id, jobject buffer, jint offset, jint length) {
  int count = 0;
  const int16_t* pcm = SamplesOf(env, buffer, offset, length, &count);
  AudioModemDecoder* decoder = FindDecoder(id, "nativeProcessSamples()");
  if (decoder == nullptr) return;
  // 16-bit values as floats, unscaled (the decoders work in the 16-bit
  // range), in a buffer that the decoder keeps.
  decoder->ProcessPcm16(pcm, count);
}

JNIEXPORT void JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamplesWithZintar(
    JNIEnv* env, jobject /*thiz*/, jint id, jobject buffer, jint offset, jint length) {
  int count = 0;
  const int16_t* pcm = SamplesOf(env, buffer, offset, length, &count);
  AudioModemDecoder* decoder = FindDecoder(id, "nativeProcessSamplesWithZintar()");
  if (decoder == nullptr) return;
  int16_t* samples = const_cast<int16_t*>(pcm);
  if (count == 0) return;  // Nothing to hear (the listening mode ignores empty blocks).
  if (reinterpret_cast<uintptr_t>(samples) % alignof(int16_t) == 0) {
    // The listening mode mixes stereo down in place, in the host's buffer.
    decoder->ProcessSamplesWithZintar(samples, count);
    return;
  }
  // A buffer at an odd address cannot be read as 16-bit values: work on an
  // aligned copy, then hand the host its buffer mixed down as usual.
  std::vector<int16_t> aligned(count);
  std::memcpy(aligned.data(), samples, aligned.size() * sizeof(int16_t));
  decoder->ProcessSamplesWithZintar(aligned.data(), count);
  std::memcpy(samples, aligned.data(), aligned.size() * sizeof(int16_t));
}

JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetTokens(
    JNIEnv* env, jobject /*thiz*/, jint id, jobject receiver, jint num_message_bytes,
    jint num_crc_check_bytes) {
  jmethodID add_token = vesk_jni::FindCallback(env, receiver, "addToken", "([B)V");
  if (add_token == nullptr) return;
  AudioModemDecoder* decoder = FindDecoder(id, "nativeGetTokens()");
  if (decoder == nullptr) return;
  audio_modem::DecodeResults results;
  if (!decoder->GetTokens(&results, num_message_bytes, num_crc_check_bytes)) return;
  for (const audio_modem::TokenResult& token : results.tokens) {
    jbyteArray bytes = vesk_jni::ToJavaByteArray(env, token.bytes);
    if (bytes == nullptr) return;
    env->CallVoidMethod(receiver, add_token, bytes);
    env->DeleteLocalRef(bytes);
    if (env->ExceptionCheck()) return;
  }
}

JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeDetectBroadcaster(JNIEnv* /*env*/,
                                                                             jobject /*thiz*/,
                                                                             jint id) {
  AudioModemDecoder* decoder = FindDecoder(id, "nativeDetectBroadcaster()");
  return decoder != nullptr && decoder->DetectBroadcaster() ? JNI_TRUE : JNI_FALSE;
}

JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeWipeInternalData(
    JNIEnv* /*env*/, jobject /*thiz*/, jint id) {
  AudioModemDecoder* decoder = FindDecoder(id, "nativeWipeInternalData()");
  if (decoder != nullptr) decoder->WipeInternalData();
}

JNIEXPORT jint JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetMaxSafeInputSize(JNIEnv* /*env*/,
                                                                               jobject /*thiz*/,
                                                                               jint id) {
  AudioModemDecoder* decoder = FindDecoder(id, "nativeGetMaxSafeInputSize()");
  if (decoder == nullptr) return 0;
  // In bytes, as far as a Java int counts: a huge history's size would
  // overflow the doubling.
  return static_cast<jint>(
      std::min<int64_t>(int64_t{2} * decoder->GetMaxSafeInputSize(), INT32_MAX));
}

JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeRelease(
    JNIEnv* /*env*/, jobject /*thiz*/, jint id) {
  vesk_jni::GlobalDecoderRegistry().Release(id);
}

}  // extern "C"
