#include "social/tandry/audio/token_stream.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "base/logging.h"

namespace audio_modem {
namespace {

// Message bytes of a token of `token_bytes` with `crc_check_bytes`, or an
// error when the split is not one the front accepts.
std::string TokenGeometryError(int token_bytes, int crc_check_bytes) {
  if (crc_check_bytes != 0 && crc_check_bytes != 2) return "check bytes must be 0 or 2";
  if (token_bytes - crc_check_bytes < 1) return "the token needs at least one message byte";
  return std::string();
}

}  // namespace

std::string TokenStreamOptionsError(const TokenStreamOptions& options) {
  if (!(options.poll_interval_seconds > 0 && options.poll_interval_seconds <= 1)) {
    return "the poll interval must lie in (0, 1] seconds";
  }
  if (!(options.hold_seconds >= 0 && std::isfinite(options.hold_seconds))) {
    return "the hold time must be finite and not negative";
  }
  return std::string();
}

TokenStream::TokenStream(float sample_rate, int channels, int message_bytes, int crc_check_bytes,
                         const TokenStreamOptions& options)
    : sample_rate_(sample_rate),
      channels_(channels),
      message_bytes_(message_bytes),
      crc_check_bytes_(crc_check_bytes),
      options_(options) {
  const double frames = std::round(options.poll_interval_seconds * sample_rate);
  block_samples_ = static_cast<size_t>(std::max(1.0, frames)) * channels;
  block_.reserve(block_samples_);
}

std::unique_ptr<TokenStream> TokenStream::Create(const DsssDecoderConfig& config,
                                                 int crc_check_bytes,
                                                 const TokenStreamOptions& options,
                                                 std::string* error) {
  CHECK(error);
  *error = DsssDecoderConfigError(config);
  if (error->empty()) *error = TokenGeometryError(config.token_length_bytes, crc_check_bytes);
  if (error->empty()) *error = TokenStreamOptionsError(options);
  if (!error->empty()) return nullptr;
  std::unique_ptr<TokenStream> stream(new TokenStream(config.input_sample_rate, config.num_channels,
                                                      config.token_length_bytes - crc_check_bytes,
                                                      crc_check_bytes, options));
  const TokenStream* self = stream.get();
  stream->decoder_ = MakeDsssAudioModemDecoder(config, audio_vesknet::VesknetDecoderParams(),
                                               [self] { return self->StreamMilliseconds(); });
  return stream;
}

std::unique_ptr<TokenStream> TokenStream::Create(const DtmfDecoderConfig& config,
                                                 int crc_check_bytes,
                                                 const TokenStreamOptions& options,
                                                 std::string* error) {
  CHECK(error);
  *error = DtmfDecoderConfigError(config);
  if (error->empty()) *error = TokenGeometryError(config.bytes_in_token, crc_check_bytes);
  if (error->empty()) *error = TokenStreamOptionsError(options);
  if (!error->empty()) return nullptr;
  std::unique_ptr<TokenStream> stream(new TokenStream(config.input_sample_rate, config.num_channels,
                                                      config.bytes_in_token - crc_check_bytes,
                                                      crc_check_bytes, options));
  stream->decoder_ = MakeDtmfAudioModemDecoder(config);
  if (!stream->decoder_) {
    *error = "the envelope was refused";
    return nullptr;
  }
  return stream;
}

double TokenStream::stream_seconds() const {
  return static_cast<double>(samples_fed_ / channels_) / sample_rate_;
}

int64_t TokenStream::StreamMilliseconds() const {
  return static_cast<int64_t>(std::floor(stream_seconds() * 1000.0));
}

void TokenStream::Feed(const int16_t* samples, size_t count) {
  while (count > 0) {
    const size_t take = std::min(count, block_samples_ - block_.size());
    block_.insert(block_.end(), samples, samples + take);
    samples += take;
    count -= take;
    samples_fed_ += static_cast<int64_t>(take);
    if (block_.size() == block_samples_) {
      FeedBlock(block_.data(), block_.size());
      block_.clear();
      Request();
    }
  }
}

void TokenStream::Flush() {
  const size_t whole = block_.size() / channels_ * channels_;
  // A partial frame is dropped, and forgotten, so the next frame starts on
  // the first channel again.
  samples_fed_ -= static_cast<int64_t>(block_.size() - whole);
  FeedBlock(block_.data(), whole);
  block_.clear();
  Request();
}

void TokenStream::Wipe() {
  const size_t whole = block_.size() / channels_ * channels_;
  block_.erase(block_.begin(), block_.begin() + whole);
  decoder_->WipeInternalData();
  recent_.clear();
  broadcaster_ = false;
}

void TokenStream::FeedBlock(const int16_t* samples, size_t count) {
  const size_t piece = static_cast<size_t>(kPieceFrames) * channels_;
  for (size_t start = 0; start < count; start += piece) {
    const size_t n = std::min(piece, count - start);
    if (decoder_->kind() == AudioModemDecoder::kZintar) {
      // The listening mode mixes its input down in place: give it a copy.
      raw_.assign(samples + start, samples + start + n);
      decoder_->ProcessSamplesWithZintar(raw_.data(), static_cast<int>(n));
    } else {
      decoder_->ProcessPcm16(samples + start, static_cast<int>(n));
    }
  }
}

void TokenStream::Request() {
  const double now = stream_seconds();
  broadcaster_ = decoder_->DetectBroadcaster();
  if (!decoder_->GetTokens(&results_, message_bytes_, crc_check_bytes_)) return;
  // Entries unheard for longer than the hold are forgotten: their next
  // sighting is a new one.
  recent_.erase(std::remove_if(recent_.begin(), recent_.end(),
                               [&](const StreamToken& token) {
                                 return now - token.time_seconds > options_.hold_seconds;
                               }),
                recent_.end());
  for (TokenResult& token : results_.tokens) {
    auto seen = std::find_if(recent_.begin(), recent_.end(), [&](const StreamToken& known) {
      return known.message == token.bytes;
    });
    if (seen != recent_.end() && options_.hold_seconds > 0) {
      seen->time_seconds = now;
      continue;
    }
    if (seen == recent_.end()) recent_.push_back({token.bytes, now});
    if (queue_.size() == kMaxQueuedTokens) {
      LOG(WARNING) << "Token queue full: the oldest untaken token is dropped.";
      queue_.pop_front();
    }
    queue_.push_back({std::move(token.bytes), now});
  }
}

void TokenStream::TakeTokens(std::vector<StreamToken>* tokens) {
  CHECK(tokens);
  tokens->assign(std::make_move_iterator(queue_.begin()), std::make_move_iterator(queue_.end()));
  queue_.clear();
}

}  // namespace audio_modem
