// A simulated day of a phone that listens: four decoders with their default
// configurations (DSSS with the 48 kHz coder, DSSS with the 44.1 kHz coder,
// DTMF, and the listening mode in front of the 48 kHz coder) in one process,
// fed one microphone stream as fast as the machine runs. The stream
// alternates background sound (white noise, speech babble, silence) with
// tokens of the three transmitters at random times, levels and SNRs, played
// through the channel simulator. Every reported token is judged against what
// was sent to that decoder; the heap and the resident set are watched.
//
//   soak [--hours H] [--seed N] [--min-snr DB] [--max-snr DB] [--hostile]
//        [--decoders dsss48,dsss44,dtmf,listening] [--dtmf-set name=value,...]
//        [--record FILE [--record-from S] [--record-seconds N]]
//
// --hostile sends no token and adds music (chords of harmonic tones) to the
// background sounds: every reported token is false.
//
// --decoders runs only the decoders listed (all four by default). The
// stream is the same whichever run: every transmitter still plays into it,
// so a decoder's counts do not depend on which others run, and a day of one
// decoder costs a fraction of the four. --dtmf-set changes the DTMF
// receiver's tuning or configuration as dtmf_robustness --set does (see
// dtmf_trial.h), to measure false tokens against a tuning.
//
// --record writes the microphone stream from stream time --record-from on,
// for --record-seconds, as headerless 16-bit little-endian PCM (48 kHz
// mono), so that a false token can be decoded again alone, e.g. with
// `vesk decode --raw --rate 48000 --channels 1`.
//
// The output ends with one line:
//   RESULT hours=H decoders=R tokens_sent=N tokens_decoded=D false_tokens=F
//          heap_start_kib=S heap_end_kib=E rss_peak_kib=P
// (on one line; R decoders ran). A token meant for the 48 kHz coder is sent
// to two decoders, the plain one and the listening mode, and counts twice in
// N; D counts the (token, decoder) pairs in which the decoder reported the
// token. A false token is a report of a message that was not sent to that
// decoder in the last kMatchSeconds; each is printed with the last tokens
// sent to that decoder and the number of bytes in which it differs from
// each. The heap is glibc's in use (mallinfo2: arena and mmapped blocks),
// taken between segments, when no temporary buffer is alive: at the start
// after warming up (the first simulated minute), and at the end.

#include <malloc.h>
#include <sys/resource.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cinttypes>
#include <cmath>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/bench/bench_util.h"
#include "tools/bench/dtmf_trial.h"
#include "tools/bench/trial.h"
#include "tools/channel/babble.h"
#include "tools/channel/channel_simulator.h"
#include "tools/channel/music.h"
#include "tools/common/hex_bytes.h"
#include "tools/common/option_parser.h"
#include "tools/common/over_the_air.h"
#include "tools/common/stream_decoding.h"

