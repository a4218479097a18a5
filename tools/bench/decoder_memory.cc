// Memory of a decoder over a long stream: heap in use and peak resident set
// after each stretch of noise fed as a host app feeds it (4096-byte chunks,
// tokens requested every 0.25 s). A bounded decoder shows flat figures once
// its history is full.
//
//   decoder_memory [--minutes M] [--modem dsss|zintar|dtmf] [--mic-rate HZ]

#include <malloc.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "tools/common/stream_decoding.h"

namespace {

// Peak resident set size of this process, KiB (VmHWM).
long PeakResidentKib() {
  std::ifstream status("/proc/self/status");
  std::string line;
  while (std::getline(status, line)) {
    if (line.rfind("VmHWM:", 0) == 0) return std::atol(line.c_str() + 6);
  }
  return -1;
}

long HeapInUseKib() { return static_cast<long>(mallinfo2().uordblks / 1024); }

}  // namespace

int main(int argc, char** argv) {
  double minutes = 60;
  std::string modem = "dsss";
  int rate = 44100;
  for (int i = 1; i + 1 < argc; i += 2) {
    if (!std::strcmp(argv[i], "--minutes"))
      minutes = std::atof(argv[i + 1]);
    else if (!std::strcmp(argv[i], "--modem"))
      modem = argv[i + 1];
    else if (!std::strcmp(argv[i], "--mic-rate"))
      rate = std::atoi(argv[i + 1]);
  }
  const long heap_before = HeapInUseKib();
  std::unique_ptr<audio_modem::AudioModemDecoder> decoder;
  vesk_tool::StreamDecodingOptions options;
  if (modem == "dtmf") {
    audio_modem::DtmfDecoderConfig config;
    config.input_sample_rate = static_cast<float>(rate);
    decoder = audio_modem::MakeDtmfAudioModemDecoder(config);
  } else {
    audio_modem::DsssDecoderConfig config;
    config.input_sample_rate = static_cast<float>(rate);
    config.use_zintar = modem == "zintar";
    options.zintar = config.use_zintar;
    decoder = audio_modem::MakeDsssAudioModemDecoder(config);
  }
  // DSSS tokens: 6 bytes and CRC; DTMF tokens: 5 bytes and a checksum symbol.
  vesk_tool::StreamDecoder stream(decoder.get(), rate, 1, modem == "dtmf" ? 5 : 6,
                                  modem == "dtmf" ? 0 : 2, options);

  std::printf("### Memory of the %s decoder over %g minutes of %d Hz noise\n\n", modem.c_str(),
              minutes, rate);
  std::printf("| minutes fed | decoder heap in use KiB | peak resident KiB |\n|---|---|---|\n");
  std::vector<int16_t> second(rate);
  uint32_t seed = 11;
  int tokens = 0;
  for (int s = 1; s <= minutes * 60; ++s) {
    for (int16_t& v : second) {
      seed = seed * 1664525u + 1013904223u;
      v = static_cast<int16_t>(static_cast<int32_t>(seed >> 16) % 4000 - 2000);
    }
    tokens += static_cast<int>(stream.Feed(second.data(), rate).size());
    if (s == 10 || s == 60 || (s % 600 == 0)) {
      std::printf("| %g | %ld | %ld |\n", s / 60.0, HeapInUseKib() - heap_before,
                  PeakResidentKib());
      std::fflush(stdout);
    }
  }
  std::printf("\n%d tokens reported (noise only: should be 0)\n", tokens);
  return 0;
}
