#include "audio/vesknet/vesknet_encoder.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdlib>
#include <memory>
#include <vector>

#include "audio/dsp/kiss_fft.h"
#include "audio/dsp/kiss_fft_util.h"
#include "audio/dsp/pcm_conversion.h"
#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

SymbolWaveCoderParams ProductCoderParams() {
  SymbolWaveCoderParams params;
  params.sample_rate = 48000;
  params.upsampling_factor = 16;
  params.baseband_decimation_factor = 4;
  return params;
}

std::unique_ptr<VesknetEncoder> MakeEncoder(const SymbolWaveCoderParams& coder_params,
                                            VesknetEncoderParams params) {
  return std::make_unique<VesknetEncoder>(std::make_unique<SymbolWaveCoder>(coder_params), params);
}

float Peak(const std::vector<float>& x) {
  float peak = 0;
  for (float v : x) peak = std::max(peak, std::fabs(v));
  return peak;
}

const std::vector<uint8_t> kToken = {0x12, 0x34, 0x56, 0x78, 0x9A, 0xBC, 0xDE, 0xF0};

TEST(VesknetEncoderTest, RecordDefaultsResampledTo48k) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 48000;
  const auto encoder = MakeEncoder(SymbolWaveCoderParams(), params);
  std::vector<float> audio;
  ASSERT_TRUE(encoder->EncodeToken(kToken, &audio));
  // 17 frames of 1905 samples at 44100 Hz become round(32385 x 48000 / 44100).
  EXPECT_EQ(audio.size(), 35249u);
  EXPECT_FLOAT_EQ(Peak(audio), 0.5f);

  std::vector<float> transition;
  ASSERT_TRUE(encoder->MakeStartTransition(audio, &transition));
  ASSERT_EQ(transition.size(), 240u);
  // The ramp ends on the token's last sample, so playback runs on into audio[0].
  EXPECT_FLOAT_EQ(transition.back(), audio.back() * 240.0f / 241.0f);
  EXPECT_FLOAT_EQ(transition.front(), audio[audio.size() - 240] / 241.0f);
}

// The token's audio as the encoder first made it, with a filter and a
// resampler that transform the whole token at both lengths: the symbol waves
// in a row, the upper sideband kept by HighPassFilter, FftResample to the
// broadcast rate, scaled to the peak amplitude.
std::vector<float> DirectlyEncoded(const SymbolWaveCoder& coder, const VesknetEncoderParams& params,
                                   const std::vector<int32_t>& symbols) {
  std::vector<float> audio = coder.GetSyncSymbolWave();
  for (int32_t symbol : symbols) {
    const std::vector<float>& wave = coder.GetSymbolWave(symbol);
    audio.insert(audio.end(), wave.begin(), wave.end());
  }
  const float rate = coder.params().sample_rate;
  if (params.single_sideband) {
    const float carrier = coder.carrier_cycles_per_frame() * rate / coder.frame_size();
    audio_dsp::HighPassFilter(audio, carrier, rate, &audio);
  }
  audio_dsp::FftResample(audio, rate, params.broadcast_sample_rate, &audio);
  const float scale = params.peak_amplitude / Peak(audio);
  for (float& sample : audio) sample *= scale;
  return audio;
}

