// Robustness of the DTMF modem on the project's channel simulator, printed as
// tables: success rate (the sent token reported) and wrong tokens over many
// seeds, versus SNR, speed (clock skew or Doppler), with reverberation,
// speech babble, a 48 kHz microphone and a stereo one; and false tokens from
// long stretches of noise and babble. Columns are transmitter envelopes: the
// product envelope (25 ms attack, 25 ms release), the encoder's half-sine
// and the 10/10/20/10 ms ADSR with a half-level sustain.
//
//   dtmf_robustness [--seeds N] [--threads N] [--false-minutes M]
//                   [--tables snr,speed,reverb,babble,mic48,stereo,false,
//                             impairments or any of them (impairment_tables.h)]
//                   [--windows product,halfsine,adsr] [--set name=value,...]
//                   [--csv FILE] [--snrs LIST] [--speeds LIST] [--values LIST]
//                   [--first-seed N]
//                   [room options: --repeat, --snr, --speed, --reverb, ...]
//
// (--help lists every option.) The room options set the channel of every
// table, each table then sets the variable it sweeps; --snr is the SNR of
// the speed table. --set overrides a decoder tuning or receiver field (see
// dtmf_trial.h), for measuring the defaults themselves. Tokens are 5 raw
// bytes (no CRC) with the checksum symbol, so every wrong token the receiver
// lets through is counted.

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "tools/bench/bench_options.h"
#include "tools/bench/bench_util.h"
#include "tools/bench/dtmf_trial.h"
#include "tools/bench/impairment_tables.h"
#include "tools/bench/sweep_table.h"

namespace vesk_bench {
namespace {

struct Options {
  BenchOptions bench;
  std::string tables = "snr,speed,reverb,babble,mic48,stereo,false";
  std::string windows = "product,halfsine";
  double false_minutes = 10.0;
  DtmfTrial base;  // Tuning and receiver overrides.
};

Point RunPoint(const DtmfTrial& trial, const Options& options) {
  return Summarize(ForSeeds(options.bench.seeds, options.bench.threads, options.bench.first_seed,
                            [&](uint64_t seed) { return RunDtmfTrial(trial, seed); }));
}

// A trial in the room of the options, before the table sets its variable.
DtmfTrial BaseTrial(const Options& options) {
  DtmfTrial trial = options.base;
  trial.channel = options.bench.air.channel;
  trial.repeat = options.bench.air.repeat;
  return trial;
}

struct Window {
  const char* name;
  DtmfWindow window;
};

std::vector<Window> Windows(const Options& options) {
  std::vector<Window> windows;
  if (HasItem(options.windows, "product")) windows.push_back({"product", DtmfWindow::kConfigured});
  if (HasItem(options.windows, "halfsine")) windows.push_back({"half-sine", DtmfWindow::kHalfSine});
  if (HasItem(options.windows, "adsr")) windows.push_back({"ADSR 10/10/20/10", DtmfWindow::kAdsr});
  return windows;
}

// One table: a row per value of the swept variable, a column group per
// envelope.
template <typename Setup>
void Sweep(const char* table, const std::string& title, const char* variable,
           const std::vector<double>& values, const Options& options, CsvFile* csv, Setup setup) {
  const std::vector<Window> windows = Windows(options);
  SweepDescription sweep;
  sweep.table = table;
  sweep.title = title;
  sweep.variable = variable;
  for (const Window& w : windows) sweep.series.push_back(w.name);
  sweep.trials = options.bench.seeds;
  sweep.repeat = options.bench.air.repeat;
  RunSweep(
      sweep, values,
      [&](double value, size_t series) {
        DtmfTrial trial = BaseTrial(options);
        trial.window = windows[series].window;
        setup(value, &trial);
        return RunPoint(trial, options);
      },
      csv);
}

// The band of the DTMF tone set.
ModemBand Band(const DtmfTrial& trial) {
  const std::vector<float> tones = trial.config.tone_frequencies.empty()
                                       ? audio_vesknet::DtmfEncoderParams().tone_frequencies
                                       : trial.config.tone_frequencies;
  return {*std::min_element(tones.begin(), tones.end()),
          *std::max_element(tones.begin(), tones.end()), 1200.0};
}

void ImpairmentSweep(const ImpairmentTable& table, const Options& options, CsvFile* csv) {
  const std::vector<Window> windows = Windows(options);
  std::vector<std::string> names;
  for (const Window& w : windows) names.push_back(w.name);
  RunImpairmentTable(
      table, options.bench.values, names, options.bench.seeds, options.bench.air.repeat,
      [&](double value, size_t series) {
        DtmfTrial trial = BaseTrial(options);
        trial.window = windows[series].window;
        table.set(value, Band(trial), &trial.channel);
        return RunPoint(trial, options);
      },
      csv);
}

void FalseTokens(const Options& options) {
  std::printf("\n### False tokens in %g minutes without a transmitter (5 raw bytes)\n\n",
              options.false_minutes);
  std::printf("| input | checksum symbol 1 | checksum symbol 0 |\n|---|---|---|\n");
  for (int babble = 0; babble <= 1; ++babble) {
    std::printf("| %s |", babble ? "speech babble (3000 rms)" : "white noise (1000 rms)");
    for (int checksum = 1; checksum >= 0; --checksum) {
      DtmfTrial trial = BaseTrial(options);
      trial.config.append_checksum_symbol = checksum != 0;
      std::printf(" %d |", CountDtmfFalseTokens(trial, 60.0 * options.false_minutes, babble != 0,
                                                77 + babble));
      std::fflush(stdout);
    }
    std::printf("\n");
  }
}

}  // namespace
}  // namespace vesk_bench

