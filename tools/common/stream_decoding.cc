#include "tools/common/stream_decoding.h"

#include <algorithm>

namespace vesk_tool {

StreamDecoder::StreamDecoder(audio_modem::AudioModemDecoder* decoder, int rate, int channels,
                             int message_bytes, int crc_check_bytes,
                             const StreamDecodingOptions& options)
    : decoder_(decoder),
      rate_(rate),
      channels_(channels),
      message_bytes_(message_bytes),
      crc_check_bytes_(crc_check_bytes),
      options_(options),
      next_request_frame_(static_cast<int64_t>(options.request_interval_s * rate)) {}

std::vector<FoundToken> StreamDecoder::Feed(const int16_t* samples, int64_t count) {
  std::vector<FoundToken> found;
  const int64_t chunk =
      std::max<int64_t>(channels_, options_.chunk_bytes / 2 / channels_ * channels_);
  for (int64_t start = 0; start < count; start += chunk) {
    const int64_t n = std::min(chunk, count - start);
    if (options_.zintar) {
      // The listening mode may mix the block down in place: give it a copy.
      raw_.assign(samples + start, samples + start + n);
      decoder_->ProcessSamplesWithZintar(raw_.data(), static_cast<int>(n));
    } else {
      decoder_->ProcessPcm16(samples + start, static_cast<int>(n));
    }
    frames_fed_ += n / channels_;
    if (frames_fed_ >= next_request_frame_) {
      Request(&found);
      next_request_frame_ += static_cast<int64_t>(options_.request_interval_s * rate_);
    }
  }
  return found;
}

std::vector<FoundToken> StreamDecoder::Finish() {
  const int64_t input_frames = frames_fed_;
  const std::vector<int16_t> silence(
      static_cast<size_t>(kFlushSeconds * rate_) * static_cast<size_t>(channels_), 0);
  std::vector<FoundToken> found = Feed(silence.data(), static_cast<int64_t>(silence.size()));
  Request(&found);
  frames_fed_ = input_frames;
  for (FoundToken& token : found) token.time_s = time_s();
  return found;
}

void StreamDecoder::Request(std::vector<FoundToken>* found) {
  const double now = time_s();
  if (options_.detect_broadcaster) {
    ++broadcaster_answers_;
    if (decoder_->DetectBroadcaster()) {
      ++positive_broadcaster_answers_;
      if (broadcaster_time_s_ < 0) broadcaster_time_s_ = now;
    }
  }
  audio_modem::DecodeResults results;
  if (!decoder_->GetTokens(&results, message_bytes_, crc_check_bytes_)) return;
  recent_.erase(
      std::remove_if(recent_.begin(), recent_.end(),
                     [&](const FoundToken& t) { return now - t.time_s > options_.repeat_hold_s; }),
      recent_.end());
  for (const audio_modem::TokenResult& token : results.tokens) {
    // A token still heard keeps its entry fresh and is reported only once.
    auto seen = std::find_if(recent_.begin(), recent_.end(),
                             [&](const FoundToken& t) { return t.bytes == token.bytes; });
    if (seen != recent_.end()) {
      seen->time_s = now;
      continue;
    }
    found->push_back({now, token.bytes});
    recent_.push_back({now, token.bytes});
  }
}

}  // namespace vesk_tool