// The planned resampling keeps the 16-bit audio that the host plays within
// one step of what whole-token transforms give, for both coders and other
// rates, with and without the sideband filter, tokens of 8 and 16 symbols
// and the checksum symbol.
TEST(VesknetEncoderTest, SixteenBitAudioWithinOneStepOfWholeTokenTransforms) {
  SymbolWaveCoderParams coder8 = ProductCoderParams();
  coder8.bits_per_symbol = 8;
  struct Case {
    SymbolWaveCoderParams coder;
    float broadcast_rate;
    bool single_sideband;
    bool checksum;
  };
  int max_step = 0;
  size_t differing = 0, total = 0;
  for (const Case& c :
       {Case{SymbolWaveCoderParams(), 48000, false, false},
        Case{SymbolWaveCoderParams(), 48000, true, true},
        Case{SymbolWaveCoderParams(), 44100, true, false},
        Case{ProductCoderParams(), 44100, false, true},
        Case{ProductCoderParams(), 48000, true, false},
        Case{ProductCoderParams(), 96000, false, false}, Case{coder8, 44100, true, true}}) {
    VesknetEncoderParams params;
    params.broadcast_sample_rate = c.broadcast_rate;
    params.single_sideband = c.single_sideband;
    params.append_checksum_symbol = c.checksum;
    params.symbols_per_token = 64 / c.coder.bits_per_symbol;
    const auto encoder = MakeEncoder(c.coder, params);
    std::vector<int32_t> symbols;
    ASSERT_TRUE(encoder->symbol_wave_coder().alphabet_size() > 2);
    for (int i = 0; i < params.symbols_per_token; ++i) {
      symbols.push_back((i * 7 + 3) % (encoder->symbol_wave_coder().alphabet_size() - 1));
    }
    std::vector<float> audio;
    ASSERT_TRUE(encoder->EncodeSymbols(symbols, &audio));
    std::vector<int32_t> all = symbols;
    if (c.checksum) {
      all.push_back(ChecksumSymbol(encoder->symbol_wave_coder().alphabet_size(), symbols));
    }
    const std::vector<float> expected = DirectlyEncoded(encoder->symbol_wave_coder(), params, all);
    ASSERT_EQ(audio.size(), expected.size());
    for (size_t i = 0; i < audio.size(); ++i) {
      const int step =
          std::abs(audio_dsp::FloatToPcm16(audio[i]) - audio_dsp::FloatToPcm16(expected[i]));
      max_step = std::max(max_step, step);
      differing += step != 0;
    }
    total += audio.size();
  }
  EXPECT_LE(max_step, 1);
  // Rounding rarely lands across a 16-bit step.
  EXPECT_LT(differing, total / 100);
}

TEST(VesknetEncoderTest, ProductDefaultsAreWholeFramesOfSymbolWaves) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 48000;  // Equal to the coder rate: no resampling.
  const auto encoder = MakeEncoder(ProductCoderParams(), params);
  std::vector<float> audio;
  ASSERT_TRUE(encoder->EncodeToken(kToken, &audio));
  ASSERT_EQ(audio.size(), 17u * 2032);
  EXPECT_FLOAT_EQ(Peak(audio), 0.5f);
  // Frame 0 is the sync symbol, then the nibbles of kToken, most significant
  // first, all scaled by one common factor.
  const SymbolWaveCoder& coder = encoder->symbol_wave_coder();
  const std::vector<int> symbols = {16, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 0};
  float used_peak = 0;
  for (int symbol : symbols) used_peak = std::max(used_peak, Peak(coder.GetSymbolWave(symbol)));
  const float scale = 0.5f / used_peak;
  for (int frame = 0; frame < 17; ++frame) {
    const std::vector<float>& wave = coder.GetSymbolWave(symbols[frame]);
    for (int n = 0; n < 2032; n += 101) {
      ASSERT_NEAR(audio[frame * 2032 + n], wave[n] * scale, 1e-6) << frame << " " << n;
    }
  }
}

TEST(VesknetEncoderTest, ChecksumSymbolMakesTheSumAMultipleOfSixteen) {
  EXPECT_EQ(ChecksumSymbol(17, {10, 10, 10, 7}), 11);  // 37 + 11 = 48.
  EXPECT_EQ(ChecksumSymbol(17, {16, 16}), 0);
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 48000;
  params.append_checksum_symbol = true;
  const auto encoder = MakeEncoder(ProductCoderParams(), params);
  std::vector<float> audio;
  ASSERT_TRUE(encoder->EncodeToken(kToken, &audio));
  EXPECT_EQ(audio.size(), 18u * 2032);  // One more frame.
}

TEST(VesknetEncoderTest, SingleSidebandRemovesEverythingBelowTheCarrier) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 48000;
  params.single_sideband = true;
  const auto encoder = MakeEncoder(ProductCoderParams(), params);
  std::vector<float> audio;
  ASSERT_TRUE(encoder->EncodeToken(kToken, &audio));
  const int n = static_cast<int>(audio.size());
  audio_dsp::RealFFTTransformer fft(n, false);
  std::vector<std::complex<float>> spectrum;
  fft.Forward(audio, &spectrum);
  const float carrier = encoder->symbol_wave_coder().carrier_frequency();
  double below = 0, above = 0;
  for (int k = 0; k < static_cast<int>(spectrum.size()); ++k) {
    (k * 48000.0 / n < carrier - 1 ? below : above) += std::norm(spectrum[k]);
  }
  EXPECT_LT(below, 1e-6 * above);
}

