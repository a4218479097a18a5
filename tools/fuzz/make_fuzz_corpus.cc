// Writes the seed corpora of the fuzz targets from real encoder output: the
// product configurations of each modem, encoded tokens fed through the
// decoders in recording-sized pieces. Run by scripts/make-fuzz-corpus.sh.
//
// Usage: make_fuzz_corpus <repository root>  (run from the root: the seeds of
// the tools' targets go under tools/, the others under src/)

#include <cstdint>
#include <fstream>
#include <iostream>
#include <string>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "base/fuzz_input.h"
#include "location/pellam/cpp/audio/jni/jni_fuzz_header.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "social/tandry/audio/fuzz_modem_config.h"
#include "tools/common/audio_output.h"

namespace {

using audio_modem::FuzzModemConfig;

const std::vector<uint8_t> kMessage = {0x01, 0x23, 0x45, 0x67, 0x89, 0xAB};

// A token of `config` as 16-bit samples at the microphone's rate (the
// encoder's rate is set to it), between short stretches of silence, with
// every channel alike.
std::vector<int16_t> Heard(const FuzzModemConfig& config) {
  std::unique_ptr<audio_modem::AudioModemEncoder> encoder =
      config.dtmf ? audio_modem::MakeDtmfAudioModemEncoder(config.ToDtmfEncoderConfig())
                  : audio_modem::MakeDsssAudioModemEncoder(config.ToDsssEncoderConfig());
  const std::vector<uint8_t> message(kMessage.begin(), kMessage.begin() + config.message_bytes);
  std::vector<float> audio;
  encoder->Encode(message, &audio, config.crc_check_bytes);
  const size_t silence = static_cast<size_t>(config.microphone_rate / 20);
  std::vector<int16_t> pcm(silence * config.channels, 0);
  for (const float s : audio) pcm.insert(pcm.end(), config.channels, audio_dsp::FloatToPcm16(s));
  pcm.resize(pcm.size() + silence * config.channels, 0);
  return pcm;
}

struct Seed {
  std::string name;
  FuzzModemConfig config;
};

std::vector<Seed> Configurations() {
  FuzzModemConfig dsss = FuzzModemConfig::Dsss();
  FuzzModemConfig coder44100 = dsss;
  coder44100.dsss = audio_modem::Waveform44100();
  coder44100.broadcast_sample_rate = 44100;
  coder44100.microphone_rate = 44100;
  coder44100.channels = 2;
  FuzzModemConfig listening = dsss;
  listening.listening_mode = true;
  FuzzModemConfig dtmf = FuzzModemConfig::Dtmf();
  return {{"dsss", dsss},
          {"dsss_44k_coder_stereo", coder44100},
          {"listening", listening},
          {"dtmf", dtmf}};
}

bool Save(const std::string& path, const base::FuzzSeed& seed) {
  std::ofstream out(path, std::ios::binary);
  out.write(reinterpret_cast<const char*>(seed.bytes().data()),
            static_cast<std::streamsize>(seed.bytes().size()));
  std::cout << path << ": " << seed.bytes().size() << " bytes\n";
  return static_cast<bool>(out);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: make_fuzz_corpus <repository root>\n";
    return 2;
  }
  const std::string src = std::string(argv[1]) + "/src/";
  const std::string front = src + "social/tandry/audio/";
  bool ok = true;
  int kind = 0;
  for (const Seed& s : Configurations()) {
    const std::vector<int16_t> pcm = Heard(s.config);

    base::FuzzSeed decoder;
    audio_modem::WriteFuzzModemConfig(s.config, &decoder);
    audio_modem::WriteFuzzDecoderCalls(pcm, s.config.channels, 4096, &decoder);
    ok &= Save(front + "audio_modem_decoder_fuzzer_corpus/" + s.name, decoder);

    base::FuzzSeed encoder;
    audio_modem::WriteFuzzModemConfig(s.config, &encoder);
    encoder.Bool(false);  // The configured message length.
    for (int i = 0; i < s.config.message_bytes; ++i) encoder.Byte(kMessage[i]);
    ok &= Save(front + "audio_modem_encoder_fuzzer_corpus/" + s.name, encoder);

    // The C interface's fuzz target: the configuration, the poll interval
    // (0.25 s as 32 / 128) and hold (3 s as 48 / 16), the message, the calls.
    base::FuzzSeed c_api;
    audio_modem::WriteFuzzModemConfig(s.config, &c_api);
    c_api.Byte(32);
    c_api.Byte(48);
    for (int i = 0; i < s.config.message_bytes; ++i) c_api.Byte(kMessage[i]);
    audio_modem::WriteFuzzDecoderCalls(pcm, s.config.channels, 4096, &c_api);
    ok &= Save(src + "vesk/vesk_fuzzer_corpus/" + s.name, c_api);

    // The JNI fuzz target knows the same four configurations by number
    // (DSSS, 44.1 kHz coder, listening mode, DTMF), at its own microphone
    // rates: 44.1 kHz except for the listening mode.
    vesk_jni::JniFuzzHeader header;
    header.kind = kind;
    header.channels = s.config.channels;
    FuzzModemConfig at_jni_rate = s.config;
    at_jni_rate.microphone_rate = header.kind == 2 ? 48000 : 44100;
    at_jni_rate.broadcast_sample_rate = static_cast<int>(at_jni_rate.microphone_rate);
    at_jni_rate.dtmf_waveform.sample_rate = at_jni_rate.microphone_rate;
    base::FuzzSeed jni;
    vesk_jni::WriteJniFuzzHeader(header, &jni);
    audio_modem::WriteFuzzDecoderCalls(Heard(at_jni_rate), header.channels, 4096, &jni);
    ok &= Save(src + "location/pellam/cpp/audio/jni/jni_fuzzer_corpus/" + s.name, jni);
    ++kind;
  }

