// The first bytes of a JNI fuzz target's input: which receiver, decoder id,
// configuration and channel count. Read by the target, written by the seed
// corpus maker.

#ifndef LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_FUZZ_HEADER_H_
#define LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_FUZZ_HEADER_H_

#include "base/fuzz_input.h"

namespace vesk_jni {

struct JniFuzzHeader {
  bool receiver = true;  // A receiver with addToken, or a plain object.
  int id = 0;            // -1 to 2.
  int kind = 0;          // 0 DSSS, 1 DSSS 44.1 kHz coder, 2 listening mode, 3 DTMF.
  int channels = 1;      // 1 to 8.
};

inline JniFuzzHeader ReadJniFuzzHeader(base::FuzzInput* input) {
  JniFuzzHeader header;
  header.receiver = input->Bool();
  header.id = static_cast<int>(input->InRange(-1, 2));
  header.kind = input->Byte() % 4;
  header.channels = static_cast<int>(input->InRange(1, 8));
  return header;
}

inline void WriteJniFuzzHeader(const JniFuzzHeader& header, base::FuzzSeed* seed) {
  seed->Bool(header.receiver);
  seed->InRange(-1, header.id);
  seed->Byte(static_cast<uint8_t>(header.kind));
  seed->InRange(1, header.channels);
}

}  // namespace vesk_jni

#endif  // LOCATION_PELLAM_CPP_AUDIO_JNI_JNI_FUZZ_HEADER_H_
