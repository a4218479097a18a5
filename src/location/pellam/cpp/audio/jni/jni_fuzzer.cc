// Fuzz target: the JNI decoder entry points, called through a fake JNIEnv as
// the Java peer calls them. The configurations are the ones the Java API
// builds (the entry points trust its validation); the input decides the
// decoder ids, the channel count, the PCM, the buffer regions (within the
// entry points' checks, from an odd or even address) and the order of the
// calls (the layout of the decoder fuzz targets). Flag bits of a process
// call: 1 an odd address, 2 the listening path, 4-252 an even offset.

#include <cstdint>
#include <cstring>
#include <vector>

#include "base/fuzz_input.h"
#include "location/pellam/cpp/audio/jni/fake_jni_env.h"
#include "location/pellam/cpp/audio/jni/jni_entry_points.h"
#include "location/pellam/cpp/audio/jni/jni_fuzz_header.h"
#include "social/tandry/audio/fuzz_modem_config.h"

namespace {

// Initialises decoder `id` with one of the Java API's configurations.
bool Initialize(vesk_jni::FakeJniEnv* jni, jobject thiz, int id, int kind, int channels) {
  JNIEnv* env = jni->env();
  switch (kind) {
    case 0:  // The product DSSS waveform (48 kHz coder), 44.1 kHz microphone.
    case 1:  // The 44.1 kHz coder.
    case 2:  // The listening mode.
      return Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDsss(
          env, thiz, id, 8, false, false, 7, 0, kind == 1 ? 44100 : 48000, kind == 1 ? 15 : 16,
          18500, 4, 4, kind == 1 ? 3 : 4, false, 0.75f, 5.0f, 2, kind == 2 ? 48000 : 44100,
          channels, 4.0f, kind == 2);
    default:  // The product DTMF waveform.
      return Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeInitializeDtmf(
          env, thiz, id, 5, true, 44100, 16, 0.05f, 2, 0, 2, 44100, channels, 0.025f, 0, 0, 0.025f,
          1, 4.0f, jni->FloatArray({}));
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  base::SilenceLogsForFuzzing();
  base::FuzzInput input(data, size);
  vesk_jni::FakeJniEnv jni;
  JNIEnv* env = jni.env();
  jobject thiz = jni.PlainObject();
  const vesk_jni::JniFuzzHeader header = vesk_jni::ReadJniFuzzHeader(&input);
  jobject receiver = header.receiver ? jni.Receiver() : jni.PlainObject();
  const int id = header.id;
  const int channels = header.channels;
  Initialize(&jni, thiz, id, header.kind, channels);
  // Room for the largest call after an offset of up to 126 bytes and one
  // spare byte in front, so that the samples may start at an odd address.
  std::vector<uint8_t> memory(2 * 65535 * channels + 128);
  audio_modem::FuzzDecoderCalls calls;
  calls.process = [&](const audio_modem::FuzzProcessCall& call) {
    const int shift = call.flags & 1;
    const jint offset = 2 * ((call.flags >> 2) & 63);
    const jint length = static_cast<jint>(2 * call.samples.size());
    if (length > 0) std::memcpy(memory.data() + shift + offset, call.samples.data(), length);
    jobject buffer =
        jni.DirectBuffer(memory.data() + shift, static_cast<int64_t>(memory.size() - shift));
    if ((call.flags & 2) != 0) {
      Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamplesWithZintar(
          env, thiz, id, buffer, offset, length);
    } else {
      Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeProcessSamples(
          env, thiz, id, buffer, offset, length);
    }
  };
  calls.tokens = [&] {
    const bool dtmf = header.kind == 3;
    Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetTokens(
        env, thiz, id, receiver, dtmf ? 5 : 6, dtmf ? 0 : 2);
  };
  calls.broadcaster = [&] {
    Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeDetectBroadcaster(env, thiz, id);
  };
  calls.wipe = [&](uint8_t variant) {
    switch (variant % 3) {
      case 0:
        Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeWipeInternalData(env, thiz, id);
        break;
      case 1:
        Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeGetMaxSafeInputSize(env, thiz,
                                                                                       id);
        break;
      case 2:
        // Released, then (for odd variants) built again.
        Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeRelease(env, thiz, id);
        if (variant & 8) Initialize(&jni, thiz, id, header.kind, channels);
        break;
    }
  };
  audio_modem::RunFuzzDecoderCalls(&input, channels, calls);
  Java_com_velmar_android_orv_audiomodem_NativeDecoder_nativeRelease(env, thiz, id);
  return 0;
}
