#include "social/tandry/audio/fuzz_modem_config.h"

#include <algorithm>
#include <cmath>
#include <initializer_list>
#include <sstream>

namespace audio_modem {
namespace {

// Reading and writing share one walk over the fields (Visit below), so that
// the layouts cannot drift apart. A value is either one of a few edge
// candidates (one byte picks it) or, for any other byte, a value from a
// range (ints) or any bit pattern (floats).
class Reader {
 public:
  explicit Reader(base::FuzzInput* input) : input_(input) {}
  void Flag(bool* value) { *value = input_->Bool(); }
  void Int(int* value, int lo, int hi, std::initializer_list<int> edges) {
    const uint8_t pick = input_->Byte();
    *value = pick < edges.size() ? edges.begin()[pick] : static_cast<int>(input_->InRange(lo, hi));
  }
  void Real(float* value, std::initializer_list<float> edges) {
    const uint8_t pick = input_->Byte();
    *value = pick < edges.size() ? edges.begin()[pick] : input_->Float();
  }

 private:
  base::FuzzInput* input_;
};

class Writer {
 public:
  explicit Writer(base::FuzzSeed* seed) : seed_(seed) {}
  void Flag(bool* value) { seed_->Bool(*value); }
  void Int(int* value, int lo, int /*hi*/, std::initializer_list<int> edges) {
    const auto found = std::find(edges.begin(), edges.end(), *value);
    seed_->Byte(static_cast<uint8_t>(found - edges.begin()));
    if (found == edges.end()) seed_->InRange(lo, *value);
  }
  void Real(float* value, std::initializer_list<float> edges) {
    const auto found = std::find(edges.begin(), edges.end(), *value);
    seed_->Byte(static_cast<uint8_t>(found - edges.begin()));
    if (found == edges.end()) seed_->Float(*value);
  }

 private:
  base::FuzzSeed* seed_;
};

// Draws fields at random around their edges (RandomFuzzModemConfig). Most
// fields keep the value they have (the product's), so that a configuration
// differs from a sound one in a few places and validation is reached past
// as well as tripped; flags are a coin toss.
class Randomizer {
 public:
  explicit Randomizer(std::mt19937* random) : random_(random) {}
  void Flag(bool* value) { *value = Uniform(0, 1) == 1; }
  void Int(int* value, int lo, int hi, std::initializer_list<int> edges) {
    if (Keep()) return;
    const int edge = edges.begin()[Uniform(0, static_cast<int64_t>(edges.size()) - 1)];
    switch (Uniform(0, 2)) {
      case 0:
        *value = edge;
        break;
      case 1:
        *value = std::clamp(edge + static_cast<int>(Uniform(0, 2)) - 1, lo, hi);
        break;
      default:
        *value = static_cast<int>(Uniform(lo, hi));
    }
  }
  void Real(float* value, std::initializer_list<float> edges) {
    if (Keep()) return;
    const float edge = edges.begin()[Uniform(0, static_cast<int64_t>(edges.size()) - 1)];
    switch (Uniform(0, 2)) {
      case 0:
        *value = edge;
        break;
      case 1:
        *value = edge * std::uniform_real_distribution<float>(0.97f, 1.03f)(*random_);
        break;
      default:
        // From a thousandth to a thousand times the edge, now and then negative.
        *value = (Uniform(0, 9) == 0 ? -1.0f : 1.0f) * (edge == 0 ? 1.0f : edge) *
                 std::pow(10.0f, std::uniform_real_distribution<float>(-3, 3)(*random_));
    }
  }

