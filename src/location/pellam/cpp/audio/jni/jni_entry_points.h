// The thirteen functions that libVesk.so exports to the Java peers
// com.velmar.android.orv.audiomodem.NativeDecoder and NativeEncoder, as the
// JVM calls them. Declared here so that the definitions, the tests and the
// fuzz targets agree on one signature each.

#ifndef LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_ENTRY_POINTS_H_
#define LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_ENTRY_POINTS_H_

#include <jni.h>

extern "C" {

// NativeDecoder.
JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDsss(
    JNIEnv* env, jobject thiz, jint id, jint token_length_bytes, jboolean use_checksum_symbol,
    jboolean design_baseband_filter, jint number_of_taps, jint code_number, jfloat sample_rate,
    jint upsampling_factor, jfloat carrier_frequency, jint bits_per_symbol,
    jint min_cycles_per_frame, jint baseband_decimation_factor, jboolean use_quadrature_carrier,
    jfloat acquisition_window_seconds, jfloat broadcaster_threshold, jint max_tokens_per_call,
    jfloat input_sample_rate, jint num_channels, jfloat buffer_length_tokens, jboolean use_zintar);
JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDtmf(
    JNIEnv* env, jobject thiz, jint id, jint bytes_in_token, jboolean append_checksum_symbol,
    jfloat sample_rate, jint baseband_decimation_factor, jfloat window_duration,
    jint tones_per_symbol, jint ignored, jint max_tokens_per_call, jfloat input_sample_rate,
    jint num_channels, jfloat attack_time, jfloat decay_time, jfloat sustain_time,
    jfloat release_time, jfloat sustain_amplitude, jfloat buffer_length_tokens,
    jfloatArray tone_frequencies);
JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamples(
    JNIEnv* env, jobject thiz, jint id, jobject buffer, jint offset, jint length);
JNIEXPORT void JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamplesWithZintar(
    JNIEnv* env, jobject thiz, jint id, jobject buffer, jint offset, jint length);
JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetTokens(
    JNIEnv* env, jobject thiz, jint id, jobject receiver, jint num_message_bytes,
    jint num_crc_check_bytes);
JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeDetectBroadcaster(JNIEnv* env,
                                                                             jobject thiz, jint id);
JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeWipeInternalData(
    JNIEnv* env, jobject thiz, jint id);
JNIEXPORT jint JNICALL
Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetMaxSafeInputSize(JNIEnv* env,
                                                                               jobject thiz,
                                                                               jint id);
JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeRelease(
    JNIEnv* env, jobject thiz, jint id);

// NativeEncoder.
JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeInitializeDsss(
    JNIEnv* env, jobject thiz, jint token_length_bytes, jboolean append_checksum_symbol,
    jboolean single_sideband, jint number_of_taps, jint code_number, jfloat sample_rate,
    jint upsampling_factor, jfloat carrier_frequency, jint bits_per_symbol,
    jint min_cycles_per_frame, jint baseband_decimation_factor, jboolean use_quadrature_carrier,
    jint broadcast_sample_rate, jfloat transition_duration);
JNIEXPORT jboolean JNICALL
Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeInitializeDtmf(
    JNIEnv* env, jobject thiz, jint bytes_in_token, jboolean append_checksum_symbol,
    jfloat sample_rate, jint baseband_decimation_factor, jfloat window_duration,
    jint tones_per_symbol, jfloat attack_time, jfloat decay_time, jfloat sustain_time,
    jfloat release_time, jfloat sustain_amplitude, jfloatArray tone_frequencies);
JNIEXPORT void JNICALL Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeEncode(
    JNIEnv* env, jobject thiz, jbyteArray token, jobject result_receiver, jint num_crc_check_bytes);
JNIEXPORT void JNICALL
Java_com_velmar_android_orv_audiomodem_NativeEncoder_nativeRelease(JNIEnv* env, jobject thiz);

}  // extern "C"

#endif  // LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_ENTRY_POINTS_H_
