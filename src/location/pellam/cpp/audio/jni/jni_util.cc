#include "location/pellam/cpp/audio/jni/jni_util.h"

#include "base/logging.h"

namespace vesk_jni {

jbyteArray ToJavaByteArray(JNIEnv* env, const std::vector<uint8_t>& bytes) {
  const jsize length = static_cast<jsize>(bytes.size());
  jbyteArray array = env->NewByteArray(length);
  if (array == nullptr) return nullptr;
  env->SetByteArrayRegion(array, 0, length, reinterpret_cast<const jbyte*>(bytes.data()));
  if (env->ExceptionCheck()) return nullptr;
  return array;
}

audio_modem::DsssWaveformConfig DsssWaveformFromJava(jint number_of_taps, jint code_number,
                                                     jfloat sample_rate, jint upsampling_factor,
                                                     jfloat carrier_frequency, jint bits_per_symbol,
                                                     jint min_cycles_per_frame,
                                                     jint baseband_decimation_factor,
                                                     jboolean use_quadrature_carrier) {
  audio_modem::DsssWaveformConfig waveform;
  waveform.number_of_taps = number_of_taps;
  waveform.code_number = code_number;
  waveform.sample_rate = sample_rate;
  waveform.upsampling_factor = upsampling_factor;
  waveform.carrier_frequency = carrier_frequency;
  waveform.bits_per_symbol = bits_per_symbol;
  waveform.min_cycles_per_frame = min_cycles_per_frame;
  waveform.baseband_decimation_factor = baseband_decimation_factor;
  waveform.use_quadrature_carrier = use_quadrature_carrier;
  return waveform;
}

bool ReadFloatArray(JNIEnv* env, jfloatArray array, std::vector<float>* values) {
  values->clear();
  const jsize length = array == nullptr ? 0 : env->GetArrayLength(array);
  if (env->ExceptionCheck()) return false;
  if (length == 0) return true;
  jfloat* elements = env->GetFloatArrayElements(array, nullptr);
  if (elements == nullptr) return false;
  values->assign(elements, elements + length);
  env->ReleaseFloatArrayElements(array, elements, 0);
  return !env->ExceptionCheck();
}

jmethodID FindCallback(JNIEnv* env, jobject receiver, const char* name, const char* signature) {
  if (receiver == nullptr) return nullptr;
  jclass receiver_class = env->GetObjectClass(receiver);
  if (receiver_class == nullptr) return nullptr;
  jmethodID method = env->GetMethodID(receiver_class, name, signature);
  env->DeleteLocalRef(receiver_class);
  if (method == nullptr) {
    env->ExceptionClear();
    LOG(ERROR) << "Receiver has no method " << name << " " << signature;
  }
  return method;
}

}  // namespace vesk_jni
