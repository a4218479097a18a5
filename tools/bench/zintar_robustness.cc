// The zintar listening mode on the channel simulator, printed as tables:
// whether and how fast DSSS transmissions wake the detector (versus SNR and
// speed, for both coder configurations), how often noise and speech babble
// wake it, and the end-to-end token success in zintar mode next to the plain
// DSSS decoder on the same channels and seeds.
//
//   zintar_robustness [--seeds N] [--tables detect,speed,false,tokens]
//                     [--false-minutes M] [--csv FILE] [--snrs LIST] [--speeds LIST]
//                     [room options: --repeat, --snr, --mic-rate, ...]
//
// (--help lists every option.) The room options set the channel of every
// table (a 48 kHz microphone by default), each table then sets the variable
// it sweeps; --snr is the SNR of the speed table.

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "social/tandry/audio/audio_modem_encoder.h"
#include "social/tandry/audio/zintar_decoder.h"
#include "tools/bench/bench_options.h"
#include "tools/bench/bench_util.h"
#include "tools/bench/dsss_trial.h"
#include "tools/bench/sweep_table.h"
#include "tools/channel/babble.h"
#include "tools/channel/channel_simulator.h"
#include "tools/channel/noise.h"
#include "tools/channel/random.h"

namespace vesk_bench {
namespace {

constexpr int kChunk = 256;  // Input samples per detector call: 5.3 ms resolution at 48 kHz.

struct Options {
  BenchOptions bench;
  std::string tables = "detect,speed,false,tokens";
  double false_minutes = 10.0;
};

// Seconds from the signal's start to the end of the first chunk whose score
// wakes the decoder; -1 if it never wakes.
double WakeDelay(const audio_modem::DsssWaveformConfig& waveform, vesk_tool::OverTheAir air,
                 uint64_t seed) {
  audio_modem::DsssEncoderConfig config;
  config.waveform = waveform;
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(config);
  air.channel.seed = seed;
  const vesk_channel::ChannelOutput heard =
      vesk_tool::PlayOverTheAir(*encoder, {1, 2, 3, 4, 5, 6}, 2, air);
  auto detector = audio_modem::ZintarDetectorHolder::Create(heard.rate, heard.channels);
  std::vector<int16_t> chunk;
  const size_t chunk_samples = static_cast<size_t>(kChunk * heard.channels);
  for (size_t start = 0; start < heard.samples.size(); start += chunk_samples) {
    const size_t end = std::min(heard.samples.size(), start + chunk_samples);
    chunk.assign(heard.samples.begin() + start, heard.samples.begin() + end);
    if (audio_modem::ZintarDecoder::Wakes(
            detector->Process(chunk.data(), static_cast<int>(chunk.size())))) {
      return (static_cast<double>(end / heard.channels) - heard.signal_start_exact) / heard.rate;
    }
  }
  return -1;
}

void WakeTable(const Options& options, const char* table, const std::string& title,
               const char* variable, const std::vector<double>& values, bool sweep_speed,
               CsvFile* csv) {
  const audio_modem::DsssWaveformConfig waveforms[] = {audio_modem::DsssWaveformConfig(),
                                                       audio_modem::Waveform44100()};
  SweepDescription sweep;
  sweep.table = table;
  sweep.title = title;
  sweep.variable = variable;
  sweep.series = {"48k/16/4", "44.1k/15/3"};
  sweep.trials = options.bench.seeds;
  sweep.repeat = options.bench.air.repeat;
  sweep.count_wrong = false;
  sweep.success_label = "woken";
  RunSweep(
      sweep, values,
      [&](double value, size_t series) {
        vesk_tool::OverTheAir air = options.bench.air;
        (sweep_speed ? air.channel.speed : air.channel.snr_db) = value;
        Point point;
        for (const double delay :
             ForSeeds(options.bench.seeds, options.bench.threads, options.bench.first_seed,
                      [&](uint64_t seed) { return WakeDelay(waveforms[series], air, seed); })) {
          if (delay < 0) continue;
          ++point.successes;
          point.delays.push_back(delay);
        }
        return point;
      },
      csv);
}

void FalseWakes(const Options& options) {
  const int rate = options.bench.air.channel.mic_rate;
  std::printf("\n### Wake-ups without a transmitter, %g minutes at %d Hz\n\n",
              options.false_minutes, rate);
  std::printf("| input | wake-ups | highest block score (threshold 25) |\n|---|---|---|\n");
  for (int babble = 0; babble <= 1; ++babble) {
    auto detector = audio_modem::ZintarDetectorHolder::Create(rate, 1);
    int wakes = 0;
    float highest = 0;
    for (int piece = 0; piece < options.false_minutes * 2; ++piece) {
      const uint64_t seed = vesk_channel::DeriveSeed(1234 + babble, piece);
      std::vector<int16_t> pcm;
      if (babble) {
        for (float s : vesk_channel::MakeBabble(30.0, rate, 4, seed)) {
          pcm.push_back(static_cast<int16_t>(std::max(-32768.0f, std::min(32767.0f, 3000 * s))));
        }
      } else {
        pcm = vesk_channel::MakeNoise(30.0, rate, 3000.0, seed);
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

void TokenTable(const Options& options, CsvFile* csv) {
  SweepDescription sweep;
  sweep.table = "tokens";
  sweep.title = "Token success, zintar mode versus the plain DSSS decoder (48k/16/4)";
  sweep.variable = "SNR dB";
  sweep.series = {"zintar mode", "plain DSSS"};
  sweep.trials = options.bench.seeds;
  sweep.repeat = options.bench.air.repeat;
  RunSweep(
      sweep, ValuesOr(options.bench.snrs, {10.0, 0.0, -5.0, -10.0, -13.0, -15.0}),
      [&](double snr, size_t series) {
        DsssTrial trial;
        trial.channel = options.bench.air.channel;
        trial.repeat = options.bench.air.repeat;
        trial.channel.snr_db = snr;
        trial.zintar = series == 0;
        return Summarize(ForSeeds(options.bench.seeds, options.bench.threads,
                                  options.bench.first_seed,
                                  [&](uint64_t seed) { return RunDsssTrial(trial, seed); }));
      },
      csv);
}

}  // namespace
}  // namespace vesk_bench

int main(int argc, char** argv) {
  vesk_bench::Options options;
  options.bench.threads = static_cast<int>(std::max(1u, std::thread::hardware_concurrency()));
  options.bench.air.channel = vesk_bench::DefaultTrialChannel();
  options.bench.air.channel.mic_rate = 48000;
  options.bench.air.channel.snr_db = 10;  // Of the speed table.
  float false_minutes = static_cast<float>(options.false_minutes);
  vesk_tool::OptionParser parser;
  parser.AddString("tables", &options.tables, "detect,speed,false,tokens");
  parser.AddFloat("false-minutes", &false_minutes, "minutes of noise and of babble")
      .Range(0.1, 1000);
  const int status = vesk_bench::ParseBenchArguments(
      argc, argv, "The zintar listening mode on the channel simulator.", &parser, &options.bench);
  if (status >= 0) return status;
  options.false_minutes = false_minutes;
  if (audio_modem::ZintarDetectorHolder::Create(options.bench.air.channel.mic_rate, 1) == nullptr) {
    std::fprintf(stderr, "%s: the listening mode needs --mic-rate 36994 or more\n", argv[0]);
    return 2;
  }
  vesk_bench::CsvFile csv(options.bench.csv);
  if (!csv.ok()) {
    std::fprintf(stderr, "%s: cannot write %s\n", argv[0], options.bench.csv.c_str());
    return 2;
  }
  using vesk_bench::ValuesOr;
  const double speed_snr_db = options.bench.air.channel.snr_db;
  if (vesk_bench::HasItem(options.tables, "detect")) {
    std::vector<double> snrs;
    for (int s = -20; s <= 10; s += 2) snrs.push_back(s);
    vesk_bench::WakeTable(options, "detect", "Wake-ups versus full-band SNR", "SNR dB",
                          ValuesOr(options.bench.snrs, snrs), false, &csv);
  }
  if (vesk_bench::HasItem(options.tables, "speed")) {
    vesk_bench::WakeTable(
        options, "speed",
        "Wake-ups versus speed at " + vesk_tool::FormatNumber(speed_snr_db) + " dB SNR", "speed",
        ValuesOr(options.bench.speeds,
                 {0.997, 0.998, 0.999, 0.9995, 1.0, 1.0005, 1.001, 1.002, 1.003}),
        true, &csv);
  }
  if (vesk_bench::HasItem(options.tables, "false")) vesk_bench::FalseWakes(options);
  if (vesk_bench::HasItem(options.tables, "tokens")) vesk_bench::TokenTable(options, &csv);
  return 0;
}