  // The audio reader: the options byte (bit 0-1 how headerless input is
  // taken, bit 2 8 kHz, bits 3 on channels - 1), then a DTMF token as a
  // 16-bit stereo WAV, a float WAV, and raw PCM.
  const std::vector<int16_t> dtmf = Heard(FuzzModemConfig::Dtmf());
  std::vector<int16_t> stereo;
  for (size_t i = 0; i < dtmf.size() / 4; ++i) stereo.insert(stereo.end(), {dtmf[i], dtmf[i]});
  std::vector<float> floats(dtmf.begin(), dtmf.begin() + dtmf.size() / 4);
  for (float& f : floats) f /= 32768.0f;
  const std::string reader = std::string(argv[1]) + "/tools/common/audio_input_fuzzer_corpus/";
  const struct {
    const char* name;
    uint8_t options;
    std::vector<uint8_t> bytes;
  } inputs[] = {
      {"wav16_stereo", 1, vesk_tool::WavBytes(stereo, 44100, 2)},
      {"wav_float", 1, vesk_tool::WavBytes(floats, 44100, 1)},
      {"raw", 2, std::vector<uint8_t>(reinterpret_cast<const uint8_t*>(dtmf.data()),
                                      reinterpret_cast<const uint8_t*>(dtmf.data()) +
                                          dtmf.size() / 2)},
  };
  for (const auto& input : inputs) {
    base::FuzzSeed seed;
    seed.Byte(input.options);
    for (const uint8_t byte : input.bytes) seed.Byte(byte);
    ok &= Save(reader + input.name, seed);
  }

  // The tool's options: a command byte (0 encode, 1 decode, 2 demo) and the
  // arguments, each ended by a zero byte; command lines from the README.
  const std::string options = std::string(argv[1]) + "/tools/vesk/options_fuzzer_corpus/";
  const struct {
    const char* name;
    uint8_t command;
    std::vector<std::string> args;
  } lines[] = {
      {"encode", 0, {"token.wav", "--message", "0123456789ab", "--repeat", "3"}},
      {"encode_dtmf_raw", 0, {"-", "--dtmf", "--raw", "--message", "0102030405"}},
      {"encode_44k", 0, {"-", "--preset", "44k", "--broadcast-rate", "48000"}},
      {"decode_raw", 1, {"-", "--raw", "--rate", "44100"}},
      {"decode_dtmf_json", 1, {"dtmf.wav", "--dtmf", "--json"}},
      {"decode_zintar", 1, {"-", "--zintar", "--rate", "48000", "--channels", "2"}},
      {"demo", 2, {"--snr", "-10", "--speed", "1.002"}},
      {"demo_dtmf", 2, {"--dtmf", "--snr", "-10"}},
  };
  for (const auto& line : lines) {
    base::FuzzSeed seed;
    seed.Byte(line.command);
    for (size_t i = 0; i < line.args.size(); ++i) {
      if (i > 0) seed.Byte(0);
      for (const char c : line.args[i]) seed.Byte(static_cast<uint8_t>(c));
    }
    ok &= Save(options + line.name, seed);
  }
  return ok ? 0 : 1;
}
