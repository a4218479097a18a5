// Small helpers shared by the JNI entry points. Every helper tests for a
// pending Java exception after touching a Java object and reports failure
// instead of going on.

#ifndef LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_UTIL_H_
#define LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_UTIL_H_

#include <jni.h>

#include <cstdint>
#include <vector>

#include "social/tandry/audio/dsss_waveform_config.h"

namespace vesk_jni {

// A new Java byte array holding `bytes`, or null when it cannot be created
// or a Java exception is pending after the copy.
jbyteArray ToJavaByteArray(JNIEnv* env, const std::vector<uint8_t>& bytes);

// The DSSS waveform from the nine arguments that both initialisers take in
// this order (the encoder's parameters 4 to 12, the decoder's 5 to 13).
audio_modem::DsssWaveformConfig DsssWaveformFromJava(jint number_of_taps, jint code_number,
                                                     jfloat sample_rate, jint upsampling_factor,
                                                     jfloat carrier_frequency, jint bits_per_symbol,
                                                     jint min_cycles_per_frame,
                                                     jint baseband_decimation_factor,
                                                     jboolean use_quadrature_carrier);

// Replaces *values with the elements of `array` (null or empty: no elements).
// False when the elements cannot be read or a Java exception is pending.
bool ReadFloatArray(JNIEnv* env, jfloatArray array, std::vector<float>* values);

// The instance method `name` with `signature` of `receiver`'s class, or null
// when the receiver has no class or no such method. A failed lookup's
// NoSuchMethodError is cleared and logged: the library never throws into Java.
jmethodID FindCallback(JNIEnv* env, jobject receiver, const char* name, const char* signature);

}  // namespace vesk_jni

#endif  // LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_UTIL_H_