namespace vesk_bench {
namespace {

// 48 kHz mono: every decoder takes it (the listening mode needs 36994 Hz or
// more), it is the 48 kHz coder's own rate, and phones record it natively.
constexpr int kMicRate = 48000;
// Samples per decoder call: what StreamDecoder hands over by default.
constexpr int kChunkSamples = vesk_tool::StreamDecodingOptions().chunk_bytes / 2;
// A report matches a token sent to its decoder at most this long before
// (decoders hold a few seconds of history; 48-bit random messages never
// match by chance).
constexpr double kMatchSeconds = 30.0;
// Background sound between transmissions: 2 to 40 s, generated in pieces
// of at most 10 s to bound memory.
constexpr double kMinGapSeconds = 2.0;
constexpr double kMaxGapSeconds = 40.0;
constexpr double kPieceSeconds = 10.0;
// A transmission (at most 1.5 s lead-in, 3 repetitions, 1 s tail: under 5 s)
// starts only this long before the end, so that it is followed by background.
constexpr double kLastTransmissionSeconds = 10.0;
// Levels of the background sounds, dB re full scale (32768): any level.
constexpr double kMinLevelDb = -80.0;
constexpr double kMaxLevelDb = 0.0;
// "Very quiet" noise: 0.1 to 3 LSB rms.
constexpr double kMinQuietDb = -110.0;
constexpr double kMaxQuietDb = -80.0;
// Transmitter level at the microphone (channel gain), dB: a phone near or
// across the room; the decoders' scores are normalised, so mostly the SNR
// matters.
constexpr double kMinGainDb = -20.0;
constexpr double kMaxGainDb = 0.0;
constexpr double kWarmUpSeconds = 60.0;
// Tokens per decoder that a false token is compared with.
constexpr size_t kLastSent = 3;

// Upper edges of the SNR bands of the table, dB: 1 dB where the decoders go
// from failure to success (see the README's robustness tables).
constexpr double kBandEdges[] = {-60, -20, -19, -18, -17, -16, -15, -14, -12, -10, 0, 10, 20, 60};
constexpr int kNumBands = sizeof(kBandEdges) / sizeof(kBandEdges[0]) - 1;

struct Options {
  double hours = 24.0;
  int seed = 1;
  double min_snr_db = -20.0;
  double max_snr_db = 20.0;
  bool hostile = false;
  std::string record_path;  // Empty: no recording.
  double record_from_s = 0.0;
  double record_seconds = 60.0;
  std::string decoders = "dsss48,dsss44,dtmf,listening";
  // The DTMF receiver (its config, tuning and excision; the channel and
  // window are not used): product defaults unless --dtmf-set.
  DtmfTrial dtmf;
};

enum class Sound { kNoise, kBabble, kMusic, kZero, kQuietNoise };

struct Background {
  Sound sound = Sound::kZero;
  double level_db = 0.0;  // RMS (noise, babble) or peak (music), dB re full scale.
  int talkers = 4;        // Babble.
};

int16_t ToPcm(double value) {
  return static_cast<int16_t>(std::lround(std::clamp(value, -32768.0, 32767.0)));
}

double Uniform(double low, double high, vesk_channel::Random* random) {
  return low + (high - low) * random->Uniform();
}

// Noise, babble and silence (half digital zero, half very quiet noise)
// equally often; hostile, music as well.
Background DrawBackground(bool hostile, vesk_channel::Random* random) {
  static constexpr Sound kSounds[] = {Sound::kNoise,  Sound::kNoise, Sound::kBabble,
                                      Sound::kBabble, Sound::kZero,  Sound::kQuietNoise,
                                      Sound::kMusic,  Sound::kMusic};
  Background background;
  background.sound = kSounds[random->UniformInt(hostile ? 8 : 6)];
  background.level_db = background.sound == Sound::kQuietNoise
                            ? Uniform(kMinQuietDb, kMaxQuietDb, random)
                            : Uniform(kMinLevelDb, kMaxLevelDb, random);
  background.talkers = 1 + random->UniformInt(6);
  return background;
}

std::string Describe(const Background& background) {
  static const char* const kNames[] = {"white noise", "babble", "music", "digital zero",
                                       "quiet noise"};
  char text[96];
  std::snprintf(text, sizeof(text), "%s at %.1f dBFS", kNames[static_cast<int>(background.sound)],
                background.level_db);
  return text;
}

// `frames` samples of `background`.
std::vector<int16_t> MakeBackground(const Background& background, int64_t frames, uint64_t seed) {
  const double level = 32768.0 * std::pow(10.0, background.level_db / 20.0);
  std::vector<int16_t> pcm;
  switch (background.sound) {
    case Sound::kZero:
      pcm.assign(static_cast<size_t>(frames), 0);
      break;
    case Sound::kNoise:
    case Sound::kQuietNoise:
      pcm = vesk_channel::MakeNoise(static_cast<double>(frames) / kMicRate, kMicRate, level, seed);
      break;
    case Sound::kBabble:
      for (const float s :
           vesk_channel::MakeBabbleSamples(frames, kMicRate, background.talkers, seed)) {
        pcm.push_back(ToPcm(level * s));
      }
      break;
    case Sound::kMusic: {
      vesk_channel::MusicParams music;
      music.peak = std::min(1.0, level / 32767.0);
      for (const float s : vesk_channel::MakeMusic(frames, kMicRate, music, seed)) {
        pcm.push_back(ToPcm(32767.0 * s));
      }
      break;
    }
  }
  pcm.resize(static_cast<size_t>(frames), 0);  // MakeNoise rounds the duration.
  return pcm;
}

int BytesDiffering(const std::vector<uint8_t>& a, const std::vector<uint8_t>& b) {
  int differ = static_cast<int>(std::max(a.size(), b.size()) - std::min(a.size(), b.size()));
  for (size_t i = 0; i < std::min(a.size(), b.size()); ++i) differ += a[i] != b[i];
  return differ;
}

int BandOf(double snr_db) {
  const double* upper = std::upper_bound(std::begin(kBandEdges) + 1, std::end(kBandEdges), snr_db);
  return std::min<int>(static_cast<int>(upper - kBandEdges) - 1, kNumBands - 1);
}

struct Tally {
  int sent = 0;
  int decoded = 0;
};

// One decoder and the judgement of what it reports.
struct Receiver {
  struct Sent {
    std::vector<uint8_t> message;
    double start_s;  // Stream time of the transmission's start.
    double end_s;    // And of its end.
    double snr_db;
    bool decoded;
  };

