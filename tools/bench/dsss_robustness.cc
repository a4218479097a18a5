// Robustness of the DSSS modem on the project's channel simulator, printed as
// tables: success rate (the sent token reported) and wrong tokens over many
// seeds, versus SNR, speed (clock skew or Doppler), with reverberation and a
// 48 kHz microphone; and false tokens from long stretches of noise and
// babble. Both coder configurations in use are measured.
//
//   dsss_robustness [--seeds N] [--threads N] [--coder 44k|48k|both]
//       [--tables snr,speed,reverb,mic48,unchecked,false,tune,host,
//                 impairments or any of them (see impairment_tables.h)]
//       [--set name=value,...] [--csv FILE] [--snrs LIST] [--speeds LIST]
//       [--values LIST] [--first-seed N]
//       [room options: --repeat, --snr, --speed, --reverb, --mic-rate, ...]
//
// (--help lists every option.) The room options set the channel of every
// table, each table then sets the variable it sweeps; --snr is the SNR of
// the speed table. --set overrides a decoder tuning field (see
// dsss_trial.cc), for measuring the defaults themselves.

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "tools/bench/bench_options.h"
#include "tools/bench/bench_util.h"
#include "tools/bench/dsss_trial.h"
#include "tools/bench/impairment_tables.h"
#include "tools/bench/sweep_table.h"

