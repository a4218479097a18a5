// Test support: a JNIEnv without a Java VM, with just the operations that
// the library's entry points use, so that tests and fuzz targets can call
// the exported JNI functions directly. Java objects are records owned by the
// FakeJniEnv; the receiver objects record the callbacks made on them.
//
// Not thread-safe; one FakeJniEnv per thread.

#ifndef LOCATION_PELLAM_CPP_AUDIO_JNI_FAKE_JNI_ENV_H_
#define LOCATION_PELLAM_CPP_AUDIO_JNI_FAKE_JNI_ENV_H_

#include <jni.h>

#include <cstdarg>
#include <cstdint>
#include <deque>
#include <vector>

#include "location/pellam/cpp/audio/jni/jni_entry_points.h"

namespace vesk_jni {

class FakeJniEnv {
 public:
  // What one setEncodeResults call carried.
  struct EncodeResults {
    std::vector<uint8_t> transition;
    std::vector<uint8_t> audio;
    float sample_rate = 0.0f;
  };

  FakeJniEnv();
  FakeJniEnv(const FakeJniEnv&) = delete;
  FakeJniEnv& operator=(const FakeJniEnv&) = delete;

  JNIEnv* env() { return &env_; }

  // A direct ByteBuffer over `capacity` bytes at `address` (not owned).
  jobject DirectBuffer(void* address, int64_t capacity);
  jbyteArray ByteArray(const std::vector<uint8_t>& bytes);
  jfloatArray FloatArray(const std::vector<float>& values);
  // An object with addToken([B)V and setEncodeResults([B[BF)V.
  jobject Receiver();
  // An object of a class without those methods.
  jobject PlainObject();

  // Calls made on the receivers so far, in order.
  std::vector<std::vector<uint8_t>> added_tokens;
  std::vector<EncodeResults> encode_results;

 private:
  // One Java object: a direct buffer, an array or an instance of a class.
  struct Object {
    enum Kind { kBuffer, kByteArray, kFloatArray, kReceiver, kPlain, kClass };
    explicit Object(Kind object_kind) : kind(object_kind) {}
    Kind kind;
    void* address = nullptr;  // kBuffer.
    int64_t capacity = 0;     // kBuffer.
    std::vector<uint8_t> bytes;
    std::vector<float> floats;
    bool receiver_class = false;  // kClass: the receivers' class.
  };

  jobject Add(Object object);
  static FakeJniEnv* Self(JNIEnv* env);
  static Object* Get(jobject object);
  // Record addToken and setEncodeResults calls. C++ callers reach the
  // va_list form through JNIEnv's inline CallVoidMethod.
  static void JNICALL CallVoidMethodV(JNIEnv* env, jobject object, jmethodID method, va_list args);
  static void JNICALL CallVoidMethod(JNIEnv* env, jobject object, jmethodID method, ...);

  JNINativeInterface_ functions_;
  JNIEnv env_;
  std::deque<Object> objects_;
};

}  // namespace vesk_jni

#endif  // LOCATION_PELLAM_CPP_AUDIO_JNI_FAKE_JNI_ENV_H_