// A carrier at half the coder rate (4094 cycles in 8188-sample frames)
// snaps to 11025.001 Hz in float: the upper sideband is then the top bin,
// not a band that ends below where it starts.
TEST(VesknetEncoderTest, SingleSidebandWithTheCarrierAtHalfTheCoderRate) {
  SymbolWaveCoderParams coder;
  coder.code_signal.assign(2047, 1.0f);
  coder.sample_rate = 22050;
  coder.upsampling_factor = 4;
  coder.baseband_decimation_factor = 4;
  coder.desired_carrier_frequency = 11025;
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 22051;
  params.single_sideband = true;
  const auto encoder = MakeEncoder(coder, params);
  ASSERT_GT(encoder->symbol_wave_coder().carrier_frequency(), 11025.0f);
  std::vector<float> audio;
  ASSERT_TRUE(encoder->EncodeToken(kToken, &audio));
  EXPECT_FALSE(audio.empty());
}

TEST(VesknetEncoderTest, RefusesWrongInputWithoutTouchingTheOutput) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 48000;
  const auto encoder = MakeEncoder(ProductCoderParams(), params);
  base::ScopedLogCapture capture;
  std::vector<float> output = {1, 2, 3};
  EXPECT_FALSE(encoder->EncodeSymbols(std::vector<int32_t>(15, 0), &output));
  EXPECT_EQ(output, (std::vector<float>{1, 2, 3}));
  EXPECT_FALSE(encoder->EncodeSymbols(std::vector<int32_t>(16, 0), nullptr));
  EXPECT_FALSE(encoder->MakeStartTransition({}, &output));
  EXPECT_FALSE(encoder->MakeStartTransition({1}, nullptr));
  EXPECT_EQ(
      capture.Messages(base::LogSeverity::kError),
      (std::vector<std::string>{"EncodeSymbols() called with input of size 15, but expected 16.",
                                "EncodeSymbols() called with null output pointer.",
                                "MakeStartTransition() called with empty input.",
                                "MakeStartTransition() called with null output pointer."}));
}

TEST(VesknetEncoderTest, TransitionLengthsAndWrapAround) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 1000;
  params.transition_duration = 0.0f;
  std::vector<float> transition = {9};
  EXPECT_TRUE(MakeEncoder(ProductCoderParams(), params)->MakeStartTransition({1}, &transition));
  EXPECT_TRUE(transition.empty());
  // Seven samples over a 3-sample input read it periodically, ending on input[2].
  params.transition_duration = 0.007f;
  ASSERT_TRUE(
      MakeEncoder(ProductCoderParams(), params)->MakeStartTransition({10, 20, 30}, &transition));
  const std::vector<float> periodic = {30, 10, 20, 30, 10, 20, 30};
  ASSERT_EQ(transition.size(), 7u);
  for (int i = 0; i < 7; ++i) EXPECT_FLOAT_EQ(transition[i], periodic[i] * (i + 1) / 8.0f);
}

TEST(VesknetEncoderDeathTest, ChecksConstruction) {
  EXPECT_DEATH(VesknetEncoder(nullptr, VesknetEncoderParams()),
               "Check failed: 'symbol_wave_coder' Must be non-null");
  EXPECT_DEATH(MakeEncoder(ProductCoderParams(), VesknetEncoderParams()),
               "Check failed: params_.broadcast_sample_rate > 0.0");
  VesknetEncoderParams params;
  params.broadcast_sample_rate = 48000;
  const auto encoder = MakeEncoder(ProductCoderParams(), params);
  std::vector<float> audio;
  std::vector<int32_t> symbols(16, 0);
  symbols[3] = 17;
  EXPECT_DEATH(encoder->EncodeSymbols(symbols, &audio), "Check failed: symbol < alphabet_size_");
}

}  // namespace
}  // namespace audio_vesknet
