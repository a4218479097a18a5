#include "audio/vesknet/vesknet_encoder.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

#include "audio/dsp/kiss_fft_util.h"
#include "base/logging.h"

namespace audio_vesknet {

VesknetEncoder::VesknetEncoder(std::unique_ptr<SymbolWaveCoder> symbol_wave_coder,
                               const VesknetEncoderParams& params)
    : symbol_wave_coder_(std::move(CHECK_NOTNULL(symbol_wave_coder))), params_(params) {
  CHECK(params_.broadcast_sample_rate > 0.0);
  converter_ = std::make_unique<TokenSymbolConverter>(symbol_wave_coder_->params().bits_per_symbol);
  const int frames = params_.symbols_per_token + 1 + (params_.append_checksum_symbol ? 1 : 0);
  const int64_t token_size = static_cast<int64_t>(frames) * symbol_wave_coder_->frame_size();
  const float coder_rate = symbol_wave_coder_->params().sample_rate;
  if (token_size > 0 && token_size <= std::numeric_limits<int>::max()) {
    auto resampler = std::make_unique<audio_dsp::FftResampler>(
        static_cast<int>(token_size), coder_rate, params_.broadcast_sample_rate);
    // Equal lengths without a sideband filter are copied.
    if (params_.single_sideband || resampler->output_size() != resampler->input_size()) {
      resampler_ = std::move(resampler);
    }
  }
}

bool VesknetEncoder::EncodeToken(const std::vector<uint8_t>& bytes,
                                 std::vector<float>* output) const {
  std::vector<int32_t> symbols;
  converter_->BytesToSymbols(bytes, &symbols);
  VLOG(1) << "Converted " << bytes.size() << " bytes to " << symbols.size() << " symbols.";
  return EncodeSymbols(symbols, output);
}

bool VesknetEncoder::EncodeSymbols(const std::vector<int32_t>& symbols,
                                   std::vector<float>* output) const {
  if (static_cast<int>(symbols.size()) != params_.symbols_per_token) {
    LOG(ERROR) << "EncodeSymbols() called with input of size " << symbols.size()
               << ", but expected " << params_.symbols_per_token << ".";
    return false;
  }
  if (output == nullptr) {
    LOG(ERROR) << "EncodeSymbols() called with null output pointer.";
    return false;
  }
  const SymbolWaveCoder& coder = *symbol_wave_coder_;
  std::vector<int32_t> all_symbols = symbols;
  if (params_.append_checksum_symbol) {
    // The alphabet's last symbol is the sync symbol, so the data alphabet has
    // alphabet_size - 1 symbols.
    all_symbols.push_back(ChecksumSymbol(coder.alphabet_size(), symbols));
  }

  // The symbol waves in a row: straight into the output when it is
  // broadcast as it is, else into a buffer for the resampler.
  std::vector<float> token;
  std::vector<float>& waves = resampler_ == nullptr ? *output : token;
  waves.clear();
  waves.reserve((all_symbols.size() + 1) * coder.frame_size());
  const std::vector<float>& sync = coder.GetSyncSymbolWave();
  waves.insert(waves.end(), sync.begin(), sync.end());
  for (const int32_t symbol : all_symbols) {
    const std::vector<float>& wave = coder.GetSymbolWave(symbol);
    waves.insert(waves.end(), wave.begin(), wave.end());
  }

  const float coder_rate = coder.params().sample_rate;
  if (resampler_ != nullptr && params_.single_sideband) {
    // Only the upper sideband: everything from the carrier up. A carrier at
    // half the coder rate may round a hair above it in float: it is the top.
    const float nyquist = 0.5f * coder_rate;
    const float carrier = coder.carrier_cycles_per_frame() * coder_rate / coder.frame_size();
    resampler_->BandPassAndResample(token, std::min(carrier, nyquist), nyquist, output);
  } else if (resampler_ != nullptr) {
    resampler_->Resample(token, output);
  }

  float peak = 0.0f;
  for (const float sample : *output) peak = std::max(peak, std::fabs(sample));
  if (peak > 0.0f) {
    const float scale = params_.peak_amplitude / peak;
    for (float& sample : *output) sample *= scale;
  }
  return true;
}

bool VesknetEncoder::MakeStartTransition(const std::vector<float>& input,
                                         std::vector<float>* output) const {
  if (input.empty()) {
    LOG(ERROR) << "MakeStartTransition() called with empty input.";
    return false;
  }
  if (output == nullptr) {
    LOG(ERROR) << "MakeStartTransition() called with null output pointer.";
    return false;
  }
  const int n = std::max(
      0, static_cast<int>(std::round(params_.transition_duration * params_.broadcast_sample_rate)));
  const int64_t length = static_cast<int64_t>(input.size());
  output->resize(n);
  if (n == 0) return true;
  // Start where reading on periodically ends exactly at input[length - 1].
  const int64_t start = length - 1 - (n - 1) % length;
  for (int i = 0; i < n; ++i) {
    const float gain = static_cast<float>(i + 1) / static_cast<float>(n + 1);
    (*output)[i] = gain * input[(start + i) % length];
  }
  return true;
}

}  // namespace audio_vesknet
