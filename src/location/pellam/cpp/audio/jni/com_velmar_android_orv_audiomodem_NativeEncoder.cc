// JNI entry points of com.velmar.android.orv.audiomodem.NativeEncoder.
//
// The library holds at most one encoder, in a process-wide slot. Entry points
// convert Java arguments, delegate to the encoder in the slot and deliver the
// audio through the receiver's setEncodeResults(byte[] startTransition,
// byte[] tokenAudio, float sampleRate), both arrays 16-bit little-endian mono
// PCM. No lock guards the slot: the host calls from one thread at a time.

#include <jni.h>

#include <memory>
#include <utility>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "base/logging.h"
#include "location/pellam/cpp/audio/jni/jni_entry_points.h"
#include "location/pellam/cpp/audio/jni/jni_util.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace {

// The encoder slot: empty at load, replaced by each initialisation.
std::unique_ptr<audio_modem::AudioModemEncoder>& EncoderSlot() {
  static auto* slot = new std::unique_ptr<audio_modem::AudioModemEncoder>();
  return *slot;
}

// Stores `encoder`, then destroys the one it replaces.
void InstallEncoder(std::unique_ptr<audio_modem::AudioModemEncoder> encoder) {
  EncoderSlot().swap(encoder);
}

jbyteArray ToPcmByteArray(JNIEnv* env, const std::vector<float>& samples) {
  return vesk_jni::ToJavaByteArray(env, audio_dsp::FloatsToPcm16Bytes(samples));
}

}  // namespace

extern "C" {

JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeInitializeDsss(
    JNIEnv* /*env*/, jobject /*thiz*/, jint token_length_bytes, jboolean append_checksum_symbol,
    jboolean single_sideband, jint number_of_taps, jint code_number, jfloat sample_rate,
    jint upsampling_factor, jfloat carrier_frequency, jint bits_per_symbol,
    jint min_cycles_per_frame, jint baseband_decimation_factor, jboolean use_quadrature_carrier,
    jint broadcast_sample_rate, jfloat transition_duration) {
  audio_modem::DsssEncoderConfig config;
  config.token_length_bytes = token_length_bytes;
  config.append_checksum_symbol = append_checksum_symbol;
  config.single_sideband = single_sideband;
  config.waveform = vesk_jni::DsssWaveformFromJava(
      number_of_taps, code_number, sample_rate, upsampling_factor, carrier_frequency,
      bits_per_symbol, min_cycles_per_frame, baseband_decimation_factor, use_quadrature_carrier);
  config.broadcast_sample_rate = broadcast_sample_rate;
  config.transition_duration = transition_duration;
  InstallEncoder(audio_modem::MakeDsssAudioModemEncoder(config));
  return JNI_TRUE;
}

// Returns false, keeping the previous encoder, when the envelope is refused
// (logged) or a Java exception is pending after reading the tone array. An
// empty or null tone array selects the default tone set.
JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeInitializeDtmf(
    JNIEnv* env, jobject /*thiz*/, jint bytes_in_token, jboolean append_checksum_symbol,
    jfloat sample_rate, jint baseband_decimation_factor, jfloat window_duration,
    jint tones_per_symbol, jfloat attack_time, jfloat decay_time, jfloat sustain_time,
    jfloat release_time, jfloat sustain_amplitude, jfloatArray tone_frequencies) {
  audio_modem::DtmfEncoderConfig config;
  config.bytes_in_token = bytes_in_token;
  config.append_checksum_symbol = append_checksum_symbol;
  config.sample_rate = sample_rate;
  config.baseband_decimation_factor = baseband_decimation_factor;
  config.window_duration = window_duration;
  config.tones_per_symbol = tones_per_symbol;
  config.attack_time = attack_time;
  config.decay_time = decay_time;
  config.sustain_time = sustain_time;
  config.release_time = release_time;
  config.sustain_amplitude = sustain_amplitude;

  // An empty array keeps the default tone set.
  if (!vesk_jni::ReadFloatArray(env, tone_frequencies, &config.tone_frequencies)) return JNI_FALSE;

  std::unique_ptr<audio_modem::AudioModemEncoder> encoder =
      audio_modem::MakeDtmfAudioModemEncoder(config);
  if (!encoder) return JNI_FALSE;
  InstallEncoder(std::move(encoder));
  return JNI_TRUE;
}

JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeEncode(
    JNIEnv* env, jobject /*thiz*/, jbyteArray token, jobject result_receiver,
    jint num_crc_check_bytes) {
  const jsize length = token == nullptr ? 0 : env->GetArrayLength(token);
  if (length == 0) return;
  std::vector<uint8_t> token_bytes(length);
  env->GetByteArrayRegion(token, 0, length, reinterpret_cast<jbyte*>(token_bytes.data()));
  if (env->ExceptionCheck()) return;

  const std::unique_ptr<audio_modem::AudioModemEncoder>& encoder = EncoderSlot();
  if (!encoder) {
    LOG(ERROR) << "nativeEncode() called before a successful initialization.";
    return;
  }
  std::vector<float> audio;
  encoder->Encode(token_bytes, &audio, num_crc_check_bytes);

  jmethodID set_encode_results =
      vesk_jni::FindCallback(env, result_receiver, "setEncodeResults", "([B[BF)V");
  if (set_encode_results == nullptr) return;
  jbyteArray audio_array = ToPcmByteArray(env, audio);
  if (audio_array == nullptr) return;
  std::vector<float> transition;
  encoder->MakeStartTransition(audio, &transition);
  jbyteArray transition_array = ToPcmByteArray(env, transition);
  if (transition_array == nullptr) return;
  env->CallVoidMethod(result_receiver, set_encode_results, transition_array, audio_array,
                      static_cast<jfloat>(encoder->GetSampleRate()));
}

JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeRelease(
    JNIEnv* /*env*/, jobject /*thiz*/) {
  EncoderSlot().reset();
}

}  // extern "C"
