// The process-wide table of decoders that NativeDecoder's entry points use,
// indexed by a decoder id that the Java side chooses: ids >= 0 index a
// growable list of slots, and id -1 is a separate slot.
//
// Not thread-safe (no lock, by design): the host must not overlap an
// initialisation or release with any other call.

#ifndef LOCATION_PELLAM_CPP_AUDIO_JNI_DECODER_REGISTRY_H_
#define LOCATION_PELLAM_CPP_AUDIO_JNI_DECODER_REGISTRY_H_

#include <memory>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"

namespace vesk_jni {

class DecoderRegistry {
 public:
  // Stores `decoder` under `id`, growing the slots up to `id` when needed,
  // then destroys the decoder it replaces. An id below -1 aborts.
  void Store(int id, std::unique_ptr<audio_modem::AudioModemDecoder> decoder);

  // The decoder of `id`, or null for an empty slot. An id that is neither -1
  // nor below the number of slots aborts.
  audio_modem::AudioModemDecoder* Lookup(int id);

  // Destroys the decoder of `id`, leaving its slot empty. Aborts like Lookup.
  void Release(int id);

  // Slots for ids >= 0; never shrinks.
  int num_slots() const { return static_cast<int>(slots_.size()); }

 private:
  std::unique_ptr<audio_modem::AudioModemDecoder>& Slot(int id);

  std::vector<std::unique_ptr<audio_modem::AudioModemDecoder>> slots_;
  std::unique_ptr<audio_modem::AudioModemDecoder> extra_slot_;
};

// The registry of this process.
DecoderRegistry& GlobalDecoderRegistry();

}  // namespace vesk_jni

#endif  // LOCATION_PELLAM_CPP_AUDIO_JNI_DECODER_REGISTRY_H_
