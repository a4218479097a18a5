// The zintar listening mode on the channel simulator, printed as tables:
// whether and how fast DSSS transmissions wake the detector (versus SNR and
// speed, for both coder configurations), how often noise and speech babble
// wake it, and the end-to-end token success in zintar mode next to the plain
// DSSS decoder on the same channels and seeds.
//
//   zintar_robustness [--seeds N] [--tables detect,speed,false,tokens] [--false-minutes M]

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "social/tandry/audio/audio_modem_encoder.h"
#include "social/tandry/audio/zintar_decoder.h"
#include "tools/bench/bench_util.h"
#include "tools/bench/dsss_trial.h"
#include "tools/channel/babble.h"
#include "tools/channel/channel_simulator.h"

namespace vesk_bench {
namespace {

constexpr int kMicRate = 48000;
constexpr int kChunk = 256;  // Input samples per detector call: 5.3 ms resolution.

struct Options {
  int seeds = 20;
  int threads = 2;
  std::string tables = "detect,speed,false,tokens";
  double false_minutes = 10.0;
};

// Seconds from the signal's start to the end of the first chunk whose score
// wakes the decoder; -1 if it never wakes.
double WakeDelay(const audio_modem::DsssWaveformConfig& waveform, double snr_db, double speed,
                 uint64_t seed) {
  audio_modem::DsssEncoderConfig config;
  config.waveform = waveform;
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(config);
  std::vector<float> token, played;
  encoder->Encode({1, 2, 3, 4, 5, 6}, &token, 2);
  encoder->MakeStartTransition(token, &played);
  for (int r = 0; r < 3; ++r) played.insert(played.end(), token.begin(), token.end());
  vesk_channel::ChannelParams channel = DefaultTrialChannel();
  channel.mic_rate = kMicRate;
  channel.snr_db = snr_db;
  channel.speed = speed;
  channel.seed = seed;
  const vesk_channel::ChannelOutput heard =
      vesk_channel::PlayThroughChannel(played, encoder->GetSampleRate(), channel);
  auto detector = audio_modem::ZintarDetectorHolder::Create(kMicRate, 1);
  std::vector<int16_t> chunk;
  for (size_t start = 0; start < heard.samples.size(); start += kChunk) {
    const size_t end = std::min(heard.samples.size(), start + kChunk);
    chunk.assign(heard.samples.begin() + start, heard.samples.begin() + end);
    if (audio_modem::ZintarDecoder::Wakes(
            detector->Process(chunk.data(), static_cast<int>(chunk.size())))) {
      return (static_cast<double>(end) - heard.signal_start_exact) / kMicRate;
    }
  }
  return -1;
}

void PrintWakeCell(const std::vector<double>& delays) {
  std::vector<double> woken;
  for (double d : delays) {
    if (d >= 0) woken.push_back(d);
  }
  std::sort(woken.begin(), woken.end());
  const double median = woken.empty() ? -1 : woken[woken.size() / 2];
  std::printf(" %2zu/%zu | %4.0f |", woken.size(), delays.size(), 1000 * median);
}

void WakeTable(const Options& options, const char* title, const char* variable,
               const std::vector<double>& values, bool sweep_speed) {
  std::printf("\n### %s (48 kHz microphone, token played 3 times)\n\n", title);
  std::printf("| %s | 48k/16/4 woken | median delay ms | 44.1k/15/3 woken | median delay ms |\n",
              variable);
  std::printf("|---|---|---|---|---|\n");
  for (double v : values) {
    std::printf("| %g |", v);
    for (const auto& waveform : {audio_modem::DsssWaveformConfig(), audio_modem::Waveform44100()}) {
      PrintWakeCell(ForSeeds(options.seeds, options.threads, [&](uint64_t seed) {
        return sweep_speed ? WakeDelay(waveform, 10, v, seed) : WakeDelay(waveform, v, 1.0, seed);
      }));
      std::fflush(stdout);
    }
    std::printf("\n");
  }
}

void FalseWakes(const Options& options) {
  std::printf("\n### Wake-ups without a transmitter, %g minutes at 48 kHz\n\n",
              options.false_minutes);
  std::printf("| input | wake-ups | highest block score (threshold 25) |\n|---|---|---|\n");
  for (int babble = 0; babble <= 1; ++babble) {
    auto detector = audio_modem::ZintarDetectorHolder::Create(kMicRate, 1);
    int wakes = 0;
    float highest = 0;
    for (int piece = 0; piece < options.false_minutes * 2; ++piece) {
      const uint64_t seed = vesk_channel::DeriveSeed(1234 + babble, piece);
      std::vector<int16_t> pcm;
      if (babble) {
        for (float s : vesk_channel::MakeBabble(30.0, kMicRate, 4, seed)) {
          pcm.push_back(static_cast<int16_t>(std::max(-32768.0f, std::min(32767.0f, 3000 * s))));
        }
      } else {
        pcm = vesk_channel::MakeNoise(30.0, kMicRate, 3000.0, seed);
      }
      for (size_t start = 0; start < pcm.size(); start += 4096) {
        const int n = static_cast<int>(std::min<size_t>(4096, pcm.size() - start));
        const float score = detector->Process(pcm.data() + start, n);
        highest = std::max(highest, score);
        wakes += audio_modem::ZintarDecoder::Wakes(score);
      }
    }
    std::printf("| %s | %d | %.1f |\n", babble ? "speech babble" : "white noise", wakes, highest);
  }
}

void TokenTable(const Options& options) {
  std::printf(
      "\n### Token success, zintar mode versus the plain DSSS decoder "
      "(48k/16/4, 48 kHz microphone, token played 3 times, %d seeds)\n\n",
      options.seeds);
  std::printf("| SNR dB | zintar mode | plain DSSS |\n|---|---|---|\n");
  for (double snr : {10.0, 0.0, -5.0, -10.0, -13.0, -15.0}) {
    std::printf("| %g |", snr);
    for (bool zintar : {true, false}) {
      DsssTrial trial;
      trial.channel = DefaultTrialChannel();
      trial.channel.mic_rate = kMicRate;
      trial.channel.snr_db = snr;
      trial.zintar = zintar;
      const Point point = Summarize(ForSeeds(options.seeds, options.threads, [&](uint64_t seed) {
        return RunDsssTrial(trial, seed);
      }));
      std::printf(" %d/%d |", point.successes, options.seeds);
      std::fflush(stdout);
    }
    std::printf("\n");
  }
}

}  // namespace
}  // namespace vesk_bench