  const char* name;
  // Null when the decoder does not run (see --decoders).
  std::unique_ptr<audio_modem::AudioModemDecoder> decoder;
  std::unique_ptr<vesk_tool::StreamDecoder> stream;
  std::vector<Sent> pending;  // Sent in the last kMatchSeconds.
  std::vector<Sent> last;     // The last kLastSent sent, to explain a false token.
  std::array<Tally, kNumBands> bands{};
  int sent = 0;
  int decoded = 0;
  int repeats = 0;  // Reported again after the stream decoder's hold.
  int false_tokens = 0;
  int wake_ups = 0;  // Listening mode: falls from listening to decoding.
  bool was_listening = true;
};

struct Transmitter {
  const char* name;
  std::unique_ptr<audio_modem::AudioModemEncoder> encoder;
  int message_bytes;
  int crc_bytes;
  std::vector<Receiver*> receivers;  // The decoders it is meant for.
};

long HeapInUseKib() {
  const struct mallinfo2 info = mallinfo2();
  return static_cast<long>((info.uordblks + info.hblkhd) / 1024);
}

long PeakResidentKib() {
  struct rusage usage;
  getrusage(RUSAGE_SELF, &usage);
  return usage.ru_maxrss;
}

std::string Clock(double seconds) {
  const int64_t s = static_cast<int64_t>(seconds);
  char text[32];
  std::snprintf(text, sizeof(text), "%" PRId64 ":%02d:%02d", s / 3600,
                static_cast<int>(s / 60 % 60), static_cast<int>(s % 60));
  return text;
}

class Soak {
 public:
  explicit Soak(const Options& options);
  // False when the recording file cannot be opened.
  bool recording_ok() const;
  void Run();
  void Report() const;

 private:
  void AddReceivers();
  void AddTransmitters();
  void PlayBackground(int64_t frames);
  void Transmit();
  // Feeds `pcm` to every decoder, a chunk at a time, and judges what they report.
  void Feed(const std::vector<int16_t>& pcm);
  void Judge(Receiver* receiver, const vesk_tool::FoundToken& token);
  // Writes the part of `count` samples starting at stream frame frames_ that
  // falls in the recorded span.
  void Record(const int16_t* samples, int64_t count);
  // Between segments: expiry of old tokens, the heap and progress.
  void Checkpoint();
  double now_s() const { return static_cast<double>(frames_) / kMicRate; }

