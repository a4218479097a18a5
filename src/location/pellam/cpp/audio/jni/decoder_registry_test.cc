#include "location/pellam/cpp/audio/jni/decoder_registry.h"

#include <memory>

#include "gtest/gtest.h"

namespace vesk_jni {
namespace {

std::unique_ptr<audio_modem::AudioModemDecoder> MakeDecoder(float rate) {
  audio_modem::DsssDecoderConfig config;
  config.input_sample_rate = rate;
  return audio_modem::MakeDsssAudioModemDecoder(config);
}

TEST(DecoderRegistryTest, GrowsToTheIdAndKeepsTheExtraSlotApart) {
  DecoderRegistry registry;
  auto decoder = MakeDecoder(44100);
  audio_modem::AudioModemDecoder* stored = decoder.get();
  registry.Store(3, std::move(decoder));
  EXPECT_EQ(registry.num_slots(), 4);
  EXPECT_EQ(registry.Lookup(3), stored);
  for (int id = 0; id < 3; ++id) EXPECT_EQ(registry.Lookup(id), nullptr);
  registry.Store(1, MakeDecoder(44100));  // Fills without growing.
  EXPECT_EQ(registry.num_slots(), 4);
  EXPECT_NE(registry.Lookup(1), nullptr);
  EXPECT_EQ(registry.Lookup(-1), nullptr);
  registry.Store(-1, MakeDecoder(48000));
  EXPECT_NE(registry.Lookup(-1), nullptr);
  EXPECT_EQ(registry.num_slots(), 4);
}

TEST(DecoderRegistryTest, ReplacementAndRelease) {
  DecoderRegistry registry;
  registry.Store(0, MakeDecoder(44100));
  auto replacement = MakeDecoder(48000);
  audio_modem::AudioModemDecoder* second = replacement.get();
  registry.Store(0, std::move(replacement));
  EXPECT_EQ(registry.Lookup(0), second);
  registry.Release(0);
  EXPECT_EQ(registry.Lookup(0), nullptr);
  EXPECT_EQ(registry.num_slots(), 1);  // Never shrinks.
  registry.Release(0);                 // An empty slot stays as it is.
  registry.Release(-1);
}

TEST(DecoderRegistryDeathTest, OutOfRangeIdsAbort) {
  DecoderRegistry registry;
  registry.Store(2, MakeDecoder(44100));
  EXPECT_DEATH(registry.Release(7), "Check failed: index < slots_.size\\(\\)");
  EXPECT_DEATH(registry.Lookup(3), "Check failed");
  EXPECT_DEATH(registry.Lookup(-2), "Check failed");
  EXPECT_DEATH(registry.Store(-5, MakeDecoder(44100)), "Check failed: id >= 0");
}

}  // namespace
}  // namespace vesk_jni
