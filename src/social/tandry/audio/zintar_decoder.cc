#include "social/tandry/audio/zintar_decoder.h"

#include <algorithm>
#include <chrono>
#include <cstring>
#include <utility>

#include "base/logging.h"

namespace audio_modem {
namespace {

int64_t SteadyMilliseconds() {
  return std::chrono::duration_cast<std::chrono::milliseconds>(
             std::chrono::steady_clock::now().time_since_epoch())
      .count();
}

}  // namespace

std::unique_ptr<ZintarDetectorHolder> ZintarDetectorHolder::Create(float sample_rate,
                                                                   int num_channels) {
  ZintarConfig config;
  SetStandardZintarConfig(static_cast<int32_t>(sample_rate), &config);
  ZintarDetector* detector = CreateZintarDetector(&config);
  ZintarState* state = CreateZintarState(&config, detector);
  if (detector == nullptr || state == nullptr) {
    FreeZintarState(state);
    FreeZintarDetector(detector);
    return nullptr;
  }
  return std::unique_ptr<ZintarDetectorHolder>(
      new ZintarDetectorHolder(detector, state, std::max(1, num_channels)));
}

ZintarDetectorHolder::~ZintarDetectorHolder() {
  FreeZintarState(state_);
  FreeZintarDetector(detector_);
}

float ZintarDetectorHolder::Process(const int16_t* mono, int count) {
  float score = 0.0f;
  ZintarProcess(detector_, state_, mono, count, &score);
  return score;
}

ZintarDecoder::ZintarDecoder(std::unique_ptr<audio_vesknet::VesknetDecoder> dsss_decoder,
                             std::unique_ptr<ZintarDetectorHolder> zintar_detector, Clock clock)
    : dsss_decoder_(std::move(CHECK_NOTNULL(dsss_decoder))),
      zintar_detector_(std::move(CHECK_NOTNULL(zintar_detector))),
      history_(kHistoryCapacity),
      clock_(clock ? std::move(clock) : Clock(SteadyMilliseconds)),
      activity_ms_(clock_()) {}

// The history goes first, then the detector (state, then tables), then the
// DSSS decoder: the reverse of the members' order.
ZintarDecoder::~ZintarDecoder() = default;

void ZintarDecoder::Initialize(float sample_rate, int num_channels) {
  dsss_decoder_->Initialize(sample_rate, num_channels);
}

void ZintarDecoder::ProcessSamples(int16_t* samples, int count) {
  if (count <= 0) return;
  if (state_ == kDetected) {
    floats_.assign(samples, samples + count);
    dsss_decoder_->ProcessSamples(floats_);
    return;
  }

  // Keep the newest samples heard while listening; of a block longer than
  // the history only its first samples are kept. The history holds whole
  // frames, so that the DSSS decoder is handed whole frames whatever the
  // channel count.
  const int channels = zintar_detector_->num_channels();
  const int capacity = HistoryFrames() * channels;
  const int take = std::min(capacity, count - count % channels);
  const int keep = std::min(capacity - take, history_count_);
  if (keep >= 1 && keep < history_count_) {
    std::memmove(history_.data(), history_.data() + history_count_ - keep, keep * sizeof(int16_t));
  }
  std::memcpy(history_.data() + keep, samples, take * sizeof(int16_t));
  history_count_ = keep + take;

  // Mix down in place: the mean of the first two channels of each frame.
  int mono_count = count;
  if (channels >= 2) {
    mono_count = 0;
    for (int i = 0; i + 1 < count; i += channels) {
      samples[mono_count++] = static_cast<int16_t>((samples[i] + samples[i + 1]) / 2);
    }
  }
  last_score_ = zintar_detector_->Process(samples, mono_count);
  if (!Wakes(last_score_)) return;

  state_ = kDetected;
  activity_ms_ = clock_();
  floats_.assign(history_.data(), history_.data() + history_count_);
  dsss_decoder_->ProcessSamples(floats_);
  history_count_ = 0;
}

void ZintarDecoder::ApplyActivityRule(bool answer) {
  const int64_t now = clock_();
  if (answer) {
    activity_ms_ = now;
  } else if (now - activity_ms_ >= 1001) {
    state_ = kListening;
  }
}

bool ZintarDecoder::DetectBroadcaster() {
  if (state_ != kDetected) return false;
  const bool answer = dsss_decoder_->DetectBroadcaster();
  ApplyActivityRule(answer);
  return answer;
}

bool ZintarDecoder::GetToken(audio_vesknet::VesknetDecodeResults* results) {
  if (state_ != kDetected) return false;
  const bool answer = dsss_decoder_->GetToken(results);
  ApplyActivityRule(answer);
  return answer;
}

void ZintarDecoder::WipeInternalData() { dsss_decoder_->WipeInternalData(); }

int ZintarDecoder::HistoryFrames() const {
  return kHistoryCapacity / zintar_detector_->num_channels();
}

int ZintarDecoder::GetMaxSafeInputSize() const {
  int frames = dsss_decoder_->max_buffer_size() - dsss_decoder_->buffered_input_frames();
  // While listening, a block that wakes the decoder reaches it only through
  // the history.
  if (state_ == kListening) frames = std::min(frames, HistoryFrames());
  return std::max(0, frames) * dsss_decoder_->num_channels();
}

int ZintarDecoder::token_size() const {
  return dsss_decoder_->symbol_wave_coder().params().bits_per_symbol *
         dsss_decoder_->params().symbols_in_token / 8;
}

}  // namespace audio_modem