 private:
  bool Keep() { return Uniform(0, 9) != 0; }
  int64_t Uniform(int64_t lo, int64_t hi) {
    return std::uniform_int_distribution<int64_t>(lo, hi)(*random_);
  }
  std::mt19937* random_;
};

template <typename Io>
void Visit(Io* io, FuzzModemConfig* c) {
  io->Flag(&c->dtmf);
  io->Int(&c->message_bytes, -2, 300, {6, 5, 1, 0, 254});
  io->Int(&c->crc_check_bytes, -1, 3, {2, 0});
  io->Flag(&c->checksum_symbol);
  DsssWaveformConfig& w = c->dsss;
  io->Int(&w.number_of_taps, 4, 12, {7, 5, 11});
  io->Int(&w.code_number, -1, 4, {0, 2, 3});
  io->Real(&w.sample_rate, {48000, 44100, 8000, 96000, 384000, 0});
  io->Int(&w.upsampling_factor, -1, 600, {16, 15, 1, 32});
  io->Int(&w.baseband_decimation_factor, -1, 40, {4, 3, 1});
  io->Real(&w.carrier_frequency, {18500, 4000, 22050, 24000, 0});
  io->Int(&w.bits_per_symbol, -1, 9, {4, 1, 2, 8});
  io->Int(&w.min_cycles_per_frame, -1, 2000, {4, 0});
  io->Flag(&w.use_quadrature_carrier);
  io->Flag(&c->single_sideband);
  io->Int(&c->broadcast_sample_rate, -1, 400000, {48000, 44100, 37001, 8000});
  io->Real(&c->transition_seconds, {0.005f, 0, 1});
  DtmfWaveformConfig& t = c->dtmf_waveform;
  io->Real(&t.sample_rate, {44100, 48000, 4000, 1000, 8000, 384000});
  io->Int(&t.baseband_decimation_factor, -1, 300, {16, 1, 64});
  io->Real(&t.window_duration, {0.05f, 0.001f, 1, 0});
  io->Int(&t.tones_per_symbol, -1, 6, {2, 1, 3});
  io->Real(&t.attack_time, {0.025f, 0});
  io->Real(&t.decay_time, {0, 0.01f});
  io->Real(&t.sustain_time, {0, 0.01f});
  io->Real(&t.release_time, {0.025f, 0});
  io->Real(&t.sustain_amplitude, {1, 0.5f, 0});
  int num_tones = static_cast<int>(t.tone_frequencies.size());
  io->Int(&num_tones, 0, 12, {0, 3, 10});
  t.tone_frequencies.resize(num_tones);
  for (float& tone : t.tone_frequencies) io->Real(&tone, {740, 1975, 21000});
  io->Real(&c->microphone_rate, {48000, 44100, 8000, 16000, 36994, 192000, 384000});
  io->Int(&c->channels, -1, 70, {1, 2, 7, 64});
  io->Flag(&c->listening_mode);
  io->Int(&c->max_tokens_per_call, -1, 8, {2, 1, 6});
  io->Real(&c->buffer_length_tokens, {4, 1, 100});
  io->Real(&c->acquisition_window_seconds, {0.75f, 0.01f, 60});
  io->Real(&c->broadcaster_threshold, {5, 0});
  io->Flag(&c->design_baseband_filter);
}

enum Op : uint8_t { kProcess = 0, kTokens = 1, kBroadcaster = 2, kWipe = 3, kNumOps = 4 };

}  // namespace

FuzzModemConfig FuzzModemConfig::Dsss() { return FuzzModemConfig(); }

FuzzModemConfig FuzzModemConfig::Dtmf() {
  FuzzModemConfig config;
  config.dtmf = true;
  config.message_bytes = config.dtmf_waveform.bytes_in_token;
  config.crc_check_bytes = 0;
  config.checksum_symbol = config.dtmf_waveform.append_checksum_symbol;
  config.microphone_rate = config.dtmf_waveform.sample_rate;
  return config;
}

DsssEncoderConfig FuzzModemConfig::ToDsssEncoderConfig() const {
  DsssEncoderConfig config;
  config.token_length_bytes = token_bytes();
  config.append_checksum_symbol = checksum_symbol;
  config.single_sideband = single_sideband;
  config.waveform = dsss;
  config.broadcast_sample_rate = broadcast_sample_rate;
  config.transition_duration = transition_seconds;
  return config;
}

DtmfEncoderConfig FuzzModemConfig::ToDtmfEncoderConfig() const {
  DtmfEncoderConfig config;
  static_cast<DtmfWaveformConfig&>(config) = dtmf_waveform;
  config.bytes_in_token = token_bytes();
  config.append_checksum_symbol = checksum_symbol;
  return config;
}

DsssDecoderConfig FuzzModemConfig::ToDsssDecoderConfig() const {
  DsssDecoderConfig config;
  config.token_length_bytes = token_bytes();
  config.use_checksum_symbol = checksum_symbol;
  config.design_baseband_filter = design_baseband_filter;
  config.waveform = dsss;
  config.acquisition_window_seconds = acquisition_window_seconds;
  config.broadcaster_threshold = broadcaster_threshold;
  config.max_tokens_per_call = max_tokens_per_call;
  config.input_sample_rate = microphone_rate;
  config.num_channels = channels;
  config.buffer_length_tokens = buffer_length_tokens;
  config.use_zintar = listening_mode;
  return config;
}

DtmfDecoderConfig FuzzModemConfig::ToDtmfDecoderConfig() const {
  DtmfDecoderConfig config;
  static_cast<DtmfWaveformConfig&>(config) = ToDtmfEncoderConfig();
  config.max_tokens_per_call = max_tokens_per_call;
  config.input_sample_rate = microphone_rate;
  config.num_channels = channels;
  config.buffer_length_tokens = buffer_length_tokens;
  return config;
}

FuzzModemConfig ReadFuzzModemConfig(base::FuzzInput* input) {
  FuzzModemConfig config;
  Reader reader(input);
  Visit(&reader, &config);
  return config;
}

void WriteFuzzModemConfig(const FuzzModemConfig& config, base::FuzzSeed* seed) {
  FuzzModemConfig copy = config;
  Writer writer(seed);
  Visit(&writer, &copy);
}

FuzzModemConfig RandomFuzzModemConfig(std::mt19937* random) {
  FuzzModemConfig config;
  Randomizer randomizer(random);
  Visit(&randomizer, &config);
  return config;
}

std::string DescribeFuzzModemConfig(const FuzzModemConfig& c) {
  std::ostringstream out;
  out << (c.dtmf ? "dtmf" : "dsss") << " message_bytes=" << c.message_bytes
      << " crc=" << c.crc_check_bytes << " checksum=" << c.checksum_symbol;
  if (c.dtmf) {
    const DtmfWaveformConfig& t = c.dtmf_waveform;
    out << " rate=" << t.sample_rate << " decimation=" << t.baseband_decimation_factor
        << " window=" << t.window_duration << " tones_per_symbol=" << t.tones_per_symbol
        << " envelope=" << t.attack_time << "/" << t.decay_time << "/" << t.sustain_time << "/"
        << t.release_time << "/" << t.sustain_amplitude << " tones=";
    for (const float tone : t.tone_frequencies) out << tone << ",";
  } else {
    const DsssWaveformConfig& w = c.dsss;
    out << " taps=" << w.number_of_taps << " code=" << w.code_number
        << " coder_rate=" << w.sample_rate << " upsampling=" << w.upsampling_factor
        << " decimation=" << w.baseband_decimation_factor << " carrier=" << w.carrier_frequency
        << " bits=" << w.bits_per_symbol << " cycles=" << w.min_cycles_per_frame
        << " quadrature=" << w.use_quadrature_carrier << " ssb=" << c.single_sideband
        << " broadcast=" << c.broadcast_sample_rate << " transition=" << c.transition_seconds
        << " listening=" << c.listening_mode << " window=" << c.acquisition_window_seconds
        << " threshold=" << c.broadcaster_threshold
        << " designed_filter=" << c.design_baseband_filter;
  }
  out << " mic=" << c.microphone_rate << " channels=" << c.channels
      << " tokens_per_call=" << c.max_tokens_per_call << " buffer=" << c.buffer_length_tokens;
  return out.str();
}

void RunFuzzDecoderCalls(base::FuzzInput* input, int channels, const FuzzDecoderCalls& calls) {
  FuzzProcessCall call;
  while (input->remaining() > 0) {
    switch (input->Byte() % kNumOps) {
      case kProcess: {
        const size_t frames = input->U16();
        input->Samples(frames * channels, &call.samples);
        call.samples.resize(call.samples.size() / channels * channels);
        call.cut = std::min<size_t>(input->U16(), call.samples.size());
        call.flags = input->Byte();
        calls.process(call);
        break;
      }
      case kTokens:
        calls.tokens();
        break;
      case kBroadcaster:
        calls.broadcaster();
        break;
      case kWipe:
        calls.wipe(input->Byte());
        break;
    }
  }
}

void WriteFuzzDecoderCalls(const std::vector<int16_t>& samples, int channels, int piece_frames,
                           base::FuzzSeed* seed) {
  const size_t piece = static_cast<size_t>(piece_frames) * channels;
  for (size_t start = 0; start < samples.size(); start += piece) {
    const size_t count = std::min(piece, samples.size() - start);
    seed->Byte(kProcess);
    seed->U16(static_cast<uint16_t>(count / channels));
    seed->Samples(samples.data() + start, count);
    seed->U16(0);
    seed->Byte(0);
    seed->Byte(kBroadcaster);
    seed->Byte(kTokens);
  }
}

}  // namespace audio_modem