namespace vesk_bench {
namespace {

struct Options {
  BenchOptions bench;
  std::string tables = "snr,speed,reverb,mic48,unchecked,false";
  std::string coder = "both";
  double false_minutes = 10.0;
  std::string label = "defaults";  // Row label of the tune table.
  audio_vesknet::VesknetDecoderParams tuning;
  ExcisionTuning excision;
};

Point RunPoint(const DsssTrial& trial, const Options& options) {
  return Summarize(ForSeeds(options.bench.seeds, options.bench.threads, options.bench.first_seed,
                            [&](uint64_t seed) { return RunDsssTrial(trial, seed); }));
}

// A trial in the room of the options, before the table sets its variable.
DsssTrial BaseTrial(const Options& options, const audio_modem::DsssWaveformConfig& waveform) {
  DsssTrial trial;
  trial.waveform = waveform;
  trial.tuning = options.tuning;
  trial.excision = options.excision;
  trial.channel = options.bench.air.channel;
  trial.repeat = options.bench.air.repeat;
  return trial;
}

struct Coder {
  const char* name;
  audio_modem::DsssWaveformConfig waveform;
};

std::vector<Coder> Coders(const Options& options) {
  std::vector<Coder> coders;
  if (options.coder != "44k") coders.push_back({"48k/16/4", audio_modem::DsssWaveformConfig()});
  if (options.coder != "48k") coders.push_back({"44.1k/15/3", audio_modem::Waveform44100()});
  return coders;
}

// One table: a row per value of the swept variable, a column group per coder.
template <typename Setup>
void Sweep(const char* table, const char* title, const char* variable,
           const std::vector<double>& values, const Options& options, CsvFile* csv, Setup setup) {
  const std::vector<Coder> coders = Coders(options);
  SweepDescription sweep;
  sweep.table = table;
  sweep.title = title;
  sweep.variable = variable;
  for (const Coder& c : coders) sweep.series.push_back(c.name);
  sweep.trials = options.bench.seeds;
  sweep.repeat = options.bench.air.repeat;
  RunSweep(
      sweep, values,
      [&](double value, size_t series) {
        DsssTrial trial = BaseTrial(options, coders[series].waveform);
        setup(value, &trial);
        return RunPoint(trial, options);
      },
      csv);
}

// The DSSS band of a coder: the carrier plus and minus the chip rate (the
// spread spectrum's main lobe).
ModemBand Band(const audio_modem::DsssWaveformConfig& waveform) {
  const double chip_rate = waveform.sample_rate / waveform.upsampling_factor;
  return {waveform.carrier_frequency - chip_rate, waveform.carrier_frequency + chip_rate,
          waveform.carrier_frequency + 100.0};
}

void ImpairmentSweep(const ImpairmentTable& table, const Options& options, CsvFile* csv) {
  const std::vector<Coder> coders = Coders(options);
  std::vector<std::string> names;
  for (const Coder& c : coders) names.push_back(c.name);
  RunImpairmentTable(
      table, options.bench.values, names, options.bench.seeds, options.bench.air.repeat,
      [&](double value, size_t series) {
        DsssTrial trial = BaseTrial(options, coders[series].waveform);
        table.set(value, Band(coders[series].waveform), &trial.channel);
        return RunPoint(trial, options);
      },
      csv);
}

void FalseTokens(const Options& options) {
  const std::vector<Coder> coders = Coders(options);
  std::printf("\n### False tokens in %g minutes without a transmitter\n\n", options.false_minutes);
  std::printf("| input | check |");
  for (const Coder& c : coders) std::printf(" %s |", c.name);
  std::printf("\n|---|---|");
  for (size_t i = 0; i < coders.size(); ++i) std::printf("---|");
  std::printf("\n");
  for (int babble = 0; babble <= 1; ++babble) {
    for (int crc = 1; crc >= 0; --crc) {
      std::printf("| %s | %s |", babble ? "speech babble" : "white noise",
                  crc ? "CRC-16" : "none (8 raw bytes)");
      for (const Coder& c : coders) {
        DsssTrial trial = BaseTrial(options, c.waveform);
        trial.crc = crc != 0;
        std::printf(" %d |", CountFalseTokens(trial, 60.0 * options.false_minutes, babble != 0,
                                              77 + babble));
        std::fflush(stdout);
      }
      std::printf("\n");
    }
  }
}

// One summary row for comparing tunings: successes (of 2 x seeds, both
// coders) at the points where the tuning matters, and false tokens from
// unchecked noise.
void TuneRow(const Options& options, const std::string& label) {
  struct Case {
    const char* name;
    double snr;
    double speed;
    bool reverb;
  };
  const Case cases[] = {{"-19dB", -19, 1.0, false},       {"-18dB", -18, 1.0, false},
                        {"-17dB", -17, 1.0, false},       {"-16dB", -16, 1.0, false},
                        {"0.997@-10", -10, 0.997, false}, {"1.003@-10", -10, 1.003, false},
                        {"rev@-15", -15, 1.0, true}};
  static bool header = false;
  if (!header) {
    std::printf("| tuning |");
    for (const Case& c : cases) std::printf(" %s |", c.name);
    std::printf(" wrong | false (3 min, no CRC) |\n|---|");
    for (size_t i = 0; i < sizeof(cases) / sizeof(cases[0]) + 2; ++i) std::printf("---|");
    std::printf("\n");
    header = true;
  }
  std::printf("| %s |", label.c_str());
  int wrong = 0;
  for (const Case& c : cases) {
    int successes = 0;
    for (const Coder& coder : Coders(options)) {
      DsssTrial trial = BaseTrial(options, coder.waveform);
      trial.channel.snr_db = c.snr;
      trial.channel.speed = c.speed;
      trial.channel.reverb = c.reverb;
      const Point p = RunPoint(trial, options);
      successes += p.successes;
      wrong += p.wrong;
    }
    std::printf(" %d |", successes);
    std::fflush(stdout);
  }
  int false_tokens = 0;
  for (const Coder& coder : Coders(options)) {
    DsssTrial trial = BaseTrial(options, coder.waveform);
    trial.crc = false;
    false_tokens += CountFalseTokens(trial, 180.0, false, 99);
  }
  std::printf(" %d | %d |\n", wrong, false_tokens);
}

// The settings a host passes: the broadcaster detection's threshold and
// window (detected within the transmission at low SNR, versus the share of
// positive answers in noise), and the history length in tokens.
void HostTables(const Options& options) {
  std::printf(
      "\n### DetectBroadcaster: transmissions detected (of %d, both coders) and the "
      "share of positive answers in 3 minutes of noise\n\n",
      2 * options.bench.seeds);
  std::printf(
      "| window s | threshold | detected at -15 dB | at -10 dB | median delay at -10 dB s "
      "| noise answers positive |\n|---|---|---|---|---|---|\n");
  for (float window : {0.5f, 0.75f, 1.0f}) {
    for (float threshold : {3.0f, 4.0f, 5.0f, 6.0f, 8.0f}) {
      std::printf("| %g | %g |", window, threshold);
      std::vector<double> delays;
      for (double snr : {-15.0, -10.0}) {
        int detected = 0;
        for (const Coder& coder : Coders(options)) {
          DsssTrial trial = BaseTrial(options, coder.waveform);
          trial.tuning.acquisition_window_duration = window;
          trial.tuning.broadcaster_threshold = threshold;
          trial.channel.snr_db = snr;
          for (int seed = 1; seed <= options.bench.seeds; ++seed) {
            const TrialResult r = RunDsssTrial(trial, seed);
            // Detected while the transmission lasts (about 2.2 s).
            if (r.heard_delay_s >= 0 && r.heard_delay_s < 2.5) {
              ++detected;
              if (snr == -10.0) delays.push_back(r.heard_delay_s);
            }
          }
        }
        std::printf(" %d |", detected);
      }
      double noise_share = 0, share = 0;
      for (const Coder& coder : Coders(options)) {
        DsssTrial trial = BaseTrial(options, coder.waveform);
        trial.tuning.acquisition_window_duration = window;
        trial.tuning.broadcaster_threshold = threshold;
        CountFalseTokens(trial, 180.0, false, 31, &share);
        noise_share += share / Coders(options).size();
      }
      std::printf(" %.2f | %.4f |\n", Median(delays), noise_share);
      std::fflush(stdout);
    }
  }
  std::printf("\n### History length (successes of %d, both coders)\n\n| buffer tokens |",
              2 * options.bench.seeds);
  const double snrs[] = {-19, -18, -17, -15};
  for (double snr : snrs) std::printf(" %g dB |", snr);
  std::printf("\n|---|---|---|---|---|\n");
  for (float tokens : {2.0f, 3.0f, 4.0f, 6.0f}) {
    std::printf("| %g |", tokens);
    for (double snr : snrs) {
      int successes = 0;
      for (const Coder& coder : Coders(options)) {
        DsssTrial trial = BaseTrial(options, coder.waveform);
        trial.channel.snr_db = snr;
        trial.buffer_length_tokens = tokens;
        successes += RunPoint(trial, options).successes;
      }
      std::printf(" %d |", successes);
      std::fflush(stdout);
    }
    std::printf("\n");
  }
}

}  // namespace
}  // namespace vesk_bench

