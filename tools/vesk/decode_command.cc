// vesk decode: decodes a WAV file, or raw 16-bit PCM from standard input, in
// chunks as a host app would, printing each token with the time it was found.

#include <cstdio>
#include <iostream>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "tools/vesk/commands.h"
#include "tools/vesk/dsss_options.h"
#include "tools/vesk/dtmf_options.h"
#include "tools/vesk/option_parser.h"
#include "tools/vesk/stream_decoding.h"
#include "tools/vesk/wav_io.h"

namespace vesk_tool {
namespace {

void Print(const std::vector<FoundToken>& tokens, std::ostream& out) {
  for (const FoundToken& token : tokens) {
    char line[64];
    std::snprintf(line, sizeof(line), "%9.3f s  ", token.time_s);
    out << line << ToHex(std::vector<unsigned char>(token.bytes.begin(), token.bytes.end()))
        << "\n";
  }
  out.flush();
}

}  // namespace

int RunDecode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
  const bool dtmf = WantsDtmf(args);
  int message_bytes = dtmf ? 5 : 6;
  int rate = 44100;
  int channels = 1;
  bool help = false;
  DsssOptions dsss;
  DtmfOptions dtmf_options;
  audio_modem::DsssDecoderConfig config;
  audio_modem::DtmfDecoderConfig dtmf_config;
  StreamDecodingOptions stream;
  OptionParser parser;
  parser.AddInt("message-bytes", &message_bytes, "message bytes per token");
  if (dtmf) {
    AddDtmfOptions(&parser, &dtmf_options);
    parser.AddFloat("buffer-tokens", &dtmf_config.buffer_length_tokens,
                    "history, in token durations");
    parser.AddInt("tokens-per-call", &dtmf_config.max_tokens_per_call,
                  "tokens per request, 1 to 6");
  } else {
    AddDsssOptions(&parser, &dsss);
    parser.AddFloat("acquisition-window", &config.acquisition_window_seconds,
                    "acquisition window, seconds");
    parser.AddFloat("threshold", &config.broadcaster_threshold, "broadcaster detection threshold");
    parser.AddFloat("buffer-tokens", &config.buffer_length_tokens, "history, in token durations");
    parser.AddInt("tokens-per-call", &config.max_tokens_per_call, "tokens per request, 1 to 6");
    parser.AddFlag("design-filter", &config.design_baseband_filter, "designed baseband low-pass");
    parser.AddFlag("zintar", &config.use_zintar,
                   "zintar listening mode: hears only the 48k preset, needs >= 36994 Hz input, "
                   "no Doppler tolerance beyond about 0.1%");
  }
  parser.AddInt("rate", &rate, "sample rate of raw standard input, Hz");
  parser.AddInt("channels", &channels, "interleaved channels of raw standard input");
  parser.AddInt("chunk-bytes", &stream.chunk_bytes, "bytes of PCM per decoder call");
  parser.AddFlag("help", &help, "show this help");
  const std::string usage =
      "usage: vesk decode [options] INPUT.wav\n"
      "       vesk decode [options] - < raw-16-bit-pcm\n";
  std::string error;
  if (!parser.Parse(args, &error)) {
    err << "vesk decode: " << error << "\n" << usage;
    return 2;
  }
  if (help) {
    out << usage << "Prints each token once, with the stream time at which it was found.\n\n"
        << parser.Help();
    return 0;
  }
  if (parser.positional().size() != 1) {
    err << "vesk decode: give one input file, or - for raw PCM on standard input\n" << usage;
    return 2;
  }
  error = dtmf ? FinishDtmfOptions(message_bytes, &dtmf_options) : FinishDsssOptions(parser, &dsss);
  if (error.empty() && stream.chunk_bytes < 2) error = "--chunk-bytes must be at least 2";
  const std::string& path = parser.positional()[0];
  PcmAudio audio;
  if (error.empty() && path != "-") {
    if (!ReadAudioFile(path, &audio, &error)) {
      err << "vesk decode: " << error << "\n";
      return 1;
    }
    rate = audio.sample_rate;
    channels = audio.channels;
  }
  const bool crc = dtmf ? dtmf_options.crc : dsss.crc;
  std::unique_ptr<audio_modem::AudioModemDecoder> decoder;
  if (dtmf) {
    static_cast<audio_modem::DtmfWaveformConfig&>(dtmf_config) = dtmf_options.waveform;
    dtmf_config.input_sample_rate = static_cast<float>(rate);
    dtmf_config.num_channels = channels;
    if (error.empty()) error = audio_modem::DtmfDecoderConfigError(dtmf_config);
    if (error.empty()) decoder = audio_modem::MakeDtmfAudioModemDecoder(dtmf_config);
  } else {
    config.waveform = dsss.waveform;
    config.use_checksum_symbol = dsss.checksum_symbol;
    config.token_length_bytes = message_bytes + (crc ? 2 : 0);
    config.input_sample_rate = static_cast<float>(rate);
    config.num_channels = channels;
    if (error.empty()) error = audio_modem::DsssDecoderConfigError(config);
    if (error.empty()) decoder = audio_modem::MakeDsssAudioModemDecoder(config);
  }
  if (!error.empty() || decoder == nullptr) {
    err << "vesk decode: " << (error.empty() ? "the envelope was refused" : error) << "\n";
    return 2;
  }
  stream.zintar = !dtmf && config.use_zintar;
  StreamDecoder stream_decoder(decoder.get(), rate, channels, message_bytes, crc ? 2 : 0, stream);
  int found = 0;
  if (path != "-") {
    const std::vector<FoundToken> tokens =
        stream_decoder.Feed(audio.samples.data(), static_cast<int64_t>(audio.samples.size()));
    Print(tokens, out);
    found = static_cast<int>(tokens.size());
  } else {
    std::vector<int16_t> block(8192 * channels);
    size_t frames;
    while ((frames = std::fread(block.data(), 2 * channels, block.size() / channels, stdin)) > 0) {
      const std::vector<FoundToken> tokens =
          stream_decoder.Feed(block.data(), static_cast<int64_t>(frames) * channels);
      Print(tokens, out);
      found += static_cast<int>(tokens.size());
    }
  }
  err << "vesk decode: " << found << (found == 1 ? " token" : " tokens") << " in "
      << stream_decoder.time_s() << " s of audio\n";
  return 0;
}

}  // namespace vesk_tool