int main(int argc, char** argv) {
  vesk_bench::Options options;
  options.threads = static_cast<int>(std::max(1u, std::thread::hardware_concurrency()));
  float false_minutes = static_cast<float>(options.false_minutes);
  vesk_tool::OptionParser parser;
  parser.AddInt("seeds", &options.seeds, "seeds per table cell");
  parser.AddInt("threads", &options.threads, "trials run at once");
  parser.AddString("tables", &options.tables, "detect,speed,false,tokens");
  parser.AddFloat("false-minutes", &false_minutes, "minutes of noise and of babble");
  const int status = vesk_bench::ParseArguments(
      argc, argv, "The zintar listening mode on the channel simulator.", &parser);
  if (status >= 0) return status;
  options.seeds = std::max(1, options.seeds);
  options.threads = std::max(1, options.threads);
  options.false_minutes = false_minutes;
  if (vesk_bench::HasItem(options.tables, "detect")) {
    std::vector<double> snrs;
    for (int s = -20; s <= 10; s += 2) snrs.push_back(s);
    vesk_bench::WakeTable(options, "Wake-ups versus full-band SNR", "SNR dB", snrs, false);
  }
  if (vesk_bench::HasItem(options.tables, "speed")) {
    vesk_bench::WakeTable(options, "Wake-ups versus speed at 10 dB SNR", "speed",
                          {0.997, 0.998, 0.999, 0.9995, 1.0, 1.0005, 1.001, 1.002, 1.003}, true);
  }
  if (vesk_bench::HasItem(options.tables, "false")) vesk_bench::FalseWakes(options);
  if (vesk_bench::HasItem(options.tables, "tokens")) vesk_bench::TokenTable(options);
  return 0;
}