int main(int argc, char** argv) {
  using vesk_bench::DtmfTrial;
  vesk_bench::Options options;
  options.bench.threads = static_cast<int>(std::max(1u, std::thread::hardware_concurrency()));
  options.bench.air.channel = vesk_bench::DefaultTrialChannel();
  options.bench.air.channel.snr_db = -10;  // Of the speed table.
  float false_minutes = static_cast<float>(options.false_minutes);
  std::string tuning;
  vesk_tool::OptionParser parser;
  parser.AddString("tables", &options.tables,
                   "snr,speed,reverb,babble,mic48,stereo,false; impairments (all of): " +
                       vesk_bench::ImpairmentTableNames());
  parser.AddString("windows", &options.windows, "product,halfsine,adsr");
  parser.AddFloat("false-minutes", &false_minutes, "minutes of noise and of babble")
      .Range(0.1, 1000);
  parser.AddString("set", &tuning, "tuning overrides: name=value,name=value");
  const int status = vesk_bench::ParseBenchArguments(
      argc, argv, "Robustness of the DTMF modem on the channel simulator.", &parser,
      &options.bench);
  if (status >= 0) return status;
  options.false_minutes = false_minutes;
  if (!vesk_bench::ApplyAssignments(tuning, [&](const std::string& assignment) {
        return vesk_bench::SetDtmfTuning(assignment, &options.base);
      })) {
    return 2;
  }
  vesk_bench::CsvFile csv(options.bench.csv);
  if (!csv.ok()) {
    std::fprintf(stderr, "%s: cannot write %s\n", argv[0], options.bench.csv.c_str());
    return 2;
  }
  const std::vector<double>& snrs = options.bench.snrs;
  const double speed_snr_db = options.bench.air.channel.snr_db;
  using vesk_bench::ValuesOr;
  const std::string& tables = options.tables;
  if (vesk_bench::HasItem(tables, "snr")) {
    std::vector<double> all;
    for (int s = -20; s <= 10; ++s) all.push_back(s);
    vesk_bench::Sweep("snr", "Success versus full-band SNR", "SNR dB", ValuesOr(snrs, all), options,
                      &csv, [](double v, DtmfTrial* t) { t->channel.snr_db = v; });
  }
  if (vesk_bench::HasItem(tables, "speed")) {
    vesk_bench::Sweep(
        "speed",
        "Success versus speed (clock skew or Doppler) at " + vesk_tool::FormatNumber(speed_snr_db) +
            " dB SNR",
        "speed", ValuesOr(options.bench.speeds, {0.997, 0.998, 0.999, 1.0, 1.001, 1.002, 1.003}),
        options, &csv, [speed_snr_db](double v, DtmfTrial* t) {
          t->channel.speed = v;
          t->channel.snr_db = speed_snr_db;
        });
  }
  if (vesk_bench::HasItem(tables, "reverb")) {
    vesk_bench::Sweep("reverb",
                      "Success with reverberation (RT60 " +
                          vesk_tool::FormatNumber(options.bench.air.channel.rt60_s) +
                          " s, D/R 3 dB)",
                      "SNR dB", ValuesOr(snrs, {10, 0, -5, -10, -12, -15, -17}), options, &csv,
                      [](double v, DtmfTrial* t) {
                        t->channel.snr_db = v;
                        t->channel.reverb = true;
                      });
  }
  if (vesk_bench::HasItem(tables, "babble")) {
    vesk_bench::Sweep("babble", "Success with speech babble (4 talkers), no other noise",
                      "signal-to-babble dB", {10, 6, 3, 0, -3, -6, -10}, options, &csv,
                      [](double v, DtmfTrial* t) {
                        t->channel.snr_db = INFINITY;
                        t->channel.babble_sir_db = v;
                      });
  }
  if (vesk_bench::HasItem(tables, "mic48")) {
    vesk_bench::Sweep("mic48", "Success with a 48 kHz microphone", "SNR dB",
                      ValuesOr(snrs, {10, 0, -5, -10, -15, -17}), options, &csv,
                      [](double v, DtmfTrial* t) {
                        t->channel.snr_db = v;
                        t->channel.mic_rate = 48000;
                      });
  }
  if (vesk_bench::HasItem(tables, "stereo")) {
    vesk_bench::Sweep(
        "stereo", "Success with a stereo 48 kHz microphone (independent noise per channel)",
        "SNR dB", ValuesOr(snrs, {10, -10, -15, -17}), options, &csv, [](double v, DtmfTrial* t) {
          t->channel.snr_db = v;
          t->channel.mic_rate = 48000;
          t->channel.channels = 2;
        });
  }
  if (vesk_bench::HasItem(tables, "false")) vesk_bench::FalseTokens(options);
  for (const vesk_bench::ImpairmentTable& table : vesk_bench::ImpairmentTables()) {
    if (vesk_bench::HasItem(tables, table.name.c_str()) ||
        vesk_bench::HasItem(tables, "impairments")) {
      vesk_bench::ImpairmentSweep(table, options, &csv);
    }
  }
  return 0;
}
