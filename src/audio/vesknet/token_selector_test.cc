#include "audio/vesknet/token_selector.h"

#include <algorithm>
#include <random>

#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

using Candidates = std::map<int, std::vector<float>>;
constexpr int kSpacer = 16;
const std::vector<int32_t> kData = {3, 1, 4, 1, 5, 9, 2, 6, 5, 3, 5, 8, 9, 7, 9, 3};

// Frames first .. first + count - 1 of a stream repeating the spacer and
// `data`, the spacer on frame indices = start_column mod period. Each frame
// scores 1 for its symbol, plus uniform noise in [0, noise) on every symbol.
Candidates Frames(const std::vector<int32_t>& data, int start_column, int first, int count,
                  float noise = 0.0f) {
  const int period = static_cast<int>(data.size()) + 1;
  std::mt19937 rng(7);
  std::uniform_real_distribution<float> uniform(0.0f, noise);
  Candidates frames;
  for (int f = first; f < first + count; ++f) {
    for (int s = 0; s < 17; ++s) frames[f].push_back(noise > 0.0f ? uniform(rng) : 0.0f);
    const int j = ((f - start_column) % period + period) % period;  // 0: the spacer.
    frames[f][j == 0 ? kSpacer : data[j - 1]] += 1.0f;
  }
  return frames;
}

std::vector<TokenCandidate> Select(const TokenSelectorParams& params, const Candidates& frames,
                                   audio_dsp::MatrixXf* table) {
  std::vector<TokenCandidate> tokens(3);  // Stale entries must go.
  TokenSelector(params).SelectTokens(frames, table, &tokens);
  return tokens;
}

TokenSelectorParams With(int TokenSelectorParams::*field, int value) {
  TokenSelectorParams params;
  params.*field = value;
  return params;
}

// Positive entries of each column, multiplied: the sequences left to score.
int64_t Sequences(const audio_dsp::MatrixXf& table) {
  int64_t product = 1;
  for (int c = 0; c < table.cols(); ++c) {
    product *=
        std::count_if(table.col(c), table.col(c) + table.rows(), [](float x) { return x > 0; });
  }
  return product;
}

TEST(TokenSelectorTest, ChecksRunInOrder) {
  using P = TokenSelectorParams;
  EXPECT_DEATH(TokenSelector(With(&P::alphabet_size, 2)), "alphabet_size >= 3");  // Spacer too.
  EXPECT_DEATH(TokenSelector(With(&P::spacer, 17)), "spacer < params_.alphabet_size");
  EXPECT_DEATH(TokenSelector(With(&P::max_candidates_to_consider, 5)),
               "Check failed: params_.max_candidates_to_consider >= params_.max_candidates_rank");
  EXPECT_DEATH(TokenSelector(With(&P::max_candidates_to_return, 7)),
               "Check failed: params_.max_candidates_rank >= params_.max_candidates_to_return");
  audio_dsp::MatrixXf table;
  EXPECT_DEATH(Select({}, {{0, std::vector<float>(16)}}, &table),
               "Check failed: scores.size\\(\\) == params_.alphabet_size");
}

TEST(TokenSelectorTest, RecoversANoisyTokenStartingMidBuffer) {
  audio_dsp::MatrixXf table;
  // Frame 30 is column 13; the first spacer falls on frame 41 (column 7).
  const auto tokens = Select({}, Frames(kData, 7, 30, 3 * 17, 0.6f), &table);
  ASSERT_FALSE(tokens.empty());
  EXPECT_EQ(tokens[0].symbols, kData);
  EXPECT_EQ(tokens[0].start_index, 41);
  EXPECT_TRUE(tokens[0].bytes.empty());
  ASSERT_EQ(table.rows(), 17);
  ASSERT_EQ(table.cols(), 17);
  EXPECT_LE(Sequences(table), 128);
  EXPECT_GT(Sequences(table), 1);
}

TEST(TokenSelectorTest, PruningRemovesTheSmallestEntriesUntilTheBoundHolds) {
  TokenSelectorParams params;
  params.symbols_in_token = 2;
  params.token_threshold_factor = 0.0f;  // All noise survives: 17^3 sequences.
  const Candidates frames = Frames({4, 5}, 0, 0, 6, 1.0f);
  params.max_candidates_to_consider = 5000;
  audio_dsp::MatrixXf full, pruned;
  Select(params, frames, &full);
  ASSERT_EQ(Sequences(full), 17 * 17 * 17);
  params.max_candidates_to_consider = 20;
  Select(params, frames, &pruned);
  EXPECT_LE(Sequences(pruned), 20);
  float smallest_kept = 1.0f, largest_pruned = 0.0f;
  for (int i = 0; i < full.size(); ++i) {
    if (pruned.data()[i] == 0.0f) largest_pruned = std::max(largest_pruned, full.data()[i]);
    if (pruned.data()[i] != 0.0f) smallest_kept = std::min(smallest_kept, full.data()[i]);
    EXPECT_TRUE(pruned.data()[i] == 0.0f || pruned.data()[i] == full.data()[i]);
  }
  EXPECT_LT(largest_pruned, smallest_kept);
}

