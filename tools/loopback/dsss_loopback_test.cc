// The DSSS modem end to end on the channel simulator, as a phone app uses
// it: encoder output played in a room, microphone PCM fed in chunks, tokens
// requested every 0.25 s.

#include <vector>

#include "gtest/gtest.h"
#include "tools/bench/dsss_trial.h"

namespace vesk_bench {
namespace {

DsssTrial Trial(double snr_db) {
  DsssTrial trial;
  trial.channel = DefaultTrialChannel();
  trial.channel.snr_db = snr_db;
  return trial;
}

int Successes(const DsssTrial& trial, int seeds, int* wrong) {
  int successes = 0;
  for (int seed = 1; seed <= seeds; ++seed) {
    const TrialResult result = RunDsssTrial(trial, seed);
    successes += result.correct;
    *wrong += result.wrong;
  }
  return successes;
}

// Clean audio decodes every time: both coder configurations, microphones at
// 44.1 and 48 kHz, mono and stereo, with and without CRC, and chunks of 256
// to 16384 bytes, each trial with its own random lead-in.
TEST(DsssLoopbackTest, CleanAudioAlwaysDecodes) {
  const int chunk_bytes[] = {256, 1024, 4096, 16384};
  int trial_index = 0;
  for (const auto& waveform : {audio_modem::DsssWaveformConfig(), audio_modem::Waveform44100()}) {
    for (int mic_rate : {44100, 48000}) {
      for (int channels : {1, 2}) {
        for (bool crc : {true, false}) {
          DsssTrial trial = Trial(INFINITY);
          trial.waveform = waveform;
          trial.channel.mic_rate = mic_rate;
          trial.channel.channels = channels;
          trial.crc = crc;
          // Unchecked hosts ask for one token per call.
          trial.tuning.max_candidates_to_return = crc ? 2 : 1;
          trial.repeat = 1;
          trial.chunk_bytes = chunk_bytes[trial_index % 4];
          const TrialResult result = RunDsssTrial(trial, 100 + trial_index++);
          EXPECT_TRUE(result.correct)
              << waveform.sample_rate << " coder, " << mic_rate << " Hz mic, " << channels
              << " channels, crc " << crc << ", " << trial.chunk_bytes << "-byte chunks";
          // Without a check a token heard only in part can come out wrong as
          // well (dsss_robustness --tables unchecked): only the CRC rules
          // that out.
          if (crc) {
            EXPECT_EQ(result.wrong, 0);
          }
        }
      }
    }
  }
}

TEST(DsssLoopbackTest, DecodesAtMinusTenDecibels) {
  int wrong = 0;
  EXPECT_GE(Successes(Trial(-10), 20, &wrong), 19);
  EXPECT_EQ(wrong, 0);
}

TEST(DsssLoopbackTest, ToleratesClockSkewAndDoppler) {
  for (double speed : {0.997, 1.003}) {
    DsssTrial trial = Trial(10);
    trial.channel.speed = speed;
    int wrong = 0;
    EXPECT_GE(Successes(trial, 20, &wrong), 19) << "speed " << speed;
    EXPECT_EQ(wrong, 0);
  }
}

TEST(DsssLoopbackTest, NoiseAloneNeverYieldsAToken) {
  for (const auto& waveform : {audio_modem::DsssWaveformConfig(), audio_modem::Waveform44100()}) {
    DsssTrial trial = Trial(INFINITY);
    trial.waveform = waveform;
    EXPECT_EQ(CountFalseTokens(trial, 60.0, /*babble=*/false, 5), 0);
  }
}

// The listening mode wakes on the product waveform and hands the decoder
// enough history to decode the token.
TEST(DsssLoopbackTest, ZintarModeDecodesTheProductToken) {
  DsssTrial trial = Trial(10);
  trial.channel.mic_rate = 48000;
  trial.zintar = true;
  int wrong = 0;
  EXPECT_GE(Successes(trial, 20, &wrong), 18);
  EXPECT_EQ(wrong, 0);
  // Through a 44.1 kHz microphone too (the detector works from 36994 Hz).
  trial.channel.mic_rate = 44100;
  EXPECT_GE(Successes(trial, 5, &wrong), 4);
}

}  // namespace
}  // namespace vesk_bench
