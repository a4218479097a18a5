// The golden recordings in examples/ pin the air format: every one decodes to
// its message through the built vesk binary, and every one the transmitter
// made ("encode" in examples/expected.tsv) is made again sample for sample.
// A change to the encoders that keeps them agreeing with the decoders but
// changes what devices in the field hear fails here.

#include <dirent.h>
#include <sndfile.h>
#include <unistd.h>

#include <cmath>
#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tools/common/subprocess.h"

namespace vesk_tool {
namespace {

struct Example {
  std::string file;
  std::vector<std::string> decode_options;
  std::string message;
  std::vector<std::string> made_with;  // FILE stands for the file.
};

std::vector<std::string> Words(const std::string& text) {
  std::vector<std::string> words;
  std::istringstream stream(text);
  for (std::string word; stream >> word;) words.push_back(word);
  return words;
}

std::vector<Example> ReadExamples() {
  std::ifstream tsv(std::string(VESK_EXAMPLES_DIR) + "/expected.tsv");
  EXPECT_TRUE(tsv.good());
  std::vector<Example> examples;
  for (std::string line; std::getline(tsv, line);) {
    if (line.empty() || line[0] == '#') continue;
    std::vector<std::string> fields;
    std::stringstream stream(line);
    for (std::string field; std::getline(stream, field, '\t');) fields.push_back(field);
    EXPECT_EQ(fields.size(), 4u) << line;
    if (fields.size() != 4) continue;
    examples.push_back({fields[0], Words(fields[1]), fields[2], Words(fields[3])});
  }
  return examples;
}

std::string PathOf(const Example& example) {
  return std::string(VESK_EXAMPLES_DIR) + "/" + example.file;
}

struct Sound {
  int rate = 0;
  int channels = 0;
  int format = 0;
  std::vector<double> samples;  // Unscaled: 16-bit files as integers, float files as floats.
};

bool ReadSound(SNDFILE* file, const SF_INFO& info, Sound* sound) {
  if (file == nullptr) return false;
  sound->rate = info.samplerate;
  sound->channels = info.channels;
  sound->format = info.format;
  sound->samples.resize(static_cast<size_t>(info.frames * info.channels));
  // Integer files are compared in their own units, so one LSB is 1.
  if ((info.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16) {
    sf_command(file, SFC_SET_NORM_DOUBLE, nullptr, SF_FALSE);
  }
  sf_readf_double(file, sound->samples.data(), info.frames);
  sf_close(file);
  return true;
}

TEST(ExamplesTest, ListsEveryRecordingAndNothingElse) {
  std::set<std::string> listed, found;
  for (const Example& example : ReadExamples()) listed.insert(example.file);
  DIR* dir = opendir(VESK_EXAMPLES_DIR);
  ASSERT_NE(dir, nullptr);
  while (const dirent* entry = readdir(dir)) {
    const std::string name = entry->d_name;
    if (name.size() > 4 && name.compare(name.size() - 4, 4, ".wav") == 0) found.insert(name);
  }
  closedir(dir);
  EXPECT_EQ(listed, found);
  EXPECT_GE(listed.size(), 5u);
}

TEST(ExamplesTest, EveryRecordingDecodesToItsMessage) {
  for (const Example& example : ReadExamples()) {
    std::vector<std::string> args = {"decode"};
    args.insert(args.end(), example.decode_options.begin(), example.decode_options.end());
    args.push_back(PathOf(example));
    const ProcessResult run = RunProcess(VESK_BINARY, args);
    EXPECT_EQ(run.exit_status, 0) << example.file << ": " << run.err;
    std::istringstream lines(run.out);
    int tokens = 0;
    for (std::string line; std::getline(lines, line); ++tokens) {
      const std::vector<std::string> words = Words(line);
      ASSERT_EQ(words.size(), 3u) << line;
      EXPECT_EQ(words[2], example.message) << example.file;
    }
    EXPECT_GE(tokens, 1) << example.file;
  }
}

// Bit-exact where the token is synthesised at the output rate; within one
// LSB (1 in 16-bit units, 1/32768 in float ones) where the coder's rate is
// converted to the broadcast rate, since the FFT resampler's float rounding
// may move a sample across a rounding boundary.
TEST(ExamplesTest, TheTransmitterMakesEveryEncodedRecordingAgain) {
  int compared = 0;
  for (const Example& example : ReadExamples()) {
    if (example.made_with.empty() || example.made_with[0] != "encode") continue;
    std::vector<std::string> args;
    for (const std::string& word : example.made_with) args.push_back(word == "FILE" ? "-" : word);
    const ProcessResult run = RunProcess(VESK_BINARY, args);
    ASSERT_EQ(run.exit_status, 0) << example.file << ": " << run.err;
    const bool resampled = run.err.find("resampled") != std::string::npos;

    Sound golden, fresh;
    SF_INFO info = {};
    ASSERT_TRUE(ReadSound(sf_open(PathOf(example).c_str(), SFM_READ, &info), info, &golden))
        << example.file;
    const std::string path =
        ::testing::TempDir() + "/examples_test_" + std::to_string(getpid()) + "_" + example.file;
    {
      std::ofstream out(path, std::ios::binary);
      out << run.out;
    }
    info = {};
    ASSERT_TRUE(ReadSound(sf_open(path.c_str(), SFM_READ, &info), info, &fresh)) << example.file;
    std::remove(path.c_str());

    EXPECT_EQ(fresh.rate, golden.rate) << example.file;
    EXPECT_EQ(fresh.channels, golden.channels) << example.file;
    EXPECT_EQ(fresh.format, golden.format) << example.file;
    ASSERT_EQ(fresh.samples.size(), golden.samples.size()) << example.file;
    const bool integer = (golden.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16;
    const double lsb = integer ? 1.0 : 1.0 / 32768;
    double largest = 0;
    for (size_t i = 0; i < golden.samples.size(); ++i) {
      largest = std::max(largest, std::fabs(fresh.samples[i] - golden.samples[i]));
    }
    EXPECT_LE(largest, resampled ? lsb : 0.0)
        << example.file << (resampled ? " (resampled)" : " (synthesised at its rate)");
    ++compared;
  }
  EXPECT_GE(compared, 3);
}

}  // namespace
}  // namespace vesk_tool
