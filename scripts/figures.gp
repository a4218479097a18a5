# Renders the robustness figures from the CSV that scripts/figures.sh writes.
#   gnuplot -e "dir='docs/figures'; seeds=20" scripts/figures.gp
# (term='png' renders PNG instead of SVG, for a quick look.)
# Each CSV line is one table cell:
#   table,variable,value,series,repeat,trials,successes,wrong,median_delay_s

if (!exists("dir")) dir = "docs/figures"
if (!exists("seeds")) seeds = 20
if (!exists("term")) term = "svg"
set datafile separator ","
if (term eq "svg") {
  set terminal svg size 760,460 dynamic font "sans,13" background rgb "white"
  ext = ".svg"
} else {
  set terminal pngcairo size 760,460 font "sans,11" background rgb "white"
  ext = ".png"
}

# The cells of one table and series, from the run with `repeat` repetitions.
cells(modem, repeat, table, series) = \
  sprintf("< awk -F, '$1==\"%s\" && $4==\"%s\"' %s/%s_x%d.csv", table, series, dir, modem, repeat)
percent = "3:(100.0*$7/$6)"

set grid back lc rgb "#dddddd"
set yrange [-2:102]
set ytics 0,20,100
set key outside right center Left reverse samplen 3 spacing 1.2
set border 3
set tics nomirror

# Colours per modem; dashed lines for a token played once.
dsss48 = "#1f5fa8"
dsss44 = "#e07b00"
dtmf = "#2a8f3a"
zintar = "#8a3ea8"

