#include "tools/vesk/decode_command.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <ostream>

#include "tools/common/hex_bytes.h"
#include "tools/vesk/dsss_options.h"
#include "tools/vesk/dtmf_options.h"

namespace vesk_tool {
namespace {

constexpr char kUsage[] =
    "usage: vesk decode [--dtmf] [options] INPUT\n"
    "       vesk decode [--dtmf] [options] - < audio\n";
constexpr char kDescription[] =
    "Decodes an audio file (any format libsndfile reads; float samples are scaled to 16 bits),\n"
    "or standard input with -: a stream with a header (WAV and the like), else headerless\n"
    "signed 16-bit little-endian PCM at --rate and --channels. Prints each token once, with the\n"
    "stream time at which it was found. Exit status: 0 when a token was found, 1 when none,\n"
    "2 on an error.\n\n";

// Frames read from the input per decoder feed.
constexpr int64_t kBlockFrames = 4096;

// A progress line on a terminal, for inputs this long or longer, seconds.
constexpr double kProgressMinSeconds = 10.0;

std::string InputName(const DecodeRequest& request) {
  return request.input == "-" ? "standard input" : request.input;
}

bool IsProductWaveform(const audio_modem::DsssWaveformConfig& w) {
  const audio_modem::DsssWaveformConfig product;
  return w.number_of_taps == product.number_of_taps && w.code_number == product.code_number &&
         w.sample_rate == product.sample_rate && w.upsampling_factor == product.upsampling_factor &&
         w.baseband_decimation_factor == product.baseband_decimation_factor &&
         w.carrier_frequency == product.carrier_frequency &&
         w.bits_per_symbol == product.bits_per_symbol &&
         w.min_cycles_per_frame == product.min_cycles_per_frame &&
         w.use_quadrature_carrier == product.use_quadrature_carrier;
}

std::string FinishDsss(const OptionParser& parser, DsssOptions* dsss, DecodeRequest* request) {
  const std::string error = FinishDsssOptions(parser, dsss);
  if (!error.empty()) return error;
  audio_modem::DsssDecoderConfig& config = request->dsss;
  if (config.use_zintar && !IsProductWaveform(dsss->waveform)) {
    return "--zintar hears only the product waveform (--preset 48k, no other waveform options)";
  }
  request->crc_bytes = dsss->crc ? 2 : 0;
  config.waveform = dsss->waveform;
  config.use_checksum_symbol = dsss->checksum_symbol;
  config.token_length_bytes = request->message_bytes + request->crc_bytes;
  request->stream.zintar = config.use_zintar;
  return std::string();
}

std::string FinishDtmf(DtmfOptions* dtmf, DecodeRequest* request) {
  const std::string error = FinishDtmfOptions(request->message_bytes, dtmf);
  if (!error.empty()) return error;
  request->crc_bytes = dtmf->crc ? 2 : 0;
  static_cast<audio_modem::DtmfWaveformConfig&>(request->dtmf_config) = dtmf->waveform;
  return std::string();
}

// "\r12% (7.2 of 60.0 s)" on a terminal, rewritten in place; cleared before
// a token line and at the end.
class ProgressLine {
 public:
  ProgressLine(std::ostream& err, double total_s, bool enabled)
      : err_(err), total_s_(total_s), enabled_(enabled) {}
  ~ProgressLine() { Clear(); }

  void Update(double seconds) {
    if (!enabled_) return;
    const int percent = static_cast<int>(100.0 * seconds / total_s_);
    if (percent == shown_percent_) return;
    shown_percent_ = percent;
    char line[96];
    width_ = std::snprintf(line, sizeof(line), "\rvesk decode: %d%% (%.1f of %.1f s)", percent,
                           seconds, total_s_) -
             1;
    err_ << line << std::flush;
  }

  void Clear() {
    if (width_ == 0) return;
    err_ << "\r" << std::string(width_, ' ') << "\r" << std::flush;
    width_ = 0;
    shown_percent_ = -1;
  }

