// The tables of impairments beyond white noise that the DSSS and DTMF
// robustness programs both run: for each impairment of real phones and
// rooms, the success rate and the wrong tokens against its strength. Each
// table starts from the room of the programs' options and sets its
// impairment (and the SNR it is measured at).
//
//   phone, flagship   budget or flagship loudspeaker and microphone, versus
//                     the SNR measured after the responses
//   clip              playback overdrive at 10 dB SNR
//   agc               recording gain steps (one per second) at 0 dB SNR
//   level             recording level without noise: 16-bit quantisation
//   dropout           20 ms dropouts, versus how many a second, at 0 dB SNR
//   dropout_length    dropouts once a second, versus their length, at 0 dB
//   walk              a listener walking past (closest 0.5 m) at 0 dB SNR
//   tone              one steady tone anywhere in the modem's band, versus
//                     the signal-to-tone ratio, at 10 dB SNR
//   tone_fixed        the same at one frequency (DSSS: 100 Hz above the
//                     carrier; DTMF: 1200 Hz)
//   tones2            two steady tones anywhere in the band, each at the
//                     signal-to-tone ratio, at 10 dB SNR
//   music             chords of harmonic notes, versus the signal-to-music
//                     ratio, at 10 dB SNR
//   impulses          two claps or door slams per second, versus their peak
//                     over the signal's RMS, at 10 dB SNR
//   second            a second transmitter (another token, 0.1 s later),
//                     versus its power over the first's, at 10 dB SNR
//   second_offset     a second transmitter of equal power, versus its
//                     delay, at 10 dB SNR
// The second-transmitter tables have two series per column group: the
// first transmitter's token and the other's ("<series> other"); their wrong
// tokens are those that neither sent.

#ifndef TOOLS_BENCH_IMPAIRMENT_TABLES_H_
#define TOOLS_BENCH_IMPAIRMENT_TABLES_H_

#include <functional>
#include <string>
#include <vector>

#include "tools/bench/bench_util.h"
#include "tools/bench/sweep_table.h"
#include "tools/channel/channel_simulator.h"

namespace vesk_bench {

// Where a modem's signal lies, Hz: tones "anywhere in the band" are drawn
// from [low_hz, high_hz); the tone_fixed table puts its tone at fixed_hz.
struct ModemBand {
  double low_hz = 0;
  double high_hz = 0;
  double fixed_hz = 0;
};

struct ImpairmentTable {
  std::string name;            // CSV table name and --tables item.
  std::string title;           // Markdown heading.
  std::string variable;        // The swept variable with its unit.
  std::vector<double> values;  // Default values of the variable.
  // Sets the impairment at `value` on a channel, for a modem in `band`.
  std::function<void(double value, const ModemBand& band, vesk_channel::ChannelParams* channel)>
      set;
  bool two_transmitters = false;
};

// Every impairment table, in the order above.
const std::vector<ImpairmentTable>& ImpairmentTables();

// "phone,flagship,clip,...": every table's name.
std::string ImpairmentTableNames();

// Runs `table` over `values` (its own when empty): a row per value, a column
// group per name of `series` (two for a two-transmitter table), printed as
// markdown and written to `csv`. `cell(value, series index)` runs the trials
// of one cell with the table's impairment set; it is called once per value
// and series index.
void RunImpairmentTable(const ImpairmentTable& table, const std::vector<double>& values,
                        const std::vector<std::string>& series, int trials, int repeat,
                        const std::function<Point(double value, size_t series)>& cell,
                        CsvFile* csv);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_IMPAIRMENT_TABLES_H_
