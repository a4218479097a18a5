// The decoder entry points, called through a fake JNIEnv.

#include <cstdint>
#include <cstring>
#include <vector>

#include "gtest/gtest.h"
#include "location/pellam/cpp/audio/jni/fake_jni_env.h"
#include "location/pellam/cpp/audio/jni/jni_entry_points.h"

namespace vesk_jni {
namespace {

// The listening mode works on a direct buffer at an odd address (a slice of
// a byte buffer) as on an aligned one, and still mixes it down in place.
TEST(NativeDecoderTest, ListeningModeTakesBuffersAtOddAddresses) {
  FakeJniEnv jni;
  jobject thiz = jni.PlainObject();
  ASSERT_TRUE(Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDsss(
      jni.env(), thiz, 0, 8, false, false, 7, 0, 48000, 16, 18500, 4, 4, 4, false, 0.75f, 5.0f, 2,
      48000, 2, 4.0f, true));
  const std::vector<int16_t> stereo = {10, 20, 30, 40, -3, 0, 100, 101};
  for (const size_t shift : {size_t{0}, size_t{1}}) {
    std::vector<uint8_t> memory(2 + 2 * stereo.size());
    uint8_t* start = memory.data() + shift;
    std::memcpy(start, stereo.data(), 2 * stereo.size());
    Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamplesWithZintar(
        jni.env(), thiz, 0, jni.DirectBuffer(start, static_cast<int64_t>(2 * stereo.size())), 0,
        static_cast<jint>(2 * stereo.size()));
    std::vector<int16_t> mixed(4);
    std::memcpy(mixed.data(), start, 2 * mixed.size());
    EXPECT_EQ(mixed, (std::vector<int16_t>{15, 35, -1, 100})) << "shift " << shift;
    // An empty region at an odd address is nothing to hear, on either path.
    Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamplesWithZintar(
        jni.env(), thiz, 0, jni.DirectBuffer(start, 0), 0, 0);
    Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamples(
        jni.env(), thiz, 0, jni.DirectBuffer(start, 0), 0, 0);
  }
  Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeRelease(jni.env(), thiz, 0);
}

// The safe input size in bytes stops at the largest Java int: a DTMF decoder
// of 64 channels at 384 kHz holds 50 s of history, 1.2e9 samples.
TEST(NativeDecoderTest, SafeInputSizeInBytesDoesNotOverflow) {
  FakeJniEnv jni;
  jobject thiz = jni.PlainObject();
  ASSERT_TRUE(Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDtmf(
      jni.env(), thiz, 0, 5, true, 44100, 16, 0.05f, 2, 0, 2, 384000, 64, 0.025f, 0, 0, 0.025f, 1,
      100.0f, jni.FloatArray({})));
  EXPECT_EQ(Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetMaxSafeInputSize(
                jni.env(), thiz, 0),
            INT32_MAX);
  Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeRelease(jni.env(), thiz, 0);
}

}  // namespace
}  // namespace vesk_jni