 private:
  std::ostream& err_;
  double total_s_;
  bool enabled_;
  int shown_percent_ = -1;
  int width_ = 0;  // Characters on screen.
};

}  // namespace

ParseOutcome ParseDecodeArgs(const std::vector<std::string>& args, DecodeRequest* request,
                             std::string* message) {
  DecodeRequest& r = *request;
  r.dtmf = WantsDtmf(args);
  r.message_bytes = r.dtmf ? 5 : 6;
  // The command prints tokens only: the broadcaster answer (a few percent of
  // the decoding cost) would go unused.
  r.stream.detect_broadcaster = false;
  bool raw = false;
  DsssOptions dsss;
  DtmfOptions dtmf;
  OptionParser parser;
  parser.AddInt("message-bytes", &r.message_bytes, "message bytes per token (check bytes apart)")
      .Range(1, kMaxMessageBytes);
  parser.AddFlag("json", &r.json,
                 "one JSON object per token per line: {\"time\": s, \"message\": hex, "
                 "\"modem\": \"dsss\"|\"dtmf\"}");
  parser.AddFlag("raw", &raw, "the input is headerless 16-bit PCM, whatever it starts with");
  parser.AddInt("rate", &r.input_options.raw_rate, "sample rate of headerless input, Hz")
      .Range(kMinInputRate, kMaxInputRate)
      .Placeholder("HZ");
  parser
      .AddInt("channels", &r.input_options.raw_channels, "interleaved channels of headerless input")
      .Range(1, kMaxInputChannels);
  parser.AddInt("chunk-bytes", &r.stream.chunk_bytes, "bytes of PCM per decoder call")
      .Range(2, 1 << 20);
  if (r.dtmf) {
    AddDtmfOptions(&parser, &dtmf);
    parser
        .AddFloat("buffer-tokens", &r.dtmf_config.buffer_length_tokens,
                  "history, in token durations")
        .Range(1, 100);
    parser.AddInt("tokens-per-call", &r.dtmf_config.max_tokens_per_call, "tokens per request")
        .Range(1, audio_modem::kMaxDtmfTokensPerCall);
    parser.AddFlag("excision", &r.dtmf_config.narrowband_excision,
                   "notch steady tones between the modem's tones out of the input");
  } else {
    AddDtmfSwitch(&parser, &r.dtmf);
    AddDsssOptions(&parser, &dsss);
    audio_modem::DsssDecoderConfig& c = r.dsss;
    parser.AddFloat("acquisition-window", &c.acquisition_window_seconds, "acquisition window, s")
        .Range(0.05, 10)
        .Placeholder("S");
    parser.AddFloat("threshold", &c.broadcaster_threshold, "broadcaster detection threshold")
        .Range(0, 1000);
    parser.AddFloat("buffer-tokens", &c.buffer_length_tokens, "history, in token durations")
        .Range(1, 100);
    parser.AddInt("tokens-per-call", &c.max_tokens_per_call, "tokens per request")
        .Range(1, audio_vesknet::VesknetDecoderParams().max_candidates_rank);
    parser.AddFlag("design-filter", &c.design_baseband_filter, "designed baseband low-pass");
    parser.AddFlag("excision", &c.narrowband_excision,
                   "notch steady tones in the DSSS band out of the input (not with --zintar)");
    parser.AddFlag("zintar", &c.use_zintar,
                   "zintar listening mode: hears only the 48k preset, needs >= 36994 Hz input, "
                   "no Doppler tolerance beyond about 0.1%");
  }
  std::string error;
  if (!parser.Parse(args, &error)) return UsageError("decode", error, kUsage, message);
  if (parser.help_requested()) {
    *message = std::string(kUsage) + kDescription + parser.Help();
    return ParseOutcome::kHelp;
  }
  if (parser.positional().size() != 1) {
    return UsageError("decode", "give one input: a file name, or - for standard input", kUsage,
                      message);
  }
  r.input = parser.positional()[0];
  r.rate_given = parser.Given("rate");
  r.channels_given = parser.Given("channels");
  using Raw = AudioInputOptions::Raw;
  r.input_options.raw = raw ? Raw::kAlways : r.input == "-" ? Raw::kIfUnrecognised : Raw::kNever;
  error = r.dtmf ? FinishDtmf(&dtmf, &r) : FinishDsss(parser, &dsss, &r);
  if (!error.empty()) return UsageError("decode", error, kUsage, message);
  return ParseOutcome::kRun;
}

std::unique_ptr<AudioInput> OpenDecodeInput(const DecodeRequest& request, std::string* error) {
  std::unique_ptr<ByteSource> source;
  if (request.input == "-") {
    source = MakeFdSource(STDIN_FILENO, false);
  } else {
    const int fd = open(request.input.c_str(), O_RDONLY);
    if (fd < 0) {
      *error = "cannot read " + request.input + ": " + std::strerror(errno);
      return nullptr;
    }
    source = MakeFdSource(fd, true);
  }
  std::unique_ptr<AudioInput> input =
      AudioInput::Open(std::move(source), request.input_options, error);
  if (input == nullptr) {
    if (*error == kUnrecognisedFormat) {
      *error += " (headerless 16-bit PCM: add --raw, --rate and --channels)";
    }
    *error = InputName(request) + ": " + *error;
  }
  return input;
}

std::unique_ptr<audio_modem::AudioModemDecoder> MakeDecoderForInput(const DecodeRequest& request,
                                                                    const AudioInput& input,
                                                                    std::string* error) {
  const int rate = input.sample_rate();
  const std::string rate_text = input.raw() ? "--rate " + std::to_string(rate)
                                            : "the sample rate of " + InputName(request) + " (" +
                                                  std::to_string(rate) + " Hz)";
  std::unique_ptr<audio_modem::AudioModemDecoder> decoder;
  if (request.dtmf) {
    audio_modem::DtmfDecoderConfig config = request.dtmf_config;
    config.input_sample_rate = static_cast<float>(rate);
    config.num_channels = input.channels();
    *error = CheckTonesBelowNyquist(config, rate, rate_text);
    if (error->empty()) *error = audio_modem::DtmfDecoderConfigError(config);
    if (error->empty()) decoder = audio_modem::MakeDtmfAudioModemDecoder(config);
  } else {
    audio_modem::DsssDecoderConfig config = request.dsss;
    config.input_sample_rate = static_cast<float>(rate);
    config.num_channels = input.channels();
    *error = CheckCarrierBelowNyquist(config.waveform, rate, rate_text);
    if (error->empty()) *error = audio_modem::DsssDecoderConfigError(config);
    if (error->empty()) decoder = audio_modem::MakeDsssAudioModemDecoder(config);
  }
  if (decoder == nullptr && error->empty()) *error = "the decoder refused the configuration";
  return error->empty() ? std::move(decoder) : nullptr;
}

std::string FormatToken(const FoundToken& token, bool json, bool dtmf) {
  char line[128];
  const std::string hex = ToHex(token.bytes);
  if (json) {
    std::snprintf(line, sizeof(line), "{\"time\": %.3f, \"message\": \"%s\", \"modem\": \"%s\"}",
                  token.time_s, hex.c_str(), dtmf ? "dtmf" : "dsss");
  } else {
    std::snprintf(line, sizeof(line), "%9.3f s  %s", token.time_s, hex.c_str());
  }
  return line;
}

DecodeSummary DecodeStream(const DecodeRequest& request, AudioInput* input,
                           audio_modem::AudioModemDecoder* decoder,
                           const std::function<void(const FoundToken&)>& on_token,
                           const std::function<void(double)>& on_progress) {
  StreamDecoder stream(decoder, input->sample_rate(), input->channels(), request.message_bytes,
                       request.crc_bytes, request.stream);
  DecodeSummary summary;
  const auto report = [&](const std::vector<FoundToken>& tokens) {
    for (const FoundToken& token : tokens) on_token(token);
    summary.tokens += static_cast<int>(tokens.size());
  };
  std::vector<int16_t> block;
  while (input->Read(kBlockFrames, &block) > 0) {
    report(stream.Feed(block.data(), static_cast<int64_t>(block.size())));
    on_progress(stream.time_s());
  }
  report(stream.Finish());
  summary.seconds = stream.time_s();
  return summary;
}

void ReportDecode(const DecodeSummary& summary, const AudioInput& input, std::ostream& err) {
  char line[128];
  std::snprintf(line, sizeof(line), "vesk decode: %d %s in %.3f s of audio\n", summary.tokens,
                summary.tokens == 1 ? "token" : "tokens", summary.seconds);
  err << line;
  if (input.clipped_samples() > 0) {
    err << "vesk decode: " << input.clipped_samples()
        << " samples lay beyond full scale and were clipped\n";
  }
  if (input.ignored_bytes() > 0) {
    err << "vesk decode: ignored " << input.ignored_bytes()
        << (input.ignored_bytes() == 1 ? " byte" : " bytes") << " at the end (not a whole frame)\n";
  }
}

int RunDecode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
  DecodeRequest request;
  std::string message;
  const int status =
      ReportParseOutcome(ParseDecodeArgs(args, &request, &message), message, out, err);
  if (status >= 0) return status;
  std::string error;
  const std::unique_ptr<AudioInput> input = OpenDecodeInput(request, &error);
  std::unique_ptr<audio_modem::AudioModemDecoder> decoder;
  if (input != nullptr) decoder = MakeDecoderForInput(request, *input, &error);
  if (decoder == nullptr) {
    err << "vesk decode: " << error << "\n";
    return kExitError;
  }
  if (!input->raw() && (request.rate_given || request.channels_given)) {
    err << "vesk decode: --rate and --channels describe headerless input; " << InputName(request)
        << " is " << input->format() << ", " << input->sample_rate() << " Hz, " << input->channels()
        << (input->channels() == 1 ? " channel\n" : " channels\n");
  }
  const double total_s =
      input->frames() >= 0 ? static_cast<double>(input->frames()) / input->sample_rate() : 0.0;
  ProgressLine progress(err, total_s, total_s >= kProgressMinSeconds && isatty(STDERR_FILENO));
  const DecodeSummary summary = DecodeStream(
      request, input.get(), decoder.get(),
      [&](const FoundToken& token) {
        progress.Clear();
        out << FormatToken(token, request.json, request.dtmf) << std::endl;
      },
      [&](double seconds) { progress.Update(seconds); });
  progress.Clear();
  ReportDecode(summary, *input, err);
  return summary.tokens > 0 ? kExitSuccess : kExitNothingFound;
}

}  // namespace vesk_tool