int main(int argc, char** argv) {
  using vesk_bench::DsssTrial;
  vesk_bench::Options options;
  options.bench.threads = static_cast<int>(std::max(1u, std::thread::hardware_concurrency()));
  options.bench.air.channel = vesk_bench::DefaultTrialChannel();
  options.bench.air.channel.snr_db = 10;  // Of the speed table.
  float false_minutes = static_cast<float>(options.false_minutes);
  std::string tuning;
  vesk_tool::OptionParser parser;
  parser.AddString("tables", &options.tables,
                   "snr,speed,reverb,mic48,unchecked,false,tune,host; impairments (all of): " +
                       vesk_bench::ImpairmentTableNames());
  parser.AddString("coder", &options.coder, "the coders measured").Choices({"44k", "48k", "both"});
  parser.AddFloat("false-minutes", &false_minutes, "minutes of noise and of babble")
      .Range(0.1, 1000);
  parser.AddString("set", &tuning, "decoder tuning overrides: name=value,name=value");
  const int status = vesk_bench::ParseBenchArguments(
      argc, argv, "Robustness of the DSSS modem on the channel simulator.", &parser,
      &options.bench);
  if (status >= 0) return status;
  options.false_minutes = false_minutes;
  if (!vesk_bench::ApplyAssignments(tuning, [&](const std::string& assignment) {
        return vesk_bench::SetTuning(assignment, &options.tuning, &options.excision);
      })) {
    return 2;
  }
  if (!tuning.empty()) options.label = tuning;
  vesk_bench::CsvFile csv(options.bench.csv);
  if (!csv.ok()) {
    std::fprintf(stderr, "%s: cannot write %s\n", argv[0], options.bench.csv.c_str());
    return 2;
  }
  const std::vector<double>& snrs = options.bench.snrs;
  const double speed_snr_db = options.bench.air.channel.snr_db;
  using vesk_bench::ValuesOr;
  if (vesk_bench::HasItem(options.tables, "snr")) {
    std::vector<double> all;
    for (int s = -20; s <= 10; ++s) all.push_back(s);
    vesk_bench::Sweep("snr", "Success versus full-band SNR", "SNR dB", ValuesOr(snrs, all), options,
                      &csv, [](double v, DsssTrial* t) { t->channel.snr_db = v; });
  }
  if (vesk_bench::HasItem(options.tables, "speed")) {
    const std::string title = "Success versus speed (clock skew or Doppler) at " +
                              vesk_tool::FormatNumber(speed_snr_db) + " dB SNR";
    vesk_bench::Sweep(
        "speed", title.c_str(), "speed",
        ValuesOr(options.bench.speeds, {0.997, 0.998, 0.999, 1.0, 1.001, 1.002, 1.003}), options,
        &csv, [speed_snr_db](double v, DsssTrial* t) {
          t->channel.speed = v;
          t->channel.snr_db = speed_snr_db;
        });
  }
  if (vesk_bench::HasItem(options.tables, "reverb")) {
    const std::string title = "Success with reverberation (RT60 " +
                              vesk_tool::FormatNumber(options.bench.air.channel.rt60_s) +
                              " s, D/R 3 dB)";
    vesk_bench::Sweep("reverb", title.c_str(), "SNR dB", ValuesOr(snrs, {10, 0, -5, -10, -12, -15}),
                      options, &csv, [](double v, DsssTrial* t) {
                        t->channel.snr_db = v;
                        t->channel.reverb = true;
                      });
  }
  if (vesk_bench::HasItem(options.tables, "mic48")) {
    vesk_bench::Sweep("mic48", "Success with a 48 kHz microphone", "SNR dB",
                      ValuesOr(snrs, {10, 0, -5, -10, -15, -17}), options, &csv,
                      [](double v, DsssTrial* t) {
                        t->channel.snr_db = v;
                        t->channel.mic_rate = 48000;
                      });
  }
  if (vesk_bench::HasItem(options.tables, "unchecked")) {
    // What the CRC buys: without a check a token heard only in part, or
    // under noise, also comes out wrong.
    vesk_bench::Sweep("unchecked", "Without CRC: 8 unchecked bytes, one token per call", "SNR dB",
                      ValuesOr(snrs, {10, 0, -10, -15}), options, &csv, [](double v, DsssTrial* t) {
                        t->channel.snr_db = v;
                        t->crc = false;
                        t->tuning.max_candidates_to_return = 1;
                      });
    vesk_bench::Sweep("unchecked_checksum", "Without CRC, with the checksum symbol", "SNR dB",
                      ValuesOr(snrs, {10, 0, -10, -15}), options, &csv, [](double v, DsssTrial* t) {
                        t->channel.snr_db = v;
                        t->crc = false;
                        t->checksum_symbol = true;
                        t->tuning.max_candidates_to_return = 1;
                      });
  }
  if (vesk_bench::HasItem(options.tables, "false")) vesk_bench::FalseTokens(options);
  if (vesk_bench::HasItem(options.tables, "tune")) vesk_bench::TuneRow(options, options.label);
  if (vesk_bench::HasItem(options.tables, "host")) vesk_bench::HostTables(options);
  for (const vesk_bench::ImpairmentTable& table : vesk_bench::ImpairmentTables()) {
    if (vesk_bench::HasItem(options.tables, table.name.c_str()) ||
        vesk_bench::HasItem(options.tables, "impairments")) {
      vesk_bench::ImpairmentSweep(table, options, &csv);
    }
  }
  return 0;
}