  const Options options_;
  const int64_t total_frames_;
  vesk_channel::Random plan_;  // What plays when, and how loud.
  uint64_t pieces_ = 0;
  uint64_t transmissions_ = 0;
  int64_t frames_ = 0;
  std::array<Receiver, 4> receivers_{};
  std::vector<Transmitter> transmitters_;
  std::string playing_;  // What the microphone hears now.
  long heap_start_kib_ = -1;
  long heap_end_kib_ = -1;
  long heap_low_kib_ = -1;
  long heap_high_kib_ = -1;
  double next_progress_s_ = 3600.0;
  std::chrono::steady_clock::time_point started_;
  std::unique_ptr<FILE, int (*)(FILE*)> record_{nullptr, fclose};
};

Soak::Soak(const Options& options)
    : options_(options),
      total_frames_(std::llround(options.hours * 3600.0 * kMicRate)),
      plan_(vesk_channel::DeriveSeed(static_cast<uint64_t>(options.seed), 0)) {
  AddReceivers();
  AddTransmitters();
  if (!options.record_path.empty()) record_.reset(std::fopen(options.record_path.c_str(), "wb"));
}

bool Soak::recording_ok() const { return options_.record_path.empty() || record_ != nullptr; }

void Soak::AddReceivers() {
  audio_modem::DsssDecoderConfig dsss;
  dsss.input_sample_rate = kMicRate;
  audio_modem::DsssDecoderConfig dsss44 = dsss;
  dsss44.waveform = audio_modem::Waveform44100();
  audio_modem::DsssDecoderConfig listening = dsss;
  listening.use_zintar = true;
  // The listening mode's fall-back timer runs on stream time, as it would
  // on a phone that hears the stream in real time.
  const audio_modem::ZintarDecoder::Clock stream_clock = [this] {
    return frames_ * 1000 / kMicRate;
  };
  receivers_[0].name = "DSSS 48k";
  receivers_[1].name = "DSSS 44.1k";
  receivers_[2].name = "DTMF";
  receivers_[3].name = "listening";
  const std::string& run = options_.decoders;
  if (HasItem(run, "dsss48")) {
    receivers_[0].decoder = audio_modem::MakeDsssAudioModemDecoder(dsss);
  }
  if (HasItem(run, "dsss44")) {
    receivers_[1].decoder = audio_modem::MakeDsssAudioModemDecoder(dsss44);
  }
  if (HasItem(run, "dtmf")) {
    receivers_[2].decoder = MakeDtmfTrialDecoder(options_.dtmf, kMicRate, 1);
  }
  if (HasItem(run, "listening")) {
    receivers_[3].decoder = audio_modem::MakeDsssAudioModemDecoder(
        listening, audio_vesknet::VesknetDecoderParams(), stream_clock);
  }
  const int dtmf_bytes = options_.dtmf.config.bytes_in_token;
  for (Receiver& r : receivers_) {
    if (r.decoder == nullptr) continue;
    vesk_tool::StreamDecodingOptions stream;
    stream.zintar = r.decoder->kind() == audio_modem::AudioModemDecoder::kZintar;
    const bool is_dtmf = r.decoder->kind() == audio_modem::AudioModemDecoder::kDtmf;
    // DSSS: 6 message bytes and CRC-16; DTMF: 5 bytes and the checksum symbol.
    r.stream = std::make_unique<vesk_tool::StreamDecoder>(
        r.decoder.get(), kMicRate, 1, is_dtmf ? dtmf_bytes : dsss.token_length_bytes - 2,
        is_dtmf ? 0 : 2, stream);
  }
}

void Soak::AddTransmitters() {
  audio_modem::DsssEncoderConfig dsss;
  audio_modem::DsssEncoderConfig dsss44 = dsss;
  dsss44.waveform = audio_modem::Waveform44100();
  const audio_modem::DtmfEncoderConfig dtmf;
  const int dsss_bytes = dsss.token_length_bytes - 2;
  transmitters_.push_back({"DSSS 48k",
                           audio_modem::MakeDsssAudioModemEncoder(dsss),
                           dsss_bytes,
                           2,
                           {&receivers_[0], &receivers_[3]}});
  transmitters_.push_back({"DSSS 44.1k",
                           audio_modem::MakeDsssAudioModemEncoder(dsss44),
                           dsss_bytes,
                           2,
                           {&receivers_[1]}});
  transmitters_.push_back({"DTMF",
                           audio_modem::MakeDtmfAudioModemEncoder(dtmf),
                           dtmf.bytes_in_token,
                           0,
                           {&receivers_[2]}});
}

void Soak::Run() {
  started_ = std::chrono::steady_clock::now();
  const int64_t last_start = total_frames_ - std::llround(kLastTransmissionSeconds * kMicRate);
  while (frames_ < total_frames_) {
    const int64_t gap = std::llround(Uniform(kMinGapSeconds, kMaxGapSeconds, &plan_) * kMicRate);
    PlayBackground(std::min(gap, total_frames_ - frames_));
    if (!options_.hostile && frames_ <= last_start) {
      Transmit();
      Checkpoint();
    }
  }
  heap_end_kib_ = HeapInUseKib();
}

void Soak::PlayBackground(int64_t frames) {
  const Background background = DrawBackground(options_.hostile, &plan_);
  playing_ = Describe(background);
  const int64_t piece_frames = std::llround(kPieceSeconds * kMicRate);
  for (int64_t done = 0; done < frames; done += piece_frames) {
    const uint64_t seed =
        vesk_channel::DeriveSeed(vesk_channel::DeriveSeed(options_.seed, 1), pieces_++);
    Feed(MakeBackground(background, std::min(piece_frames, frames - done), seed));
    Checkpoint();
  }
}

void Soak::Transmit() {
  Transmitter& transmitter = transmitters_[plan_.UniformInt(3)];
  const double snr_db = Uniform(options_.min_snr_db, options_.max_snr_db, &plan_);
  const double gain_db = Uniform(kMinGainDb, kMaxGainDb, &plan_);
  const uint64_t seed =
      vesk_channel::DeriveSeed(vesk_channel::DeriveSeed(options_.seed, 2), transmissions_++);
  const std::vector<uint8_t> message = RandomMessage(transmitter.message_bytes, seed);
  vesk_tool::OverTheAir air;
  air.channel = DefaultTrialChannel();
  air.channel.mic_rate = kMicRate;
  air.channel.snr_db = snr_db;
  air.channel.gain = std::pow(10.0, gain_db / 20.0);
  air.channel.seed = seed;
  const vesk_channel::ChannelOutput heard =
      vesk_tool::PlayOverTheAir(*transmitter.encoder, message, transmitter.crc_bytes, air);
  const Receiver::Sent sent{message, now_s(),
                            now_s() + static_cast<double>(heard.samples.size()) / kMicRate, snr_db,
                            false};
  for (Receiver* receiver : transmitter.receivers) {
    if (receiver->decoder == nullptr) continue;
    receiver->pending.push_back(sent);
    if (receiver->last.size() == kLastSent) receiver->last.erase(receiver->last.begin());
    receiver->last.push_back(sent);
    ++receiver->sent;
    ++receiver->bands[BandOf(snr_db)].sent;
  }
  char text[96];
  std::snprintf(text, sizeof(text), "a %s token at %.1f dB SNR", transmitter.name, snr_db);
  playing_ = text;
  Feed(heard.samples);
}

void Soak::Feed(const std::vector<int16_t>& pcm) {
  const int64_t size = static_cast<int64_t>(pcm.size());
  for (int64_t start = 0; start < size; start += kChunkSamples) {
    const int64_t count = std::min<int64_t>(kChunkSamples, size - start);
    for (Receiver& r : receivers_) {
      if (r.decoder == nullptr) continue;
      for (const vesk_tool::FoundToken& token : r.stream->Feed(pcm.data() + start, count)) {
        Judge(&r, token);
      }
      const bool listening = r.decoder->listening();
      r.wake_ups += r.was_listening && !listening;
      r.was_listening = listening;
    }
    if (record_) Record(pcm.data() + start, count);
    frames_ += count;
  }
}

void Soak::Record(const int16_t* samples, int64_t count) {
  const int64_t from = std::llround(options_.record_from_s * kMicRate);
  const int64_t to = from + std::llround(options_.record_seconds * kMicRate);
  const int64_t first = std::max(from, frames_), last = std::min(to, frames_ + count);
  if (first < last) {
    std::fwrite(samples + (first - frames_), sizeof(int16_t), static_cast<size_t>(last - first),
                record_.get());
  }
}

void Soak::Judge(Receiver* receiver, const vesk_tool::FoundToken& token) {
  for (Receiver::Sent& sent : receiver->pending) {
    if (sent.message != token.bytes) continue;
    if (sent.decoded) {
      ++receiver->repeats;
    } else {
      sent.decoded = true;
      ++receiver->decoded;
      ++receiver->bands[BandOf(sent.snr_db)].decoded;
    }
    return;
  }
  ++receiver->false_tokens;
  std::printf("false token: %s reported %s at %s, while playing %s; last sent to it:\n",
              receiver->name, vesk_tool::ToHex(token.bytes).c_str(), Clock(token.time_s).c_str(),
              playing_.c_str());
  for (const Receiver::Sent& sent : receiver->last) {
    std::printf("  %s at %s to %s, %.1f dB SNR, %d bytes differ\n",
                vesk_tool::ToHex(sent.message).c_str(), Clock(sent.start_s).c_str(),
                Clock(sent.end_s).c_str(), sent.snr_db, BytesDiffering(sent.message, token.bytes));
  }
  std::fflush(stdout);
}

void Soak::Checkpoint() {
  for (Receiver& r : receivers_) {
    r.pending.erase(std::remove_if(r.pending.begin(), r.pending.end(),
                                   [&](const Receiver::Sent& sent) {
                                     return now_s() - sent.end_s > kMatchSeconds;
                                   }),
                    r.pending.end());
  }
  if (now_s() < std::min(kWarmUpSeconds, 0.5 * options_.hours * 3600.0)) return;
  const long heap = HeapInUseKib();
  if (heap_start_kib_ < 0) heap_start_kib_ = heap_low_kib_ = heap_high_kib_ = heap;
  heap_low_kib_ = std::min(heap_low_kib_, heap);
  heap_high_kib_ = std::max(heap_high_kib_, heap);
  if (now_s() >= next_progress_s_) {
    next_progress_s_ += 3600.0;
    const double wall_s =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - started_).count();
    std::fprintf(stderr,
                 "%s simulated in %.0f s (%.0fx real time): heap %ld KiB, peak RSS %ld KiB\n",
                 Clock(now_s()).c_str(), wall_s, now_s() / wall_s, heap, PeakResidentKib());
  }
}

void Soak::Report() const {
  const double wall_s =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - started_).count();
  std::vector<const Receiver*> running;
  for (const Receiver& r : receivers_) {
    if (r.decoder != nullptr) running.push_back(&r);
  }
  int sent = 0, decoded = 0, false_tokens = 0;
  for (const Receiver* r : running) {
    sent += r->sent;
    decoded += r->decoded;
    false_tokens += r->false_tokens;
  }
  std::printf("\n### %g simulated hours%s, seed %d\n\n", options_.hours,
              options_.hostile ? " of hostile sound" : "", options_.seed);
  if (sent > 0) {
    std::printf("Tokens decoded / sent per full-band SNR band:\n\n| SNR dB |");
    for (const Receiver* r : running) std::printf(" %s |", r->name);
    std::printf("\n|---|");
    for (size_t i = 0; i < running.size(); ++i) std::printf("---|");
    std::printf("\n");
    for (int band = 0; band < kNumBands; ++band) {
      int band_sent = 0;
      for (const Receiver* r : running) band_sent += r->bands[band].sent;
      if (band_sent == 0) continue;
      std::printf("| %g to %g |", kBandEdges[band], kBandEdges[band + 1]);
      for (const Receiver* r : running) {
        const Tally& t = r->bands[band];
        if (t.sent == 0) {
          std::printf(" - |");
        } else {
          std::printf(" %d/%d (%.0f%%) |", t.decoded, t.sent, 100.0 * t.decoded / t.sent);
        }
      }
      std::printf("\n");
    }
    std::printf("\n");
  }
  std::printf("| decoder | sent | decoded | reported again | false | wake-ups |\n");
  std::printf("|---|---|---|---|---|---|\n");
  for (const Receiver* r : running) {
    std::printf("| %s | %d | %d | %d | %d | %s |\n", r->name, r->sent, r->decoded, r->repeats,
                r->false_tokens,
                r->decoder->kind() == audio_modem::AudioModemDecoder::kZintar
                    ? std::to_string(r->wake_ups).c_str()
                    : "-");
  }
  std::printf("\nheap in use between segments after warming up: %ld to %ld KiB\n", heap_low_kib_,
              heap_high_kib_);
  std::printf("%s simulated in %.0f s of wall time (%.1fx real time)\n", Clock(now_s()).c_str(),
              wall_s, now_s() / wall_s);
  std::printf(
      "RESULT hours=%g decoders=%zu tokens_sent=%d tokens_decoded=%d false_tokens=%d "
      "heap_start_kib=%ld heap_end_kib=%ld rss_peak_kib=%ld\n",
      options_.hours, running.size(), sent, decoded, false_tokens, heap_start_kib_, heap_end_kib_,
      PeakResidentKib());
}

