// Feeds 16-bit PCM to a decoder the way a host app does: in small chunks,
// asking for tokens at a fixed interval, and reports each token once, when
// first found.

#ifndef TOOLS_COMMON_STREAM_DECODING_H_
#define TOOLS_COMMON_STREAM_DECODING_H_

#include <cstdint>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"

namespace vesk_tool {

struct FoundToken {
  double time_s = 0.0;         // Stream time at which the decoder reported it.
  std::vector<uint8_t> bytes;  // Message bytes.
};

struct StreamDecodingOptions {
  int chunk_bytes = 4096;            // Bytes of PCM per call, as a recording loop delivers.
  double request_interval_s = 0.25;  // Seconds between token requests.
  // A token is reported again only after this long without being heard.
  double repeat_hold_s = 3.0;
  bool zintar = false;  // Feed the raw samples to the listening mode.
  // Ask DetectBroadcaster at every request, as a host that shows it does
  // (broadcaster_time_s() and the answer counts stay at -1 and 0 without).
  bool detect_broadcaster = true;
};

class StreamDecoder {
 public:
  // `decoder` must be initialised for `rate` and `channels` and outlive this.
  StreamDecoder(audio_modem::AudioModemDecoder* decoder, int rate, int channels, int message_bytes,
                int crc_check_bytes, const StreamDecodingOptions& options);

  // Feeds interleaved samples (whole frames); returns the tokens first found
  // during this call.
  std::vector<FoundToken> Feed(const int16_t* samples, int64_t count);

  // Ends the stream: the decoder needs about 0.09 s of audio after a token
  // before it can report it, so a token that ends with the input would be
  // lost. Feeds kFlushSeconds of silence, asks once more and returns the
  // tokens first found, timed at the end of the input; time_s() stays the
  // input's length. Feed no more afterwards.
  std::vector<FoundToken> Finish();

  // Silence fed by Finish(): the measured 0.09 s need (both DSSS coders,
  // with and without the listening mode) with margin, and one request interval.
  static constexpr double kFlushSeconds = 0.25;

  // Seconds of audio fed so far.
  double time_s() const { return static_cast<double>(frames_fed_) / rate_; }
  // Stream time of the first positive DetectBroadcaster answer, or -1.
  double broadcaster_time_s() const { return broadcaster_time_s_; }
  // DetectBroadcaster answers so far (one per request) and the positive ones.
  int broadcaster_answers() const { return broadcaster_answers_; }
  int positive_broadcaster_answers() const { return positive_broadcaster_answers_; }

 private:
  void Request(std::vector<FoundToken>* found);

  audio_modem::AudioModemDecoder* decoder_;
  int rate_;
  int channels_;
  int message_bytes_;
  int crc_check_bytes_;
  StreamDecodingOptions options_;
  int64_t frames_fed_ = 0;
  int64_t next_request_frame_;
  double broadcaster_time_s_ = -1.0;
  int broadcaster_answers_ = 0;
  int positive_broadcaster_answers_ = 0;
  std::vector<FoundToken> recent_;  // Reported tokens and when last heard.
  std::vector<int16_t> raw_;
};

}  // namespace vesk_tool

#endif  // TOOLS_COMMON_STREAM_DECODING_H_
