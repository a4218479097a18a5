// The zintar listening mode: a cheap detector in front of a DSSS decoder.
//
// While nothing has been heard the decoder only keeps a short history of the
// raw input and runs the zintar detector on each block; the DSSS decoder sees
// nothing. When a block scores above 25 the history is handed to the DSSS
// decoder and from then on every block goes to it, until neither a
// broadcaster nor a token has been reported for more than a second, when the
// decoder falls back to listening.
//
// The detector hears only the product DSSS waveform (48000 Hz coder,
// upsampling 16: one 127-chip code period per 2032 samples of 48 kHz audio,
// carrier near 18496 Hz), needs an input rate of at least 36994 Hz (its
// centre frequency must lie below half the rate) and has no Doppler
// tolerance: a relative speed or clock skew beyond about 0.1% moves the
// carrier out of its matched band.
//
// Not thread-safe: one thread at a time.

#ifndef SOCIAL_TANDRY_AUDIO_ZINTAR_DECODER_H_
#define SOCIAL_TANDRY_AUDIO_ZINTAR_DECODER_H_

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "audio/vesknet/vesknet_decoder.h"
#include "social/tandry/audio/zintar_detector.h"

namespace audio_modem {

// Owns a zintar detector and its running state, configured for one input.
class ZintarDetectorHolder {
 public:
  // The standard detector for `sample_rate` Hz (truncated toward zero) and
  // `num_channels` interleaved channels (raised to at least 1); null when the
  // detector cannot be made (for example below 36994 Hz).
  static std::unique_ptr<ZintarDetectorHolder> Create(float sample_rate, int num_channels);
  ~ZintarDetectorHolder();
  ZintarDetectorHolder(const ZintarDetectorHolder&) = delete;
  ZintarDetectorHolder& operator=(const ZintarDetectorHolder&) = delete;

  // Best block score of the mono samples; the state carries over.
  float Process(const int16_t* mono, int count);
  int num_channels() const { return num_channels_; }

 private:
  ZintarDetectorHolder(ZintarDetector* detector, ZintarState* state, int num_channels)
      : detector_(detector), state_(state), num_channels_(num_channels) {}

  ZintarDetector* detector_;
  ZintarState* state_;
  int num_channels_;
};

class ZintarDecoder {
 public:
  enum State { kListening = 0, kDetected = 1 };
  // Milliseconds of a monotonic clock.
  using Clock = std::function<int64_t()>;

  // Takes ownership of both; a null one ends the process. `clock` defaults
  // to the steady clock.
  ZintarDecoder(std::unique_ptr<audio_vesknet::VesknetDecoder> dsss_decoder,
                std::unique_ptr<ZintarDetectorHolder> zintar_detector, Clock clock = Clock());
  ~ZintarDecoder();

  // Forwarded to the DSSS decoder (the detector was configured at creation).
  void Initialize(float sample_rate, int num_channels);

  // Interleaved 16-bit samples, whole frames. While listening, a multi-channel block is
  // mixed down in place (the first two channels of each frame averaged), so
  // `samples` is overwritten.
  void ProcessSamples(int16_t* samples, int count);

  // False while listening; otherwise the DSSS decoder's answer, which also
  // keeps the decoder awake (true) or lets it fall back (false, after
  // more than a second without a true answer).
  bool DetectBroadcaster();
  bool GetToken(audio_vesknet::VesknetDecodeResults* results);

  // Wipes the DSSS decoder; the listening state, history and detector stay.
  void WipeInternalData();
  // 16-bit samples (all channels) that the next block may hold without
  // losing any: the DSSS decoder's free buffer space, and while listening at
  // most the history, through which a waking block reaches the decoder.
  int GetMaxSafeInputSize() const;
  // Bytes per token of the DSSS decoder.
  int token_size() const;

  State state() const { return state_; }
  // The detector's score of the latest block heard while listening (0 before
  // the first).
  float last_score() const { return last_score_; }
  // Whether a block score wakes the decoder: strictly above the threshold.
  static bool Wakes(float score) { return score > kDetectionThreshold; }
  const audio_vesknet::VesknetDecoder& dsss_decoder() const { return *dsss_decoder_; }
  static constexpr int kHistoryCapacity = 14400;  // Samples (all channels).
  static constexpr float kDetectionThreshold = 25.0f;

 private:
  void ApplyActivityRule(bool answer);
  // Whole frames the history holds: as many as fit in kHistoryCapacity.
  int HistoryFrames() const;

  std::unique_ptr<audio_vesknet::VesknetDecoder> dsss_decoder_;
  std::unique_ptr<ZintarDetectorHolder> zintar_detector_;
  std::vector<int16_t> history_;  // Capacity kHistoryCapacity.
  int history_count_ = 0;
  State state_ = kListening;
  Clock clock_;
  int64_t activity_ms_;  // Last detection or positive answer.
  float last_score_ = 0.0f;
  std::vector<float> floats_;
};

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_ZINTAR_DECODER_H_
