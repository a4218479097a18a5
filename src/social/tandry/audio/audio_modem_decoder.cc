#include "social/tandry/audio/audio_modem_decoder.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <utility>

#include "audio/dsp/pcm_conversion.h"
#include "audio/vesknet/crc16_coder.h"
#include "audio/vesknet/vesknet_util.h"
#include "base/logging.h"
#include "social/tandry/audio/config_limits.h"

namespace audio_modem {

AudioModemDecoder::AudioModemDecoder(std::unique_ptr<audio_vesknet::VesknetDecoder> dsss_decoder)
    : dsss_decoder_(std::move(CHECK_NOTNULL(dsss_decoder))), kind_(kDsss) {
  token_size_ = dsss_decoder_->symbol_wave_coder().params().bits_per_symbol *
                dsss_decoder_->params().symbols_in_token / 8;
}

AudioModemDecoder::AudioModemDecoder(std::unique_ptr<ZintarDecoder> zintar_decoder)
    : zintar_decoder_(std::move(CHECK_NOTNULL(zintar_decoder))), kind_(kZintar) {
  token_size_ = zintar_decoder_->token_size();
}

AudioModemDecoder::AudioModemDecoder(std::unique_ptr<audio_vesknet::DtmfDecoder> dtmf_decoder)
    : dtmf_decoder_(std::move(CHECK_NOTNULL(dtmf_decoder))), kind_(kDtmf) {
  token_size_ = dtmf_decoder_->params().bytes_in_token;
}

AudioModemDecoder::~AudioModemDecoder() = default;

void AudioModemDecoder::Initialize(float sample_rate, int num_channels) {
  if (excision_params_ != nullptr && kind_ != kZintar) {
    excision_params_->sample_rate = sample_rate;
    excision_params_->num_channels = num_channels;
    excision_ = std::make_unique<audio_dsp::NarrowbandExcision>(*excision_params_);
  }
  if (kind_ == kDsss) dsss_decoder_->Initialize(sample_rate, num_channels);
  if (kind_ == kZintar) zintar_decoder_->Initialize(sample_rate, num_channels);
  if (kind_ == kDtmf) dtmf_decoder_->Init(sample_rate, num_channels);
}

void AudioModemDecoder::SetNarrowbandExcision(const audio_dsp::NarrowbandExcisionParams& params) {
  excision_params_ = std::make_unique<audio_dsp::NarrowbandExcisionParams>(params);
  excision_.reset();
}

const std::vector<float>& AudioModemDecoder::Condition(const std::vector<float>& samples) {
  if (excision_ == nullptr) return samples;
  const int count = static_cast<int>(samples.size());
  excision_->Analyze(samples.data(), count);
  if (!excision_->filtering()) return samples;
  if (&samples == &samples_) {
    excision_->Filter(samples_.data(), count);
    return samples_;
  }
  conditioned_.assign(samples.begin(), samples.end());
  excision_->Filter(conditioned_.data(), count);
  return conditioned_;
}

void AudioModemDecoder::ProcessSamples(const std::vector<float>& samples) {
  if (kind_ == kZintar) {
    // The values came from 16-bit samples: truncation restores them.
    raw_.resize(samples.size());
    for (size_t i = 0; i < samples.size(); ++i) raw_[i] = static_cast<int16_t>(samples[i]);
    zintar_decoder_->ProcessSamples(raw_.data(), static_cast<int>(raw_.size()));
    return;
  }
  const std::vector<float>& input = Condition(samples);
  if (kind_ == kDsss) dsss_decoder_->ProcessSamples(input);
  if (kind_ == kDtmf) dtmf_decoder_->ProcessSamples(input);
}

void AudioModemDecoder::ProcessPcm16(const int16_t* samples, int count) {
  if (count <= 0) return;  // Nothing to hear (and nothing to copy).
  if (kind_ == kZintar) {
    // The listening mode may mix the block down in place: give it a copy.
    raw_.resize(count);
    std::memcpy(raw_.data(), samples, sizeof(int16_t) * static_cast<size_t>(count));
    zintar_decoder_->ProcessSamples(raw_.data(), count);
    return;
  }
  audio_dsp::Pcm16ToFloats(samples, count, &samples_);
  ProcessSamples(samples_);
}

void AudioModemDecoder::ProcessSamplesWithZintar(int16_t* samples, int count) {
  // Only the zintar kind listens to raw samples.
  if (kind_ == kZintar) zintar_decoder_->ProcessSamples(samples, count);
}

bool AudioModemDecoder::DetectBroadcaster() {
  if (kind_ == kDsss) return dsss_decoder_->DetectBroadcaster();
  if (kind_ == kZintar) return zintar_decoder_->DetectBroadcaster();
  return false;
}

void AudioModemDecoder::WipeInternalData() {
  if (excision_ != nullptr) excision_->Reset();
  if (kind_ == kDsss) dsss_decoder_->WipeInternalData();
  if (kind_ == kZintar) zintar_decoder_->WipeInternalData();
  if (kind_ == kDtmf) dtmf_decoder_->Reset();
}

int AudioModemDecoder::GetMaxSafeInputSize() const {
  if (kind_ == kDsss) {
    const int frames = dsss_decoder_->max_buffer_size() - dsss_decoder_->buffered_input_frames();
    return std::max(0, frames) * dsss_decoder_->num_channels();
  }
  if (kind_ == kZintar) return zintar_decoder_->GetMaxSafeInputSize();
  if (kind_ == kDtmf) {
    const int64_t frames =
        dtmf_decoder_->max_buffer_size() - dtmf_decoder_->buffered_received_samples();
    const int64_t samples = std::max<int64_t>(0, frames) * dtmf_decoder_->num_channels();
    return static_cast<int>(std::min<int64_t>(samples, std::numeric_limits<int>::max()));
  }
  return 0;
}

bool AudioModemDecoder::listening() const {
  return kind_ == kZintar && zintar_decoder_->state() == ZintarDecoder::kListening;
}

bool AudioModemDecoder::GetTokens(DecodeResults* decode_results, int num_message_bytes,
                                  int num_crc_check_bytes) {
  CHECK(decode_results);
  if (num_message_bytes + num_crc_check_bytes != token_size_) {
    LOG(ERROR) << "num_message_bytes and num_crc_check_bytes do not add to correct value";
    return false;
  }
  if (num_message_bytes < 1) {
    LOG(ERROR) << "num_message_bytes must be positive";
    return false;
  }
  if (num_crc_check_bytes < 0) {
    LOG(ERROR) << "num_crc_check_bytes must be non-negative";
    return false;
  }
  decode_results->tokens.clear();

  DecodeResults raw;
  if (kind_ == kDsss || kind_ == kZintar) {
    audio_vesknet::VesknetDecodeResults dsss_results;
    const bool found = kind_ == kDsss ? dsss_decoder_->GetToken(&dsss_results)
                                      : zintar_decoder_->GetToken(&dsss_results);
    if (!found) return false;
    for (audio_vesknet::TokenCandidate& candidate : dsss_results.token_candidates) {
      raw.tokens.push_back({std::move(candidate.bytes), candidate.start_index, candidate.score});
    }
    raw.frame_times = std::move(dsss_results.frame_times);
    raw.frame_scores = std::move(dsss_results.frame_scores);
  } else if (kind_ == kDtmf) {
    std::vector<audio_vesknet::DtmfDecodedToken> tokens = dtmf_decoder_->GetToken();
    if (tokens.empty()) return false;
    for (audio_vesknet::DtmfDecodedToken& token : tokens) {
      raw.tokens.push_back({std::move(token.bytes), 0, token.score});
    }
  } else {
    return false;
  }

  if (num_crc_check_bytes == 0) {
    *decode_results = std::move(raw);
    return true;
  }
  if (num_crc_check_bytes != 2) {
    LOG(ERROR) << "Unsupported value for num_crc_check_bytes";
    return false;
  }
  audio_vesknet::Crc16CoderParams crc_params;
  crc_params.num_message_bytes = num_message_bytes;
  const audio_vesknet::Crc16Coder crc(crc_params);
  for (TokenResult& token : raw.tokens) {
    if (!crc.CheckCrc(token.bytes)) continue;
    token.bytes.resize(num_message_bytes);
    decode_results->tokens.push_back(std::move(token));
  }
  decode_results->frame_times = std::move(raw.frame_times);
  decode_results->frame_scores = std::move(raw.frame_scores);
  return !decode_results->tokens.empty();
}

namespace {

// The checks of the microphone that both decoder kinds share.
std::string MicrophoneError(float input_sample_rate, int num_channels) {
  if (!(input_sample_rate >= 1000 && input_sample_rate <= kMaxSampleRateHz)) {
    return "the microphone rate must lie in [1000, " + std::to_string(int(kMaxSampleRateHz)) +
           "] Hz";
  }
  if (num_channels < 1 || num_channels > kMaxChannels) {
    return "the microphone must have 1 to " + std::to_string(kMaxChannels) + " channels";
  }
  return std::string();
}

// The checks that the history a decoder keeps stays within bounds.
std::string HistoryError(double token_seconds, float buffer_length_tokens) {
  if (token_seconds > kMaxTokenSeconds) {
    return "a token may last at most " + std::to_string(static_cast<int>(kMaxTokenSeconds)) +
           " s on air";
  }
  if (!(buffer_length_tokens >= 1 && buffer_length_tokens <= 100)) {
    return "the buffer must hold 1 to 100 tokens";
  }
  if (token_seconds * buffer_length_tokens > kMaxHistorySeconds) {
    return "the history (buffer length x token duration) may last at most " +
           std::to_string(static_cast<int>(kMaxHistorySeconds)) + " s";
  }
  return std::string();
}

// Floats of acquisition history of a DSSS decoder of `config` with the
// default tuning, computed as the decoder sizes it.
int64_t AcquisitionFloats(const DsssDecoderConfig& config) {
  const audio_vesknet::VesknetDecoderParams tuning;
  const DsssWaveformConfig& w = config.waveform;
  const int frame = ((1 << w.number_of_taps) - 1) * w.upsampling_factor;
  const int cycles = audio_vesknet::SymbolWaveCoder::CarrierCyclesPerFrame(frame, w.sample_rate,
                                                                           w.carrier_frequency);
  std::vector<float> shifts;
  audio_vesknet::MakeFrequencyOffsets(
      tuning.acquisition_doppler_step,
      audio_vesknet::VesknetDecoder::MaxDopplerShift(cycles, tuning), &shifts);
  const float baseband_rate = w.sample_rate / w.baseband_decimation_factor;
  const int window =
      static_cast<int>(std::round(config.acquisition_window_seconds * baseband_rate));
  return audio_vesknet::AcquisitionScorer::HistoryFloats(
      frame / w.baseband_decimation_factor, static_cast<int>(shifts.size()),
      static_cast<float>(tuning.noise_smoothing_length), window);
}

}  // namespace

std::string DsssDecoderConfigError(const DsssDecoderConfig& config) {
  if (config.token_length_bytes < 1 || config.token_length_bytes > kMaxTokenBytes) {
    return "the token must have 1 to " + std::to_string(kMaxTokenBytes) + " bytes";
  }
  const std::string waveform_error = DsssWaveformConfigError(config.waveform);
  if (!waveform_error.empty()) return waveform_error;
  if (!(config.acquisition_window_seconds > 0 && config.acquisition_window_seconds <= 60)) {
    return "the acquisition window must lie in (0, 60] seconds";
  }
  if (AcquisitionFloats(config) > kMaxAcquisitionFloats) {
    return "the acquisition window and the Doppler search would take more than " +
           std::to_string(kMaxAcquisitionFloats * 4 >> 20) +
           " MiB: shorten the window or lower the carrier's cycles per frame";
  }
  if (config.max_tokens_per_call < 1 ||
      config.max_tokens_per_call > audio_vesknet::VesknetDecoderParams().max_candidates_rank) {
    return "tokens per call must be 1 to " +
           std::to_string(audio_vesknet::VesknetDecoderParams().max_candidates_rank);
  }
  const std::string microphone_error =
      MicrophoneError(config.input_sample_rate, config.num_channels);
  if (!microphone_error.empty()) return microphone_error;
  const std::string history_error = HistoryError(
      DsssTokenSeconds(config.waveform, config.token_length_bytes, config.use_checksum_symbol),
      config.buffer_length_tokens);
  if (!history_error.empty()) return history_error;
  if (config.use_zintar && ZintarDetectorHolder::Create(config.input_sample_rate, 1) == nullptr) {
    return "the zintar listening mode needs a microphone rate of at least 36994 Hz";
  }
  return std::string();
}

audio_dsp::NarrowbandExcisionParams DsssExcisionParams(const DsssWaveformConfig& waveform) {
  const float chip_rate = waveform.sample_rate / static_cast<float>(waveform.upsampling_factor);
  audio_dsp::NarrowbandExcisionParams params;
  params.band_low_hz = std::max(0.0f, waveform.carrier_frequency - chip_rate);
  params.band_high_hz = waveform.carrier_frequency + chip_rate;
  return params;
}

audio_dsp::NarrowbandExcisionParams DtmfExcisionParams(const std::vector<float>& tones_hz) {
  // Beyond the outer tones a line leaks little into the tone filters.
  constexpr float kMarginHz = 100.0f;
  audio_dsp::NarrowbandExcisionParams params;
  if (tones_hz.empty()) return params;
  params.band_low_hz =
      std::max(0.0f, *std::min_element(tones_hz.begin(), tones_hz.end()) - kMarginHz);
  params.band_high_hz = *std::max_element(tones_hz.begin(), tones_hz.end()) + kMarginHz;
  params.protected_hz = tones_hz;
  return params;
}

std::unique_ptr<AudioModemDecoder> MakeDsssAudioModemDecoder(const DsssDecoderConfig& config) {
  return MakeDsssAudioModemDecoder(config, audio_vesknet::VesknetDecoderParams());
}

std::unique_ptr<AudioModemDecoder> MakeDsssAudioModemDecoder(
    const DsssDecoderConfig& config, const audio_vesknet::VesknetDecoderParams& tuning,
    ZintarDecoder::Clock clock) {
  std::unique_ptr<audio_vesknet::SymbolWaveCoder> coder = MakeSymbolWaveCoder(config.waveform);
  audio_vesknet::VesknetDecoderParams params = tuning;
  // Integer division first, as on the transmitting side.
  params.symbols_in_token = (8 / config.waveform.bits_per_symbol) * config.token_length_bytes;
  params.use_checksum_symbol = config.use_checksum_symbol;
  params.acquisition_window_duration = config.acquisition_window_seconds;
  params.broadcaster_threshold = config.broadcaster_threshold;
  params.max_candidates_to_return = config.max_tokens_per_call;
  params.design_baseband_filter = config.design_baseband_filter;
  const double token_seconds = static_cast<double>(params.symbols_in_token) * coder->frame_size() /
                               coder->params().sample_rate;
  params.max_buffer_duration = static_cast<float>(token_seconds * config.buffer_length_tokens);
  auto dsss_decoder = std::make_unique<audio_vesknet::VesknetDecoder>(std::move(coder), params);
  std::unique_ptr<AudioModemDecoder> decoder;
  if (config.use_zintar) {
    // A detector that cannot be made (the rate is too low) ends the process
    // in the zintar decoder's check.
    decoder = std::make_unique<AudioModemDecoder>(std::make_unique<ZintarDecoder>(
        std::move(dsss_decoder),
        ZintarDetectorHolder::Create(config.input_sample_rate, config.num_channels),
        std::move(clock)));
  } else {
    decoder = std::make_unique<AudioModemDecoder>(std::move(dsss_decoder));
  }
  if (config.narrowband_excision) {
    decoder->SetNarrowbandExcision(DsssExcisionParams(config.waveform));
  }
  decoder->Initialize(config.input_sample_rate, config.num_channels);
  return decoder;
}

std::string DtmfDecoderConfigError(const DtmfDecoderConfig& config) {
  const std::string waveform_error = DtmfWaveformConfigError(config);
  if (!waveform_error.empty()) return waveform_error;
  if (config.max_tokens_per_call < 1 || config.max_tokens_per_call > kMaxDtmfTokensPerCall) {
    return "tokens per call must be 1 to " + std::to_string(kMaxDtmfTokensPerCall);
  }
  const std::string microphone_error =
      MicrophoneError(config.input_sample_rate, config.num_channels);
  if (!microphone_error.empty()) return microphone_error;
  // The resampler approximates the rate ratio by a fraction of denominator
  // 2000 at most.
  const float ratio = config.input_sample_rate / config.sample_rate;
  if (!(ratio >= 0.001f && ratio <= 1000.0f)) {
    return "the microphone rate must be within a factor 1000 of the sample rate";
  }
  return HistoryError(DtmfTokenSeconds(config), config.buffer_length_tokens);
}

std::unique_ptr<AudioModemDecoder> MakeDtmfAudioModemDecoder(const DtmfDecoderConfig& config) {
  return MakeDtmfAudioModemDecoder(config, audio_vesknet::DtmfDecoderParams());
}

std::unique_ptr<AudioModemDecoder> MakeDtmfAudioModemDecoder(
    const DtmfDecoderConfig& config, const audio_vesknet::DtmfDecoderParams& tuning) {
  audio_vesknet::DtmfEncoderParams waveform;
  if (!MakeDtmfEncoderParams(config, &waveform)) return nullptr;
  audio_vesknet::DtmfDecoderParams params = tuning;
  static_cast<audio_vesknet::DtmfEncoderParams&>(params) = waveform;
  params.max_candidates_per_decode_token_call = config.max_tokens_per_call;
  // Hosts may ask for more tokens per call than the rank checks sequences:
  // the rank grows to match instead of failing the token selector's check.
  params.max_candidates_rank = std::max(params.max_candidates_rank, config.max_tokens_per_call);
  params.max_buffer_duration_in_seconds =
      config.buffer_length_tokens * audio_vesknet::GetTokenDurationSeconds(params);
  auto decoder =
      std::make_unique<AudioModemDecoder>(std::make_unique<audio_vesknet::DtmfDecoder>(params));
  if (config.narrowband_excision) {
    decoder->SetNarrowbandExcision(DtmfExcisionParams(params.tone_frequencies));
  }
  decoder->Initialize(config.input_sample_rate, config.num_channels);
  return decoder;
}

}  // namespace audio_modem
