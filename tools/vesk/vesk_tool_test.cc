// The vesk tool as users run it: the built binary in pipes and on files of
// every sample format, its exit statuses, the messages of refused options,
// --json parsed back, the help and the progress line.

#include <sndfile.h>
#include <unistd.h>

#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tools/common/audio_input.h"
#include "tools/common/subprocess.h"

namespace vesk_tool {
namespace {

const char kMessage[] = "0123456789ab";

ProcessResult Vesk(const std::vector<std::string>& args, const std::string& input = "",
                   bool stderr_on_terminal = false) {
  ProcessOptions options;
  options.input = input;
  options.stderr_on_terminal = stderr_on_terminal;
  return RunProcess(VESK_BINARY, args, options);
}

// A directory of this test process alone (ctest runs tests in parallel
// processes), made before the first test and removed with its files after
// the last.
class TempDirectory : public ::testing::Environment {
 public:
  void SetUp() override {
    std::string pattern = ::testing::TempDir() + "/vesk_tool_test_XXXXXX";
    ASSERT_NE(mkdtemp(pattern.data()), nullptr) << pattern;
    path_ = pattern;
  }
  void TearDown() override {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
  }
  const std::string& path() const { return path_; }

 private:
  std::string path_;
};

TempDirectory* const temp_directory =
    static_cast<TempDirectory*>(::testing::AddGlobalTestEnvironment(new TempDirectory));

// A file of this test alone.
std::string TempPath(const std::string& name) {
  return temp_directory->path() + "/" +
         ::testing::UnitTest::GetInstance()->current_test_info()->name() + "_" + name;
}

// Interleaved float samples of a sound file, unscaled, with its rate and
// channel count.
struct Sound {
  std::vector<float> samples;
  int rate = 0;
  int channels = 0;
};

Sound ReadSound(const std::string& path) {
  SF_INFO info = {};
  SNDFILE* file = sf_open(path.c_str(), SFM_READ, &info);
  EXPECT_NE(file, nullptr) << path << ": " << sf_strerror(nullptr);
  Sound sound;
  if (file == nullptr) return sound;
  sound.rate = info.samplerate;
  sound.channels = info.channels;
  sound.samples.resize(static_cast<size_t>(info.frames * info.channels));
  sf_readf_float(file, sound.samples.data(), info.frames);
  sf_close(file);
  return sound;
}

void WriteSound(const std::string& path, const Sound& sound, int format) {
  SF_INFO info = {};
  info.samplerate = sound.rate;
  info.channels = sound.channels;
  info.format = format;
  SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
  ASSERT_NE(file, nullptr) << path << ": " << sf_strerror(nullptr);
  // Float data beyond full scale must stay as it is.
  sf_command(file, SFC_SET_CLIPPING, nullptr, SF_FALSE);
  ASSERT_EQ(sf_writef_float(file, sound.samples.data(),
                            static_cast<sf_count_t>(sound.samples.size() / sound.channels)),
            static_cast<sf_count_t>(sound.samples.size() / sound.channels));
  sf_close(file);
}

std::vector<std::string> operator+(std::vector<std::string> a, const std::vector<std::string>& b) {
  a.insert(a.end(), b.begin(), b.end());
  return a;
}

// The encoder's own samples (no 16-bit rounding) for `args`, one token.
Sound EncodedToken(std::vector<std::string> args) {
  const std::string path = TempPath("vesk_tool_test_token.wav");
  args.insert(args.end(), {"--float", "--repeat", "1", path});
  const ProcessResult run = Vesk(std::vector<std::string>{"encode"} + args);
  EXPECT_EQ(run.exit_status, 0) << run.err;
  return ReadSound(path);
}

// What the microphone of `vesk demo` hears, as 16-bit PCM.
DecodedAudio Heard(const std::vector<std::string>& demo_args) {
  const std::string path = TempPath("vesk_tool_test_heard.wav");
  const ProcessResult run = Vesk(std::vector<std::string>{"demo", "--save", path} + demo_args);
  EXPECT_EQ(run.exit_status, 0) << run.out << run.err;
  const Sound sound = ReadSound(path);
  DecodedAudio audio;
  audio.sample_rate = sound.rate;
  audio.channels = sound.channels;
  for (const float s : sound.samples) {
    audio.samples.push_back(static_cast<int16_t>(std::lround(s * 32768.0f)));
  }
  return audio;
}

std::string RawBytes(const std::vector<int16_t>& samples) {
  std::string bytes;
  for (const int16_t s : samples) {
    bytes += static_cast<char>(s & 0xFF);
    bytes += static_cast<char>((s >> 8) & 0xFF);
  }
  return bytes;
}

TEST(VeskToolTest, EncodeToAPipeAndDecodeFromOne) {
  const std::string vesk = VESK_BINARY;
  const ProcessResult piped =
      RunShell(vesk + " encode - --repeat 1 --message " + kMessage + " | " + vesk + " decode -");
  EXPECT_EQ(piped.exit_status, 0) << piped.err;
  EXPECT_EQ(piped.out, std::string("    0.725 s  ") + kMessage + "\n");
  EXPECT_NE(piped.err.find("wrote standard output: 16-bit WAV, 48000 Hz"), std::string::npos)
      << piped.err;
  // Standard output carries exactly the file's bytes.
  const std::string path = TempPath("vesk_tool_test_pipe.wav");
  ASSERT_EQ(Vesk({"encode", "--repeat", "1", path}).exit_status, 0);
  const ProcessResult to_stdout = Vesk({"encode", "--repeat", "1", "-"});
  FILE* file = std::fopen(path.c_str(), "rb");
  ASSERT_NE(file, nullptr);
  std::string from_file(to_stdout.out.size() + 1, '\0');
  from_file.resize(std::fread(&from_file[0], 1, from_file.size(), file));
  std::fclose(file);
  EXPECT_EQ(to_stdout.out, from_file);
  EXPECT_EQ(to_stdout.out.substr(0, 4), "RIFF");
  // --raw: headerless 16-bit, the transition and one token.
  const ProcessResult raw = Vesk({"encode", "--raw", "--repeat", "1", "-"});
  EXPECT_EQ(raw.out.size(), 2u * (240 + 17 * 2032));
  EXPECT_EQ(Vesk({"decode", "-", "--rate", "48000"}, raw.out).exit_status, 0);
}

// The README's line: arecord -t raw -f S16_LE -r 44100 -c 1 | vesk decode - --rate 44100.
// Without -t raw arecord sends a WAV header, which is recognised as well.
TEST(VeskToolTest, DecodesAMicrophoneStreamRawOrWithAHeader) {
  const DecodedAudio heard =
      Heard({"--mic-rate", "44100", "--snr", "20", "--no-reverb", "--speed", "1", "--repeat", "1"});
  ASSERT_EQ(heard.sample_rate, 44100);
  const ProcessResult raw = Vesk({"decode", "-", "--rate", "44100"}, RawBytes(heard.samples));
  EXPECT_EQ(raw.exit_status, 0) << raw.err;
  EXPECT_NE(raw.out.find(kMessage), std::string::npos);
  const std::string path = TempPath("vesk_tool_test_heard.wav");
  FILE* file = std::fopen(path.c_str(), "rb");
  ASSERT_NE(file, nullptr);
  std::string wav(1 << 20, '\0');
  wav.resize(std::fread(&wav[0], 1, wav.size(), file));
  std::fclose(file);
  const ProcessResult with_header = Vesk({"decode", "-"}, wav);
  EXPECT_EQ(with_header.exit_status, 0) << with_header.err;
  EXPECT_EQ(with_header.out, raw.out);
}

TEST(VeskToolTest, DecodesEverySampleFormatLibsndfileWrites) {
  const Sound dsss = EncodedToken({"--message", kMessage});
  ASSERT_EQ(dsss.rate, 48000);
  struct Case {
    const char* name;
    int format;
  };
  const Case cases[] = {
      {"u8.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_U8},
      {"s8.aiff", SF_FORMAT_AIFF | SF_FORMAT_PCM_S8},
      {"s16.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_16},
      {"s24.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_24},
      {"s32.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_32},
      {"f32.wav", SF_FORMAT_WAV | SF_FORMAT_FLOAT},
      {"f64.wav", SF_FORMAT_WAV | SF_FORMAT_DOUBLE},
      {"s16.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_16},
      {"s24.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_24},
      {"f32.au", SF_FORMAT_AU | SF_FORMAT_FLOAT},
  };
  for (const Case& c : cases) {
    const std::string path = TempPath(std::string("vesk_tool_test_") + c.name);
    WriteSound(path, dsss, c.format);
    const ProcessResult run = Vesk({"decode", path});
    EXPECT_EQ(run.exit_status, 0) << c.name << ": " << run.err;
    EXPECT_EQ(run.out, std::string("    0.725 s  ") + kMessage + "\n") << c.name;
    // And through a pipe.
    FILE* file = std::fopen(path.c_str(), "rb");
    ASSERT_NE(file, nullptr);
    std::string bytes(1 << 21, '\0');
    bytes.resize(std::fread(&bytes[0], 1, bytes.size(), file));
    std::fclose(file);
    EXPECT_EQ(Vesk({"decode", "-"}, bytes).out, run.out) << c.name;
  }
  // Lossy: Vorbis keeps the audible DTMF tones (its low-pass may cut 18.5 kHz).
  const Sound dtmf = EncodedToken({"--dtmf", "--message", "0123456789"});
  const std::string ogg = TempPath("vesk_tool_test.ogg");
  WriteSound(ogg, dtmf, SF_FORMAT_OGG | SF_FORMAT_VORBIS);
  const ProcessResult run = Vesk({"decode", "--dtmf", ogg});
  EXPECT_EQ(run.exit_status, 0) << run.err;
  EXPECT_NE(run.out.find("0123456789"), std::string::npos);
}

TEST(VeskToolTest, RatesFrom8To192KilohertzAndUpTo8Channels) {
  const std::vector<std::string> clean = {"--snr", "30", "--no-reverb", "--speed", "1"};
  for (const char* rate : {"8000", "192000"}) {
    // DTMF at 8 kHz (its tones end at 2489 Hz), DSSS at 192 kHz.
    const bool dtmf = std::string(rate) == "8000";
    const std::string path = TempPath("vesk_tool_test_rate.wav");
    const ProcessResult demo =
        Vesk(std::vector<std::string>{"demo", "--mic-rate", rate, "--save", path} + clean +
             (dtmf ? std::vector<std::string>{"--dtmf"} : std::vector<std::string>{}));
    ASSERT_EQ(demo.exit_status, 0) << demo.out << demo.err;
    const ProcessResult run = Vesk(dtmf ? std::vector<std::string>{"decode", "--dtmf", path}
                                        : std::vector<std::string>{"decode", path});
    EXPECT_EQ(run.exit_status, 0) << rate << ": " << run.err;
  }
  const Sound mono = EncodedToken({"--message", kMessage});
  for (const int channels : {8, 9}) {
    Sound many = mono;
    many.channels = channels;
    many.samples.clear();
    for (const float s : mono.samples) many.samples.insert(many.samples.end(), channels, s);
    const std::string path = TempPath("vesk_tool_test_channels.wav");
    WriteSound(path, many, SF_FORMAT_WAV | SF_FORMAT_PCM_16);
    const ProcessResult run = Vesk({"decode", path});
    if (channels == 8) {
      EXPECT_EQ(run.exit_status, 0) << run.err;
      EXPECT_EQ(run.out, std::string("    0.725 s  ") + kMessage + "\n");
    } else {
      EXPECT_EQ(run.exit_status, 2);
      EXPECT_EQ(run.err, "vesk decode: " + path + ": 9 channels are not supported (1 to 8)\n");
    }
  }
  Sound slow = mono;
  slow.rate = 7999;
  const std::string path = TempPath("vesk_tool_test_slow.wav");
  WriteSound(path, slow, SF_FORMAT_WAV | SF_FORMAT_PCM_16);
  EXPECT_EQ(
      Vesk({"decode", path}).err,
      "vesk decode: " + path + ": a sample rate of 7999 Hz is not supported (8000 to 192000 Hz)\n");
  slow.rate = 32000;  // Supported, but below twice the DSSS carrier.
  WriteSound(path, slow, SF_FORMAT_WAV | SF_FORMAT_PCM_16);
  const ProcessResult low = Vesk({"decode", path});
  EXPECT_EQ(low.exit_status, 2);
  EXPECT_EQ(low.err, "vesk decode: the sample rate of " + path +
                         " (32000 Hz) is too low: the carrier (18500 Hz) must lie below half of "
                         "it (16000 Hz)\n");
}

TEST(VeskToolTest, FloatSamplesBeyondFullScaleAreClippedAndCounted) {
  Sound loud = EncodedToken({"--message", kMessage});
  int beyond = 0;
  for (float& s : loud.samples) {
    s *= 3.0f;  // The token peaks at 0.5: now at 1.5.
    beyond += std::fabs(s) > 1.0f;
  }
  ASSERT_GT(beyond, 0);
  const std::string path = TempPath("vesk_tool_test_loud.wav");
  WriteSound(path, loud, SF_FORMAT_WAV | SF_FORMAT_FLOAT);
  const ProcessResult run = Vesk({"decode", path});
  EXPECT_NE(run.err.find("vesk decode: " + std::to_string(beyond) +
                         " samples lay beyond full scale and were clipped\n"),
            std::string::npos)
      << run.err;
}

TEST(VeskToolTest, ExitStatusesAreZeroForATokenOneForNoneTwoForErrors) {
  Sound silence;
  silence.rate = 48000;
  silence.channels = 1;
  silence.samples.assign(48000, 0.0f);
  const std::string path = TempPath("vesk_tool_test_silence.wav");
  WriteSound(path, silence, SF_FORMAT_WAV | SF_FORMAT_PCM_16);
  const ProcessResult none = Vesk({"decode", path});
  EXPECT_EQ(none.exit_status, 1);
  EXPECT_EQ(none.out, "");
  EXPECT_EQ(none.err, "vesk decode: 0 tokens in 1.000 s of audio\n");
  EXPECT_EQ(Vesk({"decode", "-"}).exit_status, 1);  // Empty standard input.
  const ProcessResult missing = Vesk({"decode", "/nonexistent.wav"});
  EXPECT_EQ(missing.exit_status, 2);
  EXPECT_EQ(missing.err, "vesk decode: cannot read /nonexistent.wav: No such file or directory\n");
  const ProcessResult text = Vesk({"decode", VESK_BINARY});
  EXPECT_EQ(text.exit_status, 2);
  EXPECT_NE(text.err.find("not an audio format that libsndfile recognises (headerless 16-bit "
                          "PCM: add --raw, --rate and --channels)"),
            std::string::npos)
      << text.err;
  EXPECT_EQ(Vesk({}).exit_status, 2);
  EXPECT_EQ(Vesk({"decdoe"}).exit_status, 2);
  EXPECT_EQ(Vesk({"encode", "/nonexistent-dir/x.wav"}).exit_status, 2);
  EXPECT_EQ(Vesk({"demo", "--snr", "10", "--no-reverb"}).exit_status, 0);
  EXPECT_EQ(Vesk({"demo", "--snr", "-30"}).exit_status, 1);
}

// The demo's impairment options reach its room, and decode's --no-excision
// turns the stage off: a tone 20 dB over the token stops the decoder only
// then.
TEST(VeskToolTest, ATokenUnderASteadyToneIsHeardOnlyThroughTheExcisionStage) {
  const std::string path = TempPath("vesk_tool_test_tone.wav");
  const ProcessResult demo = Vesk({"demo", "--tones", "18600", "--tone-sir", "-20", "--snr", "10",
                                   "--no-reverb", "--save", path});
  EXPECT_EQ(demo.exit_status, 0) << demo.out << demo.err;
  EXPECT_NE(demo.out.find("extra:    1 tone 18600 Hz at signal-to-tone -20 dB"), std::string::npos)
      << demo.out;
  EXPECT_EQ(Vesk({"decode", path}).exit_status, 0);
  EXPECT_EQ(Vesk({"decode", "--no-excision", path}).exit_status, 1);
}

TEST(VeskToolTest, RefusedOptionsNameTheOptionTheValueAndTheRangeOrReason) {
  const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
      {{"encode", "--broadcast-rate", "8000", "-"},
       "vesk encode: --broadcast-rate 8000 is too low: the carrier (18500 Hz) must lie below half "
       "of it (4000 Hz)"},
      {{"encode", "--taps", "4", "-"}, "vesk encode: --taps 4: out of range (5 to 11)"},
      {{"encode", "--taps", "6", "--code", "3", "-"},
       "vesk encode: --code 3 needs --taps 7 or more (6 taps have codes 0 to 2)"},
      {{"encode", "--decimation", "5", "-"},
       "vesk encode: --decimation 5 must divide --upsampling 16"},
      {{"encode", "--bits", "3", "-"}, "vesk encode: --bits 3: must be one of 1, 2, 4, 8"},
      {{"encode", "--carrier", "30000", "-"},
       "vesk encode: --carrier 30000 must lie at or below half the coder rate (24000 Hz)"},
      {{"encode", "--bits", "8", "--cycles", "300", "-"},
       "vesk encode: --cycles 300 with --bits 8: the highest symbol tone (556 cycles per frame) "
       "must stay below half the 508-sample baseband frame"},
      {{"encode", "--message", "xyz", "-"},
       "vesk encode: --message xyz: needs hexadecimal bytes, such as 0123456789ab"},
      {{"encode", "--message", std::string(66, 'a'), "-"},
       "vesk encode: --message " + std::string(66, 'a') + ": 33 bytes (1 to 32)"},
      {{"encode", "--preset", "96k", "-"}, "vesk encode: --preset 96k: must be one of 48k, 44k"},
      {{"encode", "--repeat", "0", "-"}, "vesk encode: --repeat 0: out of range (1 to 100)"},
      {{"encode", "--raw", "--float", "-"},
       "vesk encode: --raw and --float exclude each other (raw output is 16-bit)"},
      {{"encode"}, "vesk encode: give one output: a file name, or - for standard output"},
      {{"encode", "--dtmf", "--tones", "800,30000", "-"},
       "vesk encode: --tones: 30000 Hz must lie in 0 to below half the coder rate (22050 Hz)"},
      {{"encode", "--dtmf", "--envelope", "0.03,0,0,0.03,1", "-"},
       "vesk encode: --envelope times add up to 0.06 s, more than the symbol (--window 0.05 s)"},
      {{"encode", "--dtfm", "-"}, "vesk encode: unknown option --dtfm (did you mean --dtmf?)"},
      {{"decode", "--rate", "4000", "-"},
       "vesk decode: --rate 4000: out of range (8000 to 192000)"},
      {{"decode", "--rate", "32000", "-"},
       "vesk decode: --rate 32000 is too low: the carrier (18500 Hz) must lie below half of it "
       "(16000 Hz)"},
      {{"decode", "--chanels", "2", "-"},
       "vesk decode: unknown option --chanels (did you mean --channels?)"},
      {{"decode", "--zintar", "--preset", "44k", "-"},
       "vesk decode: --zintar hears only the product waveform (--preset 48k, no other waveform "
       "options)"},
      {{"decode", "--zintar", "--rate", "32000", "-"},
       "vesk decode: --rate 32000 is too low: the carrier"},
      {{"decode", "--tokens-per-call", "7", "-"},
       "vesk decode: --tokens-per-call 7: out of range (1 to 6)"},
      {{"decode", "a.wav", "b.wav"},
       "vesk decode: give one input: a file name, or - for standard input"},
      {{"demo", "--speed", "3"}, "vesk demo: --speed 3: out of range (0.5 to 2)"},
      {{"demo", "--channels", "3"}, "vesk demo: --channels 3: out of range (1 to 2)"},
      {{"demo", "--message", "0102"},
       "vesk demo: --message 0102: the DSSS demo sends the product token of 6 bytes"},
      {{"demo", "--zintar", "--mic-rate", "16000"},
       "vesk demo: --mic-rate 16000: the zintar listening mode needs a microphone rate of at "
       "least 36994 Hz"},
      {{"demo", "--dtmf", "--zintar"}, "vesk demo: --zintar listens for DSSS tokens only"},
      {{"demo", "--tones", "30000"},
       "vesk demo: --tones 30000: a tone must lie below half the microphone rate (22050 Hz)"},
  };
  for (const auto& c : cases) {
    const ProcessResult run = Vesk(c.first, "\x01\x02");
    EXPECT_EQ(run.exit_status, 2) << c.second;
    EXPECT_EQ(run.out, "") << c.second;
    EXPECT_EQ(run.err.rfind(c.second, 0), 0u) << run.err;
    // Usage errors end with the usage; a rate refused for the input does not.
    const bool input_rate = c.second.find("too low") != std::string::npos && c.first[0] == "decode";
    EXPECT_EQ(run.err.find("\nusage: vesk ") != std::string::npos, !input_rate) << run.err;
  }
}

// Parses a one-line JSON object whose values are strings or numbers.
bool ParseJsonObject(const std::string& text, std::map<std::string, std::string>* strings,
                     std::map<std::string, double>* numbers) {
  size_t i = 0;
  const auto skip = [&] {
    while (i < text.size() && std::isspace(static_cast<unsigned char>(text[i]))) ++i;
  };
  const auto string = [&](std::string* out) {
    if (i >= text.size() || text[i] != '"') return false;
    for (++i; i < text.size() && text[i] != '"'; ++i) {
      if (text[i] == '\\' || static_cast<unsigned char>(text[i]) < 0x20) return false;
      *out += text[i];
    }
    return i++ < text.size();
  };
  skip();
  if (i >= text.size() || text[i++] != '{') return false;
  for (;;) {
    skip();
    std::string key;
    if (!string(&key)) return false;
    skip();
    if (i >= text.size() || text[i++] != ':') return false;
    skip();
    if (i < text.size() && text[i] == '"') {
      if (!string(&(*strings)[key])) return false;
    } else {
      char* end = nullptr;
      const double value = std::strtod(text.c_str() + i, &end);
      if (end == text.c_str() + i) return false;
      (*numbers)[key] = value;
      i = static_cast<size_t>(end - text.c_str());
    }
    skip();
    if (i < text.size() && text[i] == ',') {
      ++i;
      continue;
    }
    if (i >= text.size() || text[i++] != '}') return false;
    skip();
    return i == text.size();
  }
}

TEST(VeskToolTest, JsonLinesParseBackToTheHumanOutput) {
  const std::string dsss = TempPath("vesk_tool_test_json_dsss.wav");
  const std::string dtmf = TempPath("vesk_tool_test_json_dtmf.wav");
  ASSERT_EQ(Vesk({"encode", "--repeat", "2", dsss}).exit_status, 0);
  ASSERT_EQ(
      Vesk({"encode", "--dtmf", "--message", "a0b1c2d3e4", "--repeat", "2", dtmf}).exit_status, 0);
  for (const bool is_dtmf : {false, true}) {
    const std::string& path = is_dtmf ? dtmf : dsss;
    std::vector<std::string> args = {"decode", path};
    if (is_dtmf) args.push_back("--dtmf");
    const ProcessResult human = Vesk(args);
    args.push_back("--json");
    const ProcessResult json = Vesk(args);
    ASSERT_EQ(json.exit_status, 0) << json.err;
    EXPECT_EQ(json.err, human.err);
    ASSERT_EQ(json.out.back(), '\n');
    ASSERT_EQ(json.out.find('\n'), json.out.size() - 1) << json.out;  // One token, one line.
    std::map<std::string, std::string> strings;
    std::map<std::string, double> numbers;
    ASSERT_TRUE(ParseJsonObject(json.out.substr(0, json.out.size() - 1), &strings, &numbers))
        << json.out;
    EXPECT_EQ(strings.size() + numbers.size(), 3u);
    EXPECT_EQ(strings["message"], is_dtmf ? "a0b1c2d3e4" : kMessage);
    EXPECT_EQ(strings["modem"], is_dtmf ? "dtmf" : "dsss");
    ASSERT_EQ(numbers.count("time"), 1u);
    char line[64];
    std::snprintf(line, sizeof(line), "%9.3f s  ", numbers["time"]);
    EXPECT_EQ(human.out, line + strings["message"] + "\n");
  }
}

TEST(VeskToolTest, HelpListsEveryOptionWithItsDefaultAndRange) {
  const ProcessResult tool = Vesk({"--help"});
  EXPECT_EQ(tool.exit_status, 0);
  EXPECT_EQ(Vesk({"-h"}).out, tool.out);
  for (const char* command : {"encode", "decode", "demo"}) {
    EXPECT_NE(tool.out.find(std::string("  ") + command + "   "), std::string::npos) << tool.out;
  }
  EXPECT_NE(tool.out.find("Exit status: 0"), std::string::npos);
  for (const std::vector<std::string>& args : std::vector<std::vector<std::string>>{
           {"encode"}, {"encode", "--dtmf"}, {"decode"}, {"decode", "--dtmf"}, {"demo"}}) {
    const ProcessResult help = Vesk(args + std::vector<std::string>{"--help"});
    EXPECT_EQ(help.exit_status, 0);
    EXPECT_EQ(Vesk(args + std::vector<std::string>{"-h"}).out, help.out);
    EXPECT_EQ(help.out.find("[no-]help"), std::string::npos) << help.out;
    EXPECT_NE(help.out.find("--dtmf"), std::string::npos) << help.out;
    // Every option shows its default (a file name has none).
    std::string entry;
    const auto check = [&] {
      if (!entry.empty() && entry.find(" FILE ") == std::string::npos) {
        EXPECT_NE(entry.find("default"), std::string::npos) << entry;
      }
    };
    for (size_t start = 0, end; (end = help.out.find('\n', start)) != std::string::npos;
         start = end + 1) {
      const std::string line = help.out.substr(start, end - start);
      if (line.rfind("  --", 0) == 0) {
        check();
        entry = line;
      } else if (!entry.empty() && line.rfind("    ", 0) == 0) {
        entry += line;
      }
    }
    check();
  }
  const ProcessResult decode = Vesk({"decode", "--help"});
  EXPECT_NE(decode.out.find("  --rate HZ                     sample rate of headerless input, Hz "
                            "(8000 to 192000; default 44100)"),
            std::string::npos)
      << decode.out;
  EXPECT_NE(decode.out.find("--[no-]crc"), std::string::npos);
  EXPECT_NE(Vesk({"decode", "--dtmf", "--help"}).out.find("--tones LIST"), std::string::npos);
  const ProcessResult version = Vesk({"--version"});
  EXPECT_EQ(version.exit_status, 0);
  EXPECT_EQ(version.out.rfind(std::string("vesk ") + VESK_VERSION + " (libsndfile-", 0), 0u)
      << version.out;
}

TEST(VeskToolTest, ProgressLineOnlyOnATerminal) {
  Sound sound = EncodedToken({"--message", kMessage});
  sound.samples.resize(12 * 48000, 0.0f);  // 12 s: a long file.
  const std::string path = TempPath("vesk_tool_test_long.wav");
  WriteSound(path, sound, SF_FORMAT_WAV | SF_FORMAT_PCM_16);
  const ProcessResult terminal = Vesk({"decode", path}, "", /*stderr_on_terminal=*/true);
  EXPECT_EQ(terminal.exit_status, 0);
  EXPECT_NE(terminal.err.find("\rvesk decode: 50% ("), std::string::npos) << terminal.err;
  EXPECT_NE(terminal.err.find(" of 12.0 s)"), std::string::npos) << terminal.err;
  EXPECT_NE(terminal.err.find("vesk decode: 1 token in 12.000 s of audio"), std::string::npos);
  const ProcessResult piped = Vesk({"decode", path});
  EXPECT_EQ(piped.err, "vesk decode: 1 token in 12.000 s of audio\n");
  EXPECT_EQ(piped.out, terminal.out);
}

}  // namespace
}  // namespace vesk_tool
