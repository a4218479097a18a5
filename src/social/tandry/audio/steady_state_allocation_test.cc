// Once its buffers have reached their size, a decoder takes in 16-bit blocks
// (the JNI layer's nativeProcessSamples path) without touching the heap: the
// global allocation functions of this test program count the calls made
// while a block is processed.

#include <atomic>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <new>
#include <string>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace {

std::atomic<bool> g_counting{false};
std::atomic<int64_t> g_allocations{0};

void* Allocate(std::size_t size) {
  if (g_counting.load(std::memory_order_relaxed)) g_allocations.fetch_add(1);
  void* memory = std::malloc(size == 0 ? 1 : size);
  if (memory == nullptr) throw std::bad_alloc();
  return memory;
}

void* AllocateAligned(std::size_t size, std::align_val_t alignment) {
  if (g_counting.load(std::memory_order_relaxed)) g_allocations.fetch_add(1);
  void* memory = nullptr;
  if (posix_memalign(&memory, static_cast<std::size_t>(alignment), size == 0 ? 1 : size) != 0) {
    throw std::bad_alloc();
  }
  return memory;
}

}  // namespace

void* operator new(std::size_t size) { return Allocate(size); }
void* operator new[](std::size_t size) { return Allocate(size); }
void* operator new(std::size_t size, std::align_val_t alignment) {
  return AllocateAligned(size, alignment);
}
void* operator new[](std::size_t size, std::align_val_t alignment) {
  return AllocateAligned(size, alignment);
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete[](void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::size_t) noexcept { std::free(memory); }
void operator delete(void* memory, std::align_val_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::align_val_t) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t, std::align_val_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::size_t, std::align_val_t) noexcept { std::free(memory); }

