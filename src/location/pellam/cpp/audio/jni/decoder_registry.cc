#include "location/pellam/cpp/audio/jni/decoder_registry.h"

#include <utility>

#include "base/logging.h"

namespace vesk_jni {

std::unique_ptr<audio_modem::AudioModemDecoder>& DecoderRegistry::Slot(int id) {
  if (id == -1) return extra_slot_;
  // Any other id is an unsigned index, so ids below -1 fail here too.
  const size_t index = static_cast<unsigned int>(id);
  CHECK(index < slots_.size()) << "(decoder id " << id << ")";
  return slots_[index];
}

void DecoderRegistry::Store(int id, std::unique_ptr<audio_modem::AudioModemDecoder> decoder) {
  if (id != -1) {
    CHECK(id >= 0) << "(decoder id " << id << ")";
    while (slots_.size() <= static_cast<size_t>(id)) slots_.emplace_back();
  }
  // The old decoder goes only after the new one is in place.
  Slot(id).swap(decoder);
}

audio_modem::AudioModemDecoder* DecoderRegistry::Lookup(int id) { return Slot(id).get(); }

void DecoderRegistry::Release(int id) { Slot(id).reset(); }

DecoderRegistry& GlobalDecoderRegistry() {
  // Never destroyed: JNI calls may still arrive while the process exits.
  static auto* registry = new DecoderRegistry();
  return *registry;
}

}  // namespace vesk_jni