set output dir."/snr".ext
set title sprintf("Success versus full-band SNR (%d seeds per point, 44.1 kHz microphone)", seeds)
set xlabel "SNR, dB"
set ylabel "tokens decoded, %"
plot \
  cells("dsss", 3, "snr", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 title "DSSS 48k coder, x3", \
  cells("dsss", 1, "snr", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 dt 2 title "DSSS 48k coder, x1", \
  cells("dsss", 3, "snr", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 title "DSSS 44.1k coder, x3", \
  cells("dsss", 1, "snr", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 dt 2 title "DSSS 44.1k coder, x1", \
  cells("dtmf", 3, "snr", "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 title "DTMF, x3", \
  cells("dtmf", 1, "snr", "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 dt 2 title "DTMF, x1"

set output dir."/zintar".ext
set title sprintf("Listening mode: wake-ups versus full-band SNR (%d seeds, 48 kHz microphone)", seeds)
set ylabel "transmissions that wake the detector, %"
plot \
  cells("zintar", 3, "detect", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 title "48k coder, x3", \
  cells("zintar", 1, "detect", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 dt 2 title "48k coder, x1", \
  cells("zintar", 3, "detect", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 title "44.1k coder, x3", \
  cells("zintar", 1, "detect", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 dt 2 title "44.1k coder, x1"

set output dir."/reverb".ext
set title sprintf("Success with reverberation (RT60 0.3 s, %d seeds, 44.1 kHz microphone)", seeds)
set ylabel "tokens decoded, %"
plot \
  cells("dsss", 3, "reverb", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 title "DSSS 48k coder, x3", \
  cells("dsss", 1, "reverb", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 dt 2 title "DSSS 48k coder, x1", \
  cells("dsss", 3, "reverb", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 title "DSSS 44.1k coder, x3", \
  cells("dsss", 1, "reverb", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 dt 2 title "DSSS 44.1k coder, x1", \
  cells("dtmf", 3, "reverb", "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 title "DTMF, x3", \
  cells("dtmf", 1, "reverb", "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 dt 2 title "DTMF, x1"

set output dir."/speed".ext
set title sprintf("Success versus speed (clock skew or Doppler) at 0 dB SNR (%d seeds)", seeds)
set xlabel "speed (1.001: the token plays 0.1 % fast)"
set ylabel "tokens decoded or wake-ups, %"
set xtics 0.005 format "%.3f"
plot \
  cells("dsss", 3, "speed", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 title "DSSS 48k coder, x3", \
  cells("dsss", 1, "speed", "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 dt 2 title "DSSS 48k coder, x1", \
  cells("dsss", 3, "speed", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 title "DSSS 44.1k coder, x3", \
  cells("dsss", 1, "speed", "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 dt 2 title "DSSS 44.1k coder, x1", \
  cells("dtmf", 3, "speed", "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 title "DTMF, x3", \
  cells("dtmf", 1, "speed", "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 dt 2 title "DTMF, x1", \
  cells("zintar", 3, "speed", "48k/16/4") using @percent with linespoints lc rgb zintar pt 11 ps 0.5 lw 2 title "wake-ups, 48k coder, x3", \
  cells("zintar", 1, "speed", "48k/16/4") using @percent with linespoints lc rgb zintar pt 11 ps 0.5 lw 2 dt 2 title "wake-ups, 48k coder, x1"

# The impairment tables: one plot each, every modem with the token played
# once (dashed) and three times; for a second transmitter the other token's
# success too (dotted).
impairments = "phone flagship clip agc level dropout dropout_length walk tone tone_fixed tones2 music impulses second second_offset"
title_of(t) = \
  t eq "phone" ? "Budget phone loudspeaker and microphone" : \
  t eq "flagship" ? "Flagship phone loudspeaker and microphone" : \
  t eq "clip" ? "Playback clipped (overdrive), 10 dB SNR" : \
  t eq "agc" ? "Recording AGC, one gain step a second, 0 dB SNR" : \
  t eq "level" ? "Recording level without noise (16-bit quantisation)" : \
  t eq "dropout" ? "20 ms recording dropouts, 0 dB SNR" : \
  t eq "dropout_length" ? "Recording dropouts once a second, 0 dB SNR" : \
  t eq "walk" ? "Listener walking past (closest 0.5 m), 0 dB SNR" : \
  t eq "tone" ? "One steady tone anywhere in the band, 10 dB SNR" : \
  t eq "tone_fixed" ? "One tone at DSSS carrier + 100 Hz / DTMF 1200 Hz, 10 dB SNR" : \
  t eq "tones2" ? "Two steady tones anywhere in the band, 10 dB SNR" : \
  t eq "music" ? "Music (chords, 32 partials a note), 10 dB SNR" : \
  t eq "impulses" ? "Claps and door slams, two a second, 10 dB SNR" : \
  t eq "second" ? "A second transmitter 0.1 s later, 10 dB SNR" : \
  t eq "second_offset" ? "A second transmitter of equal power, 10 dB SNR" : t
impairment(t, modem, repeat, series) = \
  sprintf("< awk -F, '$4==\"%s\"' %s/impairments/%s_%s_x%d.csv", series, dir, t, modem, repeat)
set xtics auto format "% g"
set ylabel "tokens decoded, %"
do for [t in impairments] {
  file = sprintf("%s/impairments/%s_dsss_x3.csv", dir, t)
  if (system(sprintf("test -s %s && echo 1 || echo 0", file)) == 1) {
    set output sprintf("%s/impairments/%s%s", dir, t, ext)
    set title sprintf("%s (%d seeds)", title_of(t), seeds)
    set xlabel system(sprintf("awk -F, 'NR==2 {print $2}' %s", file))
    two = (t eq "second" || t eq "second_offset")
    plot \
      impairment(t, "dsss", 3, "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 title "DSSS 48k coder, x3", \
      impairment(t, "dsss", 1, "48k/16/4") using @percent with linespoints lc rgb dsss48 pt 7 ps 0.5 lw 2 dt 2 title "DSSS 48k coder, x1", \
      impairment(t, "dsss", 3, "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 title "DSSS 44.1k coder, x3", \
      impairment(t, "dsss", 1, "44.1k/15/3") using @percent with linespoints lc rgb dsss44 pt 5 ps 0.5 lw 2 dt 2 title "DSSS 44.1k coder, x1", \
      impairment(t, "dtmf", 3, "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 title "DTMF, x3", \
      impairment(t, "dtmf", 1, "product") using @percent with linespoints lc rgb dtmf pt 9 ps 0.6 lw 2 dt 2 title "DTMF, x1", \
      (two ? impairment(t, "dsss", 3, "48k/16/4 other") : "< true") using @percent with linespoints lc rgb dsss48 pt 6 ps 0.5 lw 1 dt 3 title (two ? "other token: DSSS 48k, x3" : ""), \
      (two ? impairment(t, "dtmf", 3, "product other") : "< true") using @percent with linespoints lc rgb dtmf pt 8 ps 0.5 lw 1 dt 3 title (two ? "other token: DTMF, x3" : "")
  }
}
