// A decoder driven the way a listening host drives one: 16-bit PCM in
// chunks of any size goes in; at fixed intervals of stream time the decoder
// is asked for tokens and for a broadcaster, and each token heard is reported
// once per sighting with the stream time of that request.
//
// The decoder is fed in blocks that end exactly at the request times, cut
// into pieces of at most kPieceFrames frames, whatever the caller's chunks:
// the same audio gives the same reports whether it arrives one sample at a
// time or all at once. The listening mode's one-second fall-back timer runs
// on stream time (samples fed / rate), not on the wall clock, so that audio
// decoded faster or slower than real time behaves as it would live.
//
// Lifecycle: Create -> Feed (any number of samples) -> TakeTokens /
// broadcaster() -> ... -> Flush at the end of a recording. Memory: the
// decoder's own plus one block of samples and the queue of untaken tokens
// (at most kMaxQueuedTokens; older ones are dropped with a warning).
// Not thread-safe: one thread at a time.

#ifndef SOCIAL_TANDRY_AUDIO_TOKEN_STREAM_H_
#define SOCIAL_TANDRY_AUDIO_TOKEN_STREAM_H_

#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <string>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"

namespace audio_modem {

struct TokenStreamOptions {
  // Stream time between two requests for tokens, seconds, in (0, 1]: short
  // enough that no token leaves the history unseen.
  double poll_interval_seconds = 0.25;
  // A token is reported again only after it went unheard for this long,
  // seconds, >= 0; 0 reports it at every request that decodes it.
  double hold_seconds = 3.0;
};

// Empty when `options` are usable; otherwise a sentence saying what is wrong.
std::string TokenStreamOptionsError(const TokenStreamOptions& options);

struct StreamToken {
  std::vector<uint8_t> message;  // Message bytes, check bytes verified and removed.
  double time_seconds = 0.0;     // Stream time of the request that reported it.
};

class TokenStream {
 public:
  // Largest piece handed to the decoder in one call, frames: what a
  // recording loop delivers at a time.
  static constexpr int kPieceFrames = 4096;
  // Untaken tokens kept; the oldest go first.
  static constexpr size_t kMaxQueuedTokens = 1000;

  // A stream over a DSSS decoder (listening mode included) or a DTMF decoder
  // built from `config`, for tokens of `crc_check_bytes` (0 or 2) check
  // bytes after the message. Null, with the reason in *error, when the
  // configuration or the options are refused; a configuration accepted here
  // never reaches a fatal check.
  static std::unique_ptr<TokenStream> Create(const DsssDecoderConfig& config, int crc_check_bytes,
                                             const TokenStreamOptions& options, std::string* error);
  static std::unique_ptr<TokenStream> Create(const DtmfDecoderConfig& config, int crc_check_bytes,
                                             const TokenStreamOptions& options, std::string* error);

  TokenStream(const TokenStream&) = delete;
  TokenStream& operator=(const TokenStream&) = delete;

  // Interleaved 16-bit samples; a chunk need not hold whole frames.
  void Feed(const int16_t* samples, size_t count);
  // Hands the samples of an incomplete block to the decoder and makes a
  // request at once (whole frames only; a partial frame is dropped). For the
  // end of a recording: the blocks that follow start afresh.
  void Flush();
  // Forgets the audio heard so far and the tokens already reported (so they
  // are reported again when heard again); tokens not yet taken stay queued.
  void Wipe();

  // Moves the tokens reported since the last call into *tokens, oldest first.
  void TakeTokens(std::vector<StreamToken>* tokens);
  size_t queued_tokens() const { return queue_.size(); }

  // The broadcaster answer of the latest request (false before the first
  // and always for DTMF).
  bool broadcaster() const { return broadcaster_; }
  // Seconds of audio fed: whole frames / the microphone rate.
  double stream_seconds() const;
  int message_bytes() const { return message_bytes_; }
  int channels() const { return channels_; }
  const AudioModemDecoder& decoder() const { return *decoder_; }

 private:
  TokenStream(float sample_rate, int channels, int message_bytes, int crc_check_bytes,
              const TokenStreamOptions& options);

  // Milliseconds of stream time, the listening mode's clock.
  int64_t StreamMilliseconds() const;
  void FeedBlock(const int16_t* samples, size_t count);
  void Request();

  std::unique_ptr<AudioModemDecoder> decoder_;
  float sample_rate_;
  int channels_;
  int message_bytes_;
  int crc_check_bytes_;
  TokenStreamOptions options_;
  size_t block_samples_;        // One poll interval of whole frames.
  std::vector<int16_t> block_;  // Samples of the block being filled.
  int64_t samples_fed_ = 0;     // Samples handed over by Feed, all channels.
  bool broadcaster_ = false;
  std::deque<StreamToken> queue_;
  std::vector<StreamToken> recent_;  // Reported tokens and when last heard.
  DecodeResults results_;
  std::vector<int16_t> raw_;
};

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_TOKEN_STREAM_H_