// Empty when `list` names at least one decoder and only known ones.
std::string DecodersError(const std::string& list) {
  static const char* const kKnown[] = {"dsss48", "dsss44", "dtmf", "listening"};
  std::string rest = "," + list + ",";
  for (const char* name : kKnown) {
    const std::string item = std::string(",") + name + ",";
    for (size_t at; (at = rest.find(item)) != std::string::npos;) rest.erase(at, item.size() - 1);
  }
  if (rest.find_first_not_of(',') != std::string::npos) {
    return "unknown decoder in --decoders '" + list + "' (dsss48,dsss44,dtmf,listening)";
  }
  if (rest.size() == list.size() + 2) return "--decoders names no decoder";
  return "";
}

// Returns -1 to go on, or the exit status.
int ParseOptions(int argc, char** argv, Options* options) {
  vesk_tool::OptionParser parser;
  parser.AddDouble("hours", &options->hours, "simulated hours of microphone input")
      .Range(0.001, 1000);
  parser.AddInt("seed", &options->seed, "seed of every random choice").Range(0, 2147483647);
  parser.AddDouble("min-snr", &options->min_snr_db, "lowest full-band SNR of a token, dB")
      .Range(-60, 60)
      .Placeholder("DB");
  parser.AddDouble("max-snr", &options->max_snr_db, "highest full-band SNR of a token, dB")
      .Range(-60, 60)
      .Placeholder("DB");
  parser.AddFlag("hostile", &options->hostile,
                 "no tokens; noise, babble, music and silence at any level");
  parser
      .AddString("record", &options->record_path,
                 "write the microphone stream as headerless 16-bit PCM to this file")
      .Placeholder("FILE");
  parser
      .AddString("decoders", &options->decoders,
                 "the decoders that run, of dsss48,dsss44,dtmf,listening")
      .Placeholder("LIST");
  std::string dtmf_set;
  parser.AddString("dtmf-set", &dtmf_set, "DTMF receiver overrides: name=value,name=value")
      .Placeholder("LIST");
  parser.AddDouble("record-from", &options->record_from_s, "stream time where recording starts, s")
      .Range(0, 3.6e6);
  parser.AddDouble("record-seconds", &options->record_seconds, "seconds to record").Range(0, 3.6e6);
  std::string error;
  if (parser.Parse(std::vector<std::string>(argv + 1, argv + argc), &error) &&
      parser.help_requested()) {
    std::printf(
        "Four decoders with their default configurations fed a simulated day of 48 kHz "
        "microphone input.\n\n%s",
        parser.Help().c_str());
    return 0;
  }
  if (error.empty() && !parser.positional().empty()) {
    error = "unexpected argument '" + parser.positional()[0] + "'";
  }
  if (error.empty() && options->min_snr_db > options->max_snr_db) {
    error = "--min-snr must not exceed --max-snr";
  }
  if (error.empty()) error = DecodersError(options->decoders);
  if (error.empty() && !ApplyAssignments(dtmf_set, [&](const std::string& assignment) {
        return SetDtmfTuning(assignment, &options->dtmf);
      })) {
    return 2;  // ApplyAssignments said which.
  }
  if (!error.empty()) {
    std::fprintf(stderr, "%s: %s\n", argv[0], error.c_str());
    return 2;
  }
  return -1;
}

}  // namespace
}  // namespace vesk_bench

int main(int argc, char** argv) {
  vesk_bench::Options options;
  const int status = vesk_bench::ParseOptions(argc, argv, &options);
  if (status >= 0) return status;
  vesk_bench::Soak soak(options);
  if (!soak.recording_ok()) {
    std::fprintf(stderr, "%s: cannot write %s\n", argv[0], options.record_path.c_str());
    return 1;
  }
  soak.Run();
  soak.Report();
  return 0;
}
