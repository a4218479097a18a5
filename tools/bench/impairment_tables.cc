#include "tools/bench/impairment_tables.h"

#include <cmath>
#include <map>

namespace vesk_bench {
namespace {

using vesk_channel::ChannelParams;
using vesk_channel::DeviceProfile;

std::vector<ImpairmentTable> MakeTables() {
  std::vector<ImpairmentTable> tables;
  const auto add = [&](const char* name, const char* title, const char* variable,
                       std::vector<double> values,
                       std::function<void(double, const ModemBand&, ChannelParams*)> set,
                       bool two_transmitters = false) {
    tables.push_back({name, title, variable, std::move(values), std::move(set), two_transmitters});
  };
  const std::vector<double> snrs = {10, 0, -5, -10, -12, -15, -17, -20};
  add("phone", "Budget phone loudspeaker and microphone", "SNR after the responses dB", snrs,
      [](double v, const ModemBand&, ChannelParams* c) {
        c->speaker = DeviceProfile::kBudgetPhone;
        c->microphone = DeviceProfile::kBudgetPhone;
        c->snr_db = v;
      });
  add("flagship", "Flagship phone loudspeaker and microphone", "SNR after the responses dB", snrs,
      [](double v, const ModemBand&, ChannelParams* c) {
        c->speaker = DeviceProfile::kFlagshipPhone;
        c->microphone = DeviceProfile::kFlagshipPhone;
        c->snr_db = v;
      });
  add("clip", "Playback clipped, 10 dB SNR", "overdrive dB", {0, 3, 6, 10, 15, 20},
      [](double v, const ModemBand&, ChannelParams* c) {
        c->overdrive_db = v;
        c->snr_db = 10;
      });
  add("agc", "Recording AGC, one gain step a second, 0 dB SNR", "gain step dB", {0, 6, 10, 20, 30},
      [](double v, const ModemBand&, ChannelParams* c) {
        c->agc.step_db = v;
        c->agc.interval_s = 1.0;
        c->snr_db = 0;
      });
  add("level", "Recording level without noise (16-bit quantisation)", "level dB",
      {-40, -50, -60, -70, -80}, [](double v, const ModemBand&, ChannelParams* c) {
        c->level_db = v;
        c->snr_db = INFINITY;
      });
  add("dropout", "20 ms recording dropouts, 0 dB SNR", "dropouts per second",
      {0, 0.25, 0.5, 1, 2, 4}, [](double v, const ModemBand&, ChannelParams* c) {
        c->dropouts.interval_s = v > 0 ? 1.0 / v : 0.0;
        c->dropouts.length_s = 0.02;
        c->snr_db = 0;
      });
  add("dropout_length", "Recording dropouts once a second, 0 dB SNR", "dropout length s",
      {0.005, 0.01, 0.02, 0.04}, [](double v, const ModemBand&, ChannelParams* c) {
        c->dropouts.interval_s = 1.0;
        c->dropouts.length_s = v;
        c->snr_db = 0;
      });
  add("walk", "Listener walking past (closest 0.5 m), 0 dB SNR", "walking speed m/s",
      {0, 0.4, 0.8, 1.2, 1.6}, [](double v, const ModemBand&, ChannelParams* c) {
        c->walk_speed_mps = v;
        c->walk_closest_m = 0.5;
        c->snr_db = 0;
      });
  const std::vector<double> tone_sirs = {10, 0, -5, -10, -15, -20, -25, -30};
  add("tone", "One steady tone anywhere in the band, 10 dB SNR", "signal-to-tone dB", tone_sirs,
      [](double v, const ModemBand& band, ChannelParams* c) {
        c->random_tones = 1;
        c->random_tone_low_hz = band.low_hz;
        c->random_tone_high_hz = band.high_hz;
        c->tone_sir_db = v;
        c->snr_db = 10;
      });
  add("tone_fixed", "One steady tone (DSSS: carrier + 100 Hz; DTMF: 1200 Hz), 10 dB SNR",
      "signal-to-tone dB", tone_sirs, [](double v, const ModemBand& band, ChannelParams* c) {
        c->tone_frequencies_hz = {band.fixed_hz};
        c->tone_sir_db = v;
        c->snr_db = 10;
      });
  add("tones2", "Two steady tones anywhere in the band, 10 dB SNR", "signal-to-tone dB of each",
      {10, 0, -5, -10, -15, -20}, [](double v, const ModemBand& band, ChannelParams* c) {
        c->random_tones = 2;
        c->random_tone_low_hz = band.low_hz;
        c->random_tone_high_hz = band.high_hz;
        c->tone_sir_db = v;
        c->snr_db = 10;
      });
  // Bright music: 32 partials a note reach 17-20 kHz from the upper notes
  // (1/k amplitudes, about 30 dB under their fundamentals there), so the
  // DSSS band hears some of it too.
  add("music", "Music (chords, 32 partials a note), 10 dB SNR", "signal-to-music dB",
      {10, 0, -5, -10, -15, -20}, [](double v, const ModemBand&, ChannelParams* c) {
        c->music_sir_db = v;
        c->music.harmonics = 32;
        c->snr_db = 10;
      });
  add("impulses", "Claps and door slams, two a second, 10 dB SNR", "peak over signal RMS dB",
      {0, 10, 20, 30, 40}, [](double v, const ModemBand&, ChannelParams* c) {
        c->impulses.per_second = 2;
        c->impulses.peak_over_signal_db = v;
        c->snr_db = 10;
      });
  add(
      "second", "A second transmitter 0.1 s later, 10 dB SNR", "its power over the first's dB",
      {-20, -12, -6, -3, 0},
      [](double v, const ModemBand&, ChannelParams* c) {
        c->second_power_db = v;
        c->second_offset_s = 0.1;
        c->snr_db = 10;
      },
      true);
  add(
      "second_offset", "A second transmitter of equal power, 10 dB SNR", "its delay s",
      {0.05, 0.2, 0.5, 1.0},
      [](double v, const ModemBand&, ChannelParams* c) {
        c->second_power_db = 0;
        c->second_offset_s = v;
        c->snr_db = 10;
      },
      true);
  return tables;
}

}  // namespace

const std::vector<ImpairmentTable>& ImpairmentTables() {
  static const std::vector<ImpairmentTable>* const tables =
      new std::vector<ImpairmentTable>(MakeTables());
  return *tables;
}

std::string ImpairmentTableNames() {
  std::string names;
  for (const ImpairmentTable& table : ImpairmentTables()) {
    names += (names.empty() ? "" : ",") + table.name;
  }
  return names;
}

void RunImpairmentTable(const ImpairmentTable& table, const std::vector<double>& values,
                        const std::vector<std::string>& series, int trials, int repeat,
                        const std::function<Point(double value, size_t series)>& cell,
                        CsvFile* csv) {
  SweepDescription sweep;
  sweep.table = table.name;
  sweep.title = table.title;
  sweep.variable = table.variable;
  sweep.trials = trials;
  sweep.repeat = repeat;
  for (const std::string& name : series) {
    sweep.series.push_back(name);
    if (table.two_transmitters) sweep.series.push_back(name + " other");
  }
  if (!table.two_transmitters) {
    RunSweep(sweep, values.empty() ? table.values : values, cell, csv);
    return;
  }
  // One run of trials gives both columns of a group: the first token's
  // column runs them, the other's reads the second token's successes.
  Point last;
  RunSweep(
      sweep, values.empty() ? table.values : values,
      [&](double value, size_t s) {
        if (s % 2 == 0) {
          last = cell(value, s / 2);
          return last;
        }
        Point other;
        other.successes = last.second_successes;
        other.wrong = last.wrong;
        return other;
      },
      csv);
}

}  // namespace vesk_bench
