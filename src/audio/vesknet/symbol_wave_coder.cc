#include "audio/vesknet/symbol_wave_coder.h"

#include <cmath>
#include <complex>

#include "audio/dsp/kiss_fft.h"
#include "audio/vesknet/code_signal_generator.h"
#include "base/logging.h"

namespace audio_vesknet {

std::vector<float> DefaultCodeSignal() {
  std::vector<float> code;
  GenerateCodeSignal(7, 0, &code);
  return code;
}

std::vector<float> FourierUpsample(const std::vector<float>& x, int k) {
  CHECK(k >= 1);
  const int length = static_cast<int>(x.size());
  audio_dsp::RealFFTTransformer forward(length, /*scale_inverse=*/false);
  std::vector<std::complex<float>> spectrum;
  forward.Forward(x, &spectrum);
  // Split the Nyquist bin's energy between the two halves of the larger spectrum.
  if (length % 2 == 0) spectrum.back() *= 0.5f;
  const int upsampled_length = length * k;
  spectrum.resize(upsampled_length / 2 + 1);
  audio_dsp::RealFFTTransformer inverse(upsampled_length, /*scale_inverse=*/false);
  std::vector<float> result;
  inverse.Inverse(spectrum, &result);
  const double scale = 1.0 / length;
  for (float& sample : result) sample = static_cast<float>(sample * scale);
  return result;
}

SymbolWaveCoder::SymbolWaveCoder(const SymbolWaveCoderParams& params) : params_(params) {
  CHECK(params.sample_rate > 0.0);
  CHECK(params.upsampling_factor > 0);
  CHECK(params.desired_carrier_frequency >= 0.0);
  CHECK(params.desired_carrier_frequency <= params.sample_rate / 2);
  CHECK(params.bits_per_symbol > 0);
  CHECK(params.min_cycles_per_frame >= 0);
  CHECK(params.baseband_decimation_factor > 0);
  CHECK(params.upsampling_factor % params.baseband_decimation_factor == 0);
  CHECK(params.pedestal_amplitude > 0.0f);

  const int code_length = static_cast<int>(params_.code_signal.size());
  alphabet_size_ = (1 << params_.bits_per_symbol) + 1;
  frame_size_ = code_length * params_.upsampling_factor;
  carrier_cycles_per_frame_ =
      CarrierCyclesPerFrame(frame_size_, params_.sample_rate, params_.desired_carrier_frequency);
  VLOG(1) << "CCPF: " << carrier_cycles_per_frame_;
  CHECK(carrier_cycles_per_frame_ >= 0);

  // Baseband templates.
  const int baseband_frame = frame_size_ / params_.baseband_decimation_factor;
  baseband_code_ = FourierUpsample(params_.code_signal, baseband_frame / code_length);
  baseband_tones_.resize(alphabet_size_, baseband_frame);
  for (int s = 0; s < alphabet_size_; ++s) {
    const double cycles = params_.min_cycles_per_frame + s;
    for (int n = 0; n < baseband_frame; ++n) {
      baseband_tones_(s, n) =
          static_cast<float>(std::sin(2.0 * M_PI * cycles * n / baseband_frame));
    }
  }

  // Passband waves: code x (pedestal x sine carrier + carrier' x symbol tone).
  const std::vector<float> code = FourierUpsample(params_.code_signal, params_.upsampling_factor);
  const double omega = 2.0 * M_PI * carrier_cycles_per_frame_ / frame_size_;
  std::vector<float> sine_carrier(frame_size_), tone_carrier(frame_size_);
  for (int n = 0; n < frame_size_; ++n) {
    sine_carrier[n] = static_cast<float>(std::sin(n * omega));
    tone_carrier[n] =
        params_.use_quadrature_carrier ? static_cast<float>(std::cos(n * omega)) : sine_carrier[n];
  }
  symbol_waves_.assign(alphabet_size_, std::vector<float>(frame_size_));
  float peak = 0.0f;
  for (int s = 0; s < alphabet_size_; ++s) {
    const double cycles = params_.min_cycles_per_frame + s;
    std::vector<float>& wave = symbol_waves_[s];
    for (int n = 0; n < frame_size_; ++n) {
      const float tone = static_cast<float>(std::sin(2.0 * M_PI * cycles * n / frame_size_));
      wave[n] = code[n] * (params_.pedestal_amplitude * sine_carrier[n] + tone_carrier[n] * tone);
      peak = std::max(peak, std::fabs(wave[n]));
    }
  }
  // Scaling in double makes the loudest sample exactly 1.0.
  const double scale = 1.0 / peak;
  for (std::vector<float>& wave : symbol_waves_) {
    for (float& sample : wave) sample = static_cast<float>(sample * scale);
  }
}

int SymbolWaveCoder::CarrierCyclesPerFrame(int frame_size, float sample_rate,
                                           float desired_carrier_frequency) {
  // Single precision, product first, as the transmitters in the field do:
  // both ends must agree on this integer.
  const float carrier_product = static_cast<float>(frame_size) * desired_carrier_frequency;
  return static_cast<int>(std::floor(carrier_product / sample_rate));
}

const std::vector<float>& SymbolWaveCoder::GetSymbolWave(int symbol) const {
  CHECK(symbol >= 0);
  CHECK(symbol < alphabet_size_);
  return symbol_waves_[symbol];
}

const std::vector<float>& SymbolWaveCoder::GetSyncSymbolWave() const {
  return GetSymbolWave(alphabet_size_ - 1);
}

float SymbolWaveCoder::carrier_frequency() const {
  return static_cast<float>(carrier_cycles_per_frame_) * params_.sample_rate / frame_size_;
}

}  // namespace audio_vesknet
