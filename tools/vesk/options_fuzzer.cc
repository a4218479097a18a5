// Fuzz target: the vesk tool's options. The input is a command (first byte)
// and its arguments (the rest, split at zero bytes). What the parser accepts
// must run: an encode request encodes, a decode request builds its decoder
// for raw input at the request's rate and decodes a little of it. What it
// refuses must say why.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "base/fuzz_input.h"
#include "tools/common/audio_input.h"
#include "tools/vesk/decode_command.h"
#include "tools/vesk/demo_command.h"
#include "tools/vesk/encode_command.h"

namespace {

void Require(bool condition) {
  if (!condition) __builtin_trap();
}

void Encode(const std::vector<std::string>& args) {
  vesk_tool::EncodeRequest request;
  std::string message;
  const vesk_tool::ParseOutcome outcome = vesk_tool::ParseEncodeArgs(args, &request, &message);
  Require(outcome == vesk_tool::ParseOutcome::kRun || !message.empty());
  if (outcome != vesk_tool::ParseOutcome::kRun) return;
  vesk_tool::EncodedToken token;
  Require(vesk_tool::EncodeToken(request, &token));
  vesk_tool::OutputBytes(request, token);
}

void Decode(const std::vector<std::string>& args) {
  vesk_tool::DecodeRequest request;
  std::string message;
  const vesk_tool::ParseOutcome outcome = vesk_tool::ParseDecodeArgs(args, &request, &message);
  Require(outcome == vesk_tool::ParseOutcome::kRun || !message.empty());
  if (outcome != vesk_tool::ParseOutcome::kRun) return;
  // A tenth of a second of raw input as the request describes it.
  vesk_tool::AudioInputOptions raw = request.input_options;
  raw.raw = vesk_tool::AudioInputOptions::Raw::kAlways;
  std::vector<uint8_t> bytes(2 * static_cast<size_t>(raw.raw_rate / 10) * raw.raw_channels, 1);
  std::string error;
  const std::unique_ptr<vesk_tool::AudioInput> input = vesk_tool::AudioInput::Open(
      vesk_tool::MakeMemorySource(bytes.data(), bytes.size()), raw, &error);
  Require(input != nullptr);
  const std::unique_ptr<audio_modem::AudioModemDecoder> decoder =
      vesk_tool::MakeDecoderForInput(request, *input, &error);
  Require(decoder != nullptr || !error.empty());
  if (decoder == nullptr) return;
  std::vector<int16_t> samples;
  input->Read(4096, &samples);
  decoder->ProcessSamples(std::vector<float>(samples.begin(), samples.end()));
  audio_modem::DecodeResults results;
  decoder->GetTokens(&results, request.message_bytes, request.crc_bytes);
}

void Demo(const std::vector<std::string>& args) {
  vesk_tool::DemoRequest request;
  std::string message;
  const vesk_tool::ParseOutcome outcome = vesk_tool::ParseDemoArgs(args, &request, &message);
  Require(outcome == vesk_tool::ParseOutcome::kRun || !message.empty());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  base::SilenceLogsForFuzzing();
  if (size == 0) return 0;
  std::vector<std::string> args(1);
  for (size_t i = 1; i < size; ++i) {
    if (data[i] == 0) {
      args.emplace_back();
    } else {
      args.back().push_back(static_cast<char>(data[i]));
    }
  }
  switch (data[0] % 3) {
    case 0:
      Encode(args);
      break;
    case 1:
      Decode(args);
      break;
    default:
      Demo(args);
  }
  return 0;
}
