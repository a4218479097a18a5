#include "audio/vesknet/token_selector.h"

#include <algorithm>
#include <cstdint>
#include <functional>
#include <queue>
#include <tuple>
#include <utility>

#include "audio/dsp/batch_top_n.h"
#include "audio/dsp/number_util.h"
#include "base/logging.h"

// The size check compares a vector's size with an int, as its text reads.
#pragma GCC diagnostic ignored "-Wsign-compare"

namespace audio_vesknet {
namespace {

// Product of the counts, saturated at `limit` so that it cannot overflow.
int64_t SaturatedProduct(const std::vector<int>& counts, int64_t limit) {
  int64_t product = 1;
  for (const int count : counts) {
    product = std::min(product * count, limit);
  }
  return product;
}

}  // namespace

int32_t ChecksumSymbol(int alphabet_size, const std::vector<int32_t>& symbols) {
  const int32_t m = alphabet_size - 1;
  int32_t sum = 0;
  for (const int32_t symbol : symbols) sum += symbol;
  return (m - sum % m) % m;
}

TokenSelector::TokenSelector(const TokenSelectorParams& params)
    : params_(params),
      symbol_period_(params.symbols_in_token + (params.use_checksum_symbol ? 1 : 0) + 1) {
  CHECK(params_.alphabet_size >= 3);
  CHECK(params_.spacer >= 0);
  CHECK(params_.spacer < params_.alphabet_size);
  CHECK(params_.symbols_in_token > 0);
  CHECK(params_.max_candidates_to_return > 0);
  CHECK(params_.max_candidates_to_consider >= params_.max_candidates_rank);
  CHECK(params_.max_candidates_rank >= params_.max_candidates_to_return);
  CHECK(params_.token_threshold_factor >= 0);
}

void TokenSelector::SelectTokens(const std::map<int, std::vector<float>>& candidates,
                                 audio_dsp::MatrixXf* scores_table,
                                 std::vector<TokenCandidate>* token_candidates) const {
  CHECK(scores_table);
  CHECK(token_candidates);
  token_candidates->clear();
  const int alphabet_size = params_.alphabet_size;

  // Fold the thresholded frames onto one period, each frame with weight 1.
  scores_table->resize(alphabet_size, symbol_period_);
  std::vector<int> first_index(symbol_period_, -1);
  std::vector<float> frame(alphabet_size);
  for (const auto& candidate : candidates) {
    const std::vector<float>& scores = candidate.second;
    CHECK(scores.size() == params_.alphabet_size);
    const float threshold =
        params_.token_threshold_factor * *std::max_element(scores.begin(), scores.end());
    float sum = 0.0f;
    for (int s = 0; s < alphabet_size; ++s) {
      const float value = scores[s] - threshold;
      frame[s] = value > 0.0f ? value : 0.0f;
      sum += frame[s];
    }
    const int column = audio_dsp::PositiveModulo(candidate.first, symbol_period_);
    float* table_column = scores_table->col(column);
    for (int s = 0; s < alphabet_size; ++s) {
      table_column[s] += sum != 0.0f ? frame[s] / sum : frame[s];
    }
    // Set even by a frame that adds nothing: the position was received.
    if (first_index[column] == -1) first_index[column] = candidate.first;
  }
  for (int c = 0; c < symbol_period_; ++c) {
    const float sum = scores_table->ColumnSum(c);
    if (sum == 0.0f) continue;
    float* table_column = scores_table->col(c);
    for (int s = 0; s < alphabet_size; ++s) table_column[s] /= sum;
  }
  if (std::find(first_index.begin(), first_index.end(), -1) != first_index.end()) return;

  PruneScoresTable(scores_table);

  CHECK(scores_table->rows() == params_.alphabet_size);
  CHECK(scores_table->cols() == symbol_period_);
  std::vector<std::vector<int32_t>> rows(symbol_period_);
  std::vector<int> radices(symbol_period_);
  for (int c = 0; c < symbol_period_; ++c) {
    for (int s = 0; s < alphabet_size; ++s) {
      if ((*scores_table)(s, c) > 0.0f) rows[c].push_back(s);
    }
    if (rows[c].empty()) return;
    radices[c] = static_cast<int>(rows[c].size());
  }

  // Score the surviving sequences (column 0 changes fastest) and keep the best.
  audio_dsp::BatchTopN<std::vector<int32_t>> best(params_.max_candidates_rank);
  std::vector<int32_t> sequence(symbol_period_);
  int scored = 0;
  for (audio_dsp::MixedRadixCounter counter(radices);
       !counter.Done() && scored < params_.max_candidates_to_consider; counter.Next(), ++scored) {
    const std::vector<int>& digits = counter.GetDigits();
    float score = 0.0f;
    for (int c = 0; c < symbol_period_; ++c) {
      sequence[c] = rows[c][digits[c]];
      score += (*scores_table)(sequence[c], c);
    }
    best.Push(sequence, score);
  }

  for (auto& ranked : best.Extract()) {
    TokenCandidate token;
    if (!CheckSequence(ranked.first, first_index, &token)) continue;
    token.score = ranked.second;
    token_candidates->push_back(std::move(token));
    if (static_cast<int>(token_candidates->size()) >= params_.max_candidates_to_return) break;
  }
}

void TokenSelector::PruneScoresTable(audio_dsp::MatrixXf* scores_table) const {
  // Every positive entry but each column's best (first row on ties) is a
  // pruning candidate, smallest score first; equal scores go by column, then
  // row, so that the result is deterministic.
  using Entry = std::tuple<float, int, int>;  // Score, column, row.
  std::priority_queue<Entry, std::vector<Entry>, std::greater<Entry>> heap;
  std::vector<int> counts(symbol_period_, 0);
  for (int c = 0; c < symbol_period_; ++c) {
    const float* column = scores_table->col(c);
    const int best_row =
        static_cast<int>(std::max_element(column, column + params_.alphabet_size) - column);
    for (int s = 0; s < params_.alphabet_size; ++s) {
      if (column[s] <= 0.0f) continue;
      ++counts[c];
      if (s != best_row) heap.emplace(column[s], c, s);
    }
  }
  const int64_t limit = params_.max_candidates_to_consider;
  while (SaturatedProduct(counts, limit + 1) > limit && !heap.empty()) {
    const Entry entry = heap.top();
    heap.pop();
    (*scores_table)(std::get<2>(entry), std::get<1>(entry)) = 0.0f;
    --counts[std::get<1>(entry)];
  }
}

bool TokenSelector::CheckSequence(const std::vector<int32_t>& sequence,
                                  const std::vector<int>& first_index,
                                  TokenCandidate* token) const {
  if (std::count(sequence.begin(), sequence.end(), params_.spacer) != 1) return false;
  const int k = static_cast<int>(std::find(sequence.begin(), sequence.end(), params_.spacer) -
                                 sequence.begin());
  // Rotate so that the repetition begins with the spacer, then drop it.
  std::vector<int32_t> symbols(sequence.begin() + k + 1, sequence.end());
  symbols.insert(symbols.end(), sequence.begin(), sequence.begin() + k);
  if (params_.use_checksum_symbol) {
    const int32_t checksum = symbols.back();
    symbols.pop_back();
    if (checksum != ChecksumSymbol(params_.alphabet_size, symbols)) return false;
  }
  token->symbols = std::move(symbols);
  token->start_index = first_index[k];
  return true;
}

}  // namespace audio_vesknet
