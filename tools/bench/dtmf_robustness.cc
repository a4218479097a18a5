// Robustness of the DTMF modem on the project's channel simulator, printed as
// tables: success rate (the sent token reported) and wrong tokens over many
// seeds, versus SNR, speed (clock skew or Doppler), with reverberation,
// speech babble, a 48 kHz microphone and a stereo one; and false tokens from
// long stretches of noise and babble. Columns are transmitter envelopes: the
// product envelope (25 ms attack, 25 ms release), the encoder's half-sine
// and the 10/10/20/10 ms ADSR with a half-level sustain.
//
//   dtmf_robustness [--seeds N] [--threads N] [--repeat N] [--false-minutes M]
//                   [--speed-snr DB]
//                   [--tables snr,speed,reverb,babble,mic48,stereo,false]
//                   [--windows product,halfsine,adsr] [--set name=value,...]
//
// --set overrides a decoder tuning or receiver field (see dtmf_trial.h), for
// measuring the defaults themselves. Tokens are 5 raw bytes (no CRC) with the
// checksum symbol, so every wrong token the receiver lets through is counted.

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "tools/bench/bench_util.h"
#include "tools/bench/dtmf_trial.h"

namespace vesk_bench {
namespace {

struct Options {
  int seeds = 20;
  int threads = 2;
  int repeat = 3;
  std::string tables = "snr,speed,reverb,babble,mic48,stereo,false";
  std::string windows = "product,halfsine";
  double false_minutes = 10.0;
  double speed_snr_db = -10.0;  // SNR of the speed table.
  DtmfTrial base;               // Tuning and receiver overrides.
};

Point RunPoint(const DtmfTrial& trial, const Options& options) {
  return Summarize(ForSeeds(options.seeds, options.threads,
                            [&](uint64_t seed) { return RunDtmfTrial(trial, seed); }));
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

// One table: a row per value of the swept variable, three columns per
// envelope.
template <typename Setup>
void Sweep(const char* title, const char* variable, const std::vector<double>& values,
           const Options& options, Setup setup) {
  const std::vector<Window> windows = Windows(options);
  std::printf("\n### %s (%d seeds per point)\n\n| %s |", title, options.seeds, variable);
  for (const Window& w : windows) std::printf(" %s success | wrong | median delay s |", w.name);
  std::printf("\n|---|");
  for (size_t i = 0; i < windows.size(); ++i) std::printf("---|---|---|");
  std::printf("\n");
  for (const double value : values) {
    std::printf("| %g |", value);
    for (const Window& w : windows) {
      DtmfTrial trial = options.base;
      trial.window = w.window;
      trial.repeat = options.repeat;
      trial.channel = DefaultTrialChannel();
      setup(value, &trial);
      const Point p = RunPoint(trial, options);
      std::printf(" %5.1f%% | %d | %.2f |", 100.0 * p.successes / options.seeds, p.wrong,
                  Median(p.delays));
      std::fflush(stdout);
    }
    std::printf("\n");
  }
}

void FalseTokens(const Options& options) {
  std::printf("\n### False tokens in %g minutes without a transmitter (5 raw bytes)\n\n",
              options.false_minutes);
  std::printf("| input | checksum symbol 1 | checksum symbol 0 |\n|---|---|---|\n");
  for (int babble = 0; babble <= 1; ++babble) {
    std::printf("| %s |", babble ? "speech babble (3000 rms)" : "white noise (1000 rms)");
    for (int checksum = 1; checksum >= 0; --checksum) {
      DtmfTrial trial = options.base;
      trial.channel = DefaultTrialChannel();
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
  vesk_bench::Options options;
  options.threads = static_cast<int>(std::max(1u, std::thread::hardware_concurrency()));
  float false_minutes = static_cast<float>(options.false_minutes);
  float speed_snr_db = static_cast<float>(options.speed_snr_db);
  std::string tuning;
  vesk_tool::OptionParser parser;
  parser.AddInt("seeds", &options.seeds, "seeds per table cell");
  parser.AddInt("threads", &options.threads, "trials run at once");
  parser.AddInt("repeat", &options.repeat, "token repetitions played");
  parser.AddString("tables", &options.tables, "snr,speed,reverb,babble,mic48,stereo,false");
  parser.AddString("windows", &options.windows, "product,halfsine,adsr");
  parser.AddFloat("false-minutes", &false_minutes, "minutes of noise and of babble");
  parser.AddFloat("speed-snr", &speed_snr_db, "SNR of the speed table, dB");
  parser.AddString("set", &tuning, "tuning overrides: name=value,name=value");
  const int status = vesk_bench::ParseArguments(
      argc, argv, "Robustness of the DTMF modem on the channel simulator.", &parser);
  if (status >= 0) return status;
  options.seeds = std::max(1, options.seeds);
  options.threads = std::max(1, options.threads);
  options.repeat = std::max(1, options.repeat);
  options.false_minutes = false_minutes;
  options.speed_snr_db = speed_snr_db;
  if (!vesk_bench::ApplyAssignments(tuning, [&](const std::string& assignment) {
        return vesk_bench::SetDtmfTuning(assignment, &options.base);
      })) {
    return 2;
  }
  using vesk_bench::DtmfTrial;
  const std::string& tables = options.tables;
  if (vesk_bench::HasItem(tables, "snr")) {
    std::vector<double> snrs;
    for (int s = -20; s <= 10; ++s) snrs.push_back(s);
    vesk_bench::Sweep("Success versus full-band SNR, 44.1 kHz mic", "SNR dB", snrs, options,
                      [](double v, DtmfTrial* t) { t->channel.snr_db = v; });
  }
  if (vesk_bench::HasItem(tables, "speed")) {
    const std::string title = "Success versus speed (clock skew or Doppler) at " +
                              std::to_string(static_cast<int>(options.speed_snr_db)) + " dB SNR";
    const double snr_db = options.speed_snr_db;
    vesk_bench::Sweep(title.c_str(), "speed", {0.997, 0.998, 0.999, 1.0, 1.001, 1.002, 1.003},
                      options, [snr_db](double v, DtmfTrial* t) {
                        t->channel.speed = v;
                        t->channel.snr_db = snr_db;
                      });
  }
  if (vesk_bench::HasItem(tables, "reverb")) {
    vesk_bench::Sweep("Success with reverberation (RT60 0.3 s, D/R 3 dB)", "SNR dB",
                      {10, 0, -5, -10, -12, -15, -17}, options, [](double v, DtmfTrial* t) {
                        t->channel.snr_db = v;
                        t->channel.reverb = true;
                      });
  }
  if (vesk_bench::HasItem(tables, "babble")) {
    vesk_bench::Sweep("Success with speech babble (4 talkers), no other noise",
                      "signal-to-babble dB", {10, 6, 3, 0, -3, -6, -10}, options,
                      [](double v, DtmfTrial* t) { t->channel.babble_sir_db = v; });
  }
  if (vesk_bench::HasItem(tables, "mic48")) {
    vesk_bench::Sweep("Success with a 48 kHz microphone", "SNR dB", {10, 0, -5, -10, -15, -17},
                      options, [](double v, DtmfTrial* t) {
                        t->channel.snr_db = v;
                        t->channel.mic_rate = 48000;
                      });
  }
  if (vesk_bench::HasItem(tables, "stereo")) {
    vesk_bench::Sweep("Success with a stereo 48 kHz microphone (independent noise per channel)",
                      "SNR dB", {10, -10, -15, -17}, options, [](double v, DtmfTrial* t) {
                        t->channel.snr_db = v;
                        t->channel.mic_rate = 48000;
                        t->channel.channels = 2;
                      });
  }
  if (vesk_bench::HasItem(tables, "false")) vesk_bench::FalseTokens(options);
  return 0;
}
