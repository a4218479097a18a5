#include "location/pellam/cpp/audio/jni/fake_jni_env.h"

#include <cstring>
#include <utility>

namespace vesk_jni {
namespace {

// Method ids are the addresses of these.
char add_token_id;
char set_encode_results_id;

}  // namespace

FakeJniEnv* FakeJniEnv::Self(JNIEnv* env) {
  return static_cast<FakeJniEnv*>(env->functions->reserved0);
}

FakeJniEnv::Object* FakeJniEnv::Get(jobject object) { return reinterpret_cast<Object*>(object); }

jobject FakeJniEnv::Add(Object object) {
  objects_.push_back(std::move(object));
  return reinterpret_cast<jobject>(&objects_.back());
}

jobject FakeJniEnv::DirectBuffer(void* address, int64_t capacity) {
  Object object(Object::kBuffer);
  object.address = address;
  object.capacity = capacity;
  return Add(std::move(object));
}

jbyteArray FakeJniEnv::ByteArray(const std::vector<uint8_t>& bytes) {
  Object object(Object::kByteArray);
  object.bytes = bytes;
  return static_cast<jbyteArray>(Add(std::move(object)));
}

jfloatArray FakeJniEnv::FloatArray(const std::vector<float>& values) {
  Object object(Object::kFloatArray);
  object.floats = values;
  return static_cast<jfloatArray>(Add(std::move(object)));
}

jobject FakeJniEnv::Receiver() { return Add(Object(Object::kReceiver)); }

jobject FakeJniEnv::PlainObject() { return Add(Object(Object::kPlain)); }

void JNICALL FakeJniEnv::CallVoidMethodV(JNIEnv* env, jobject, jmethodID method, va_list args) {
  FakeJniEnv* self = Self(env);
  if (method == reinterpret_cast<jmethodID>(&add_token_id)) {
    self->added_tokens.push_back(Get(va_arg(args, jobject))->bytes);
  } else if (method == reinterpret_cast<jmethodID>(&set_encode_results_id)) {
    EncodeResults results;
    results.transition = Get(va_arg(args, jobject))->bytes;
    results.audio = Get(va_arg(args, jobject))->bytes;
    results.sample_rate = static_cast<float>(va_arg(args, double));  // Promoted float.
    self->encode_results.push_back(std::move(results));
  }
}

void JNICALL FakeJniEnv::CallVoidMethod(JNIEnv* env, jobject object, jmethodID method, ...) {
  va_list args;
  va_start(args, method);
  CallVoidMethodV(env, object, method, args);
  va_end(args);
}

FakeJniEnv::FakeJniEnv() {
  std::memset(&functions_, 0, sizeof(functions_));
  functions_.reserved0 = this;
  env_.functions = &functions_;

  functions_.GetDirectBufferAddress = [](JNIEnv*, jobject buffer) -> void* {
    return Get(buffer)->kind == Object::kBuffer ? Get(buffer)->address : nullptr;
  };
  functions_.GetDirectBufferCapacity = [](JNIEnv*, jobject buffer) -> jlong {
    return Get(buffer)->kind == Object::kBuffer ? Get(buffer)->capacity : -1;
  };
  functions_.GetArrayLength = [](JNIEnv*, jarray array) -> jsize {
    const Object* object = Get(array);
    return static_cast<jsize>(object->kind == Object::kFloatArray ? object->floats.size()
                                                                  : object->bytes.size());
  };
  functions_.GetFloatArrayElements = [](JNIEnv*, jfloatArray array, jboolean* is_copy) {
    if (is_copy != nullptr) *is_copy = JNI_FALSE;
    return Get(array)->floats.data();
  };
  functions_.ReleaseFloatArrayElements = [](JNIEnv*, jfloatArray, jfloat*, jint) {};
  functions_.GetByteArrayRegion = [](JNIEnv*, jbyteArray array, jsize start, jsize length,
                                     jbyte* out) {
    std::memcpy(out, Get(array)->bytes.data() + start, length);
  };
  functions_.NewByteArray = [](JNIEnv* env, jsize length) -> jbyteArray {
    return Self(env)->ByteArray(std::vector<uint8_t>(length));
  };
  functions_.SetByteArrayRegion = [](JNIEnv*, jbyteArray array, jsize start, jsize length,
                                     const jbyte* in) {
    std::memcpy(Get(array)->bytes.data() + start, in, length);
  };
  functions_.ExceptionCheck = [](JNIEnv*) -> jboolean { return JNI_FALSE; };
  functions_.ExceptionOccurred = [](JNIEnv*) -> jthrowable { return nullptr; };
  functions_.ExceptionClear = [](JNIEnv*) {};
  functions_.DeleteLocalRef = [](JNIEnv*, jobject) {};
  functions_.GetObjectClass = [](JNIEnv* env, jobject object) -> jclass {
    Object class_object(Object::kClass);
    class_object.receiver_class = Get(object)->kind == Object::kReceiver;
    return static_cast<jclass>(Self(env)->Add(std::move(class_object)));
  };
  functions_.GetMethodID = [](JNIEnv*, jclass cls, const char* name,
                              const char* signature) -> jmethodID {
    if (!Get(cls)->receiver_class) return nullptr;
    if (std::strcmp(name, "addToken") == 0 && std::strcmp(signature, "([B)V") == 0) {
      return reinterpret_cast<jmethodID>(&add_token_id);
    }
    if (std::strcmp(name, "setEncodeResults") == 0 && std::strcmp(signature, "([B[BF)V") == 0) {
      return reinterpret_cast<jmethodID>(&set_encode_results_id);
    }
    return nullptr;
  };
  functions_.CallVoidMethod = &FakeJniEnv::CallVoidMethod;
  functions_.CallVoidMethodV = &FakeJniEnv::CallVoidMethodV;
}

}  // namespace vesk_jni