TEST(TokenSelectorTest, SilentFrameStillMarksItsPosition) {
  Candidates frames = Frames(kData, 3, 0, 21);
  frames.erase(3);  // The spacer column's frames are now 20 alone.
  audio_dsp::MatrixXf table;
  EXPECT_EQ(Select({}, frames, &table)[0].start_index, 20);
  frames[3] = std::vector<float>(17, 0.0f);
  const auto tokens = Select({}, frames, &table);
  ASSERT_EQ(tokens.size(), 1u);
  EXPECT_EQ(tokens[0].symbols, kData);
  EXPECT_EQ(tokens[0].start_index, 3);
  EXPECT_FLOAT_EQ(table(kSpacer, 3), 1.0f);
  // Without any frame on position 16 there is no token.
  EXPECT_TRUE(Select({}, Frames(kData, 0, 0, 16), &table).empty());
  EXPECT_FLOAT_EQ(table.ColumnSum(5), 1.0f);
  EXPECT_FLOAT_EQ(table.ColumnSum(16), 0.0f);
}

TEST(TokenSelectorTest, SpacerMustOccurExactlyOnce) {
  Candidates frames = Frames(kData, 0, 0, 17);
  frames[0][2] = 0.9f;        // Column 0: the spacer or 2.
  frames[5][kSpacer] = 1.0f;  // Column 5: the spacer or its data symbol 5.
  frames[5][5] = 0.8f;
  audio_dsp::MatrixXf table;
  const auto tokens =
      Select(With(&TokenSelectorParams::max_candidates_to_return, 4), frames, &table);
  // The best sequence has two spacers, the worst none: neither is returned.
  ASSERT_EQ(tokens.size(), 2u);
  EXPECT_EQ(tokens[0].start_index, 5);
  EXPECT_EQ(tokens[0].symbols[11], 2);
  EXPECT_EQ(tokens[1].start_index, 0);
  EXPECT_EQ(tokens[1].symbols, kData);
  EXPECT_GT(tokens[0].score, tokens[1].score);
}

TEST(TokenSelectorTest, RanksAndReturnsTheBestSequences) {
  Candidates frames = Frames(kData, 0, 0, 17);
  frames[1][3] = 0.8f;  // Column 1 offers 3 (weakest), 7 and 6.
  frames[1][7] = 1.0f;
  frames[1][6] = 0.9f;
  audio_dsp::MatrixXf table;
  auto tokens = Select({}, frames, &table);
  ASSERT_EQ(tokens.size(), 2u);
  EXPECT_EQ(tokens[0].symbols[0], 7);
  EXPECT_EQ(tokens[1].symbols[0], 6);
  // 3 and 7 equal: 3 comes first and 7 does not pass the collector's threshold.
  frames[1] = Frames(kData, 0, 1, 1)[1];
  frames[1][7] = 1.0f;
  TokenSelectorParams params = With(&TokenSelectorParams::max_candidates_rank, 1);
  params.max_candidates_to_return = 1;
  tokens = Select(params, frames, &table);
  ASSERT_EQ(tokens.size(), 1u);
  EXPECT_EQ(tokens[0].symbols[0], 3);
}

TEST(TokenSelectorTest, ChecksumSymbolIsVerifiedAndRemoved) {
  EXPECT_EQ(ChecksumSymbol(17, {1, 2, 3}), 10);
  EXPECT_EQ(ChecksumSymbol(17, {8, 8, 0}), 0);
  TokenSelectorParams params = With(&TokenSelectorParams::symbols_in_token, 3);
  params.use_checksum_symbol = true;
  EXPECT_EQ(TokenSelector(params).symbol_period(), 5);
  audio_dsp::MatrixXf table;
  const auto tokens = Select(params, Frames({1, 2, 3, 10}, 2, 0, 10), &table);
  ASSERT_EQ(tokens.size(), 1u);
  EXPECT_EQ(tokens[0].symbols, (std::vector<int32_t>{1, 2, 3}));
  EXPECT_EQ(tokens[0].start_index, 2);
  EXPECT_TRUE(Select(params, Frames({1, 2, 3, 9}, 2, 0, 10), &table).empty());
}

}  // namespace
}  // namespace audio_vesknet