namespace audio_modem {
namespace {

// `seconds` of a token played over and over in noise, as 16-bit samples;
// with a steady tone of `tone_hz` (0: none) at about the token's level.
std::vector<int16_t> Broadcast(const AudioModemEncoder& encoder,
                               const std::vector<uint8_t>& message, int crc_bytes, int rate,
                               int seconds, double tone_hz = 0) {
  std::vector<float> token;
  encoder.Encode(message, &token, crc_bytes);
  std::vector<int16_t> pcm(static_cast<size_t>(rate) * seconds);
  uint32_t seed = 1;
  for (size_t i = 0; i < pcm.size(); ++i) {
    seed = seed * 1664525u + 1013904223u;
    const float noise = (static_cast<float>(seed >> 8) / 16777216.0f - 0.5f) * 0.1f;
    const float tone = static_cast<float>(
        0.2 * std::sin(2 * 3.14159265358979 * tone_hz * static_cast<double>(i) / rate));
    pcm[i] = audio_dsp::FloatToPcm16(0.5f * token[i % token.size()] + noise + tone);
  }
  return pcm;
}

// Feeds `pcm` in blocks of 4096 bytes, asking for tokens every quarter of a
// second; returns the allocations made inside ProcessPcm16 over the last
// `counted_seconds`.
int64_t AllocationsWhileListening(AudioModemDecoder* decoder, const std::vector<int16_t>& pcm,
                                  int rate, int counted_seconds, int message_bytes, int crc_bytes,
                                  int* tokens) {
  const int block = 2048;
  const size_t counted_from = pcm.size() - static_cast<size_t>(rate) * counted_seconds;
  int64_t since_request = 0;
  int64_t allocations = 0;
  for (size_t start = 0; start + block <= pcm.size(); start += block) {
    const bool counted = start >= counted_from;
    const int64_t before = g_allocations.load();
    g_counting.store(counted);
    decoder->ProcessPcm16(pcm.data() + start, block);
    g_counting.store(false);
    allocations += g_allocations.load() - before;
    decoder->DetectBroadcaster();
    since_request += block;
    if (since_request >= rate / 4) {
      since_request = 0;
      DecodeResults results;
      if (decoder->GetTokens(&results, message_bytes, crc_bytes)) {
        *tokens += static_cast<int>(results.tokens.size());
      }
    }
  }
  return allocations;
}

// The same with a steady tone that the excision stage notches while the
// blocks are counted.
TEST(SteadyStateAllocationTest, NotchingTakesNoAllocationEither) {
  DsssEncoderConfig dsss_encoder_config;
  dsss_encoder_config.broadcast_sample_rate = 44100;
  const std::unique_ptr<AudioModemEncoder> dsss = MakeDsssAudioModemEncoder(dsss_encoder_config);
  DsssDecoderConfig dsss_config;
  const std::unique_ptr<AudioModemDecoder> dsss_decoder = MakeDsssAudioModemDecoder(dsss_config);
  int tokens = 0;
  EXPECT_EQ(AllocationsWhileListening(dsss_decoder.get(),
                                      Broadcast(*dsss, {1, 2, 3, 4, 5, 6}, 2, 44100, 12, 19000.0),
                                      44100, 4, 6, 2, &tokens),
            0);
  EXPECT_TRUE(dsss_decoder->narrowband_excision()->filtering());
  EXPECT_GT(tokens, 0);

  const std::unique_ptr<AudioModemEncoder> dtmf = MakeDtmfAudioModemEncoder(DtmfEncoderConfig());
  const std::unique_ptr<AudioModemDecoder> dtmf_decoder =
      MakeDtmfAudioModemDecoder(DtmfDecoderConfig());
  tokens = 0;
  // Between the tones of 1244.5 and 1480 Hz.
  EXPECT_EQ(AllocationsWhileListening(dtmf_decoder.get(),
                                      Broadcast(*dtmf, {1, 2, 3, 4, 5}, 0, 44100, 12, 1350.0),
                                      44100, 4, 5, 0, &tokens),
            0);
  EXPECT_TRUE(dtmf_decoder->narrowband_excision()->filtering());
  EXPECT_GT(tokens, 0);
}

TEST(SteadyStateAllocationTest, DecodersTakeBlocksWithoutAllocating) {
  const std::vector<uint8_t> message = {1, 2, 3, 4, 5, 6};
  struct Case {
    std::string name;
    bool coder_44k;
    int rate;
    bool zintar;
  };
  for (const Case& c : {Case{"dsss 48k coder, 44.1 kHz", false, 44100, false},
                        Case{"dsss 44.1k coder, 48 kHz", true, 48000, false},
                        Case{"zintar, 48 kHz", false, 48000, true}}) {
    DsssEncoderConfig encoder_config;
    DsssDecoderConfig decoder_config;
    if (c.coder_44k) {
      encoder_config.waveform = Waveform44100();
      decoder_config.waveform = Waveform44100();
    }
    encoder_config.broadcast_sample_rate = c.rate;
    const std::unique_ptr<AudioModemEncoder> encoder = MakeDsssAudioModemEncoder(encoder_config);
    decoder_config.input_sample_rate = static_cast<float>(c.rate);
    decoder_config.use_zintar = c.zintar;
    const std::unique_ptr<AudioModemDecoder> decoder = MakeDsssAudioModemDecoder(decoder_config);
    int tokens = 0;
    EXPECT_EQ(AllocationsWhileListening(decoder.get(), Broadcast(*encoder, message, 2, c.rate, 12),
                                        c.rate, 4, 6, 2, &tokens),
              0)
        << c.name;
    EXPECT_GT(tokens, 0) << c.name;  // It did hear the broadcast.
  }
  for (const int rate : {44100, 48000}) {
    const DtmfEncoderConfig encoder_config;
    const std::unique_ptr<AudioModemEncoder> encoder = MakeDtmfAudioModemEncoder(encoder_config);
    DtmfDecoderConfig decoder_config;
    decoder_config.input_sample_rate = static_cast<float>(rate);
    const std::unique_ptr<AudioModemDecoder> decoder = MakeDtmfAudioModemDecoder(decoder_config);
    int tokens = 0;
    EXPECT_EQ(
        AllocationsWhileListening(decoder.get(), Broadcast(*encoder, {1, 2, 3, 4, 5}, 0, rate, 12),
                                  rate, 4, 5, 0, &tokens),
        0)
        << "dtmf " << rate;
    // At 48 kHz the tokens (made at 44.1 kHz) play too fast to be heard; the
    // resampler in front of the tone filters is what that case is about.
    if (rate == 44100) {
      EXPECT_GT(tokens, 0);
    }
  }
}

}  // namespace
}  // namespace audio_modem
