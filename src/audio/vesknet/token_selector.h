// Picks whole tokens out of per-frame symbol scores.
//
// A transmitter repeats a token as a periodic symbol stream: the data
// symbols, optionally one checksum symbol, and one spacer symbol, over and
// over; one repetition is symbol_period() frames long. The selector folds the
// scores of all received frames onto one period (frame index mod period),
// enumerates the best-scoring symbol sequences over that period, and accepts
// those that contain the spacer exactly once (it marks where the token
// starts) and, when asked, carry a matching checksum symbol.
//
// Used by both streaming receivers (DSSS and DTMF). Immutable after
// construction; SelectTokens is const and may be called from several threads
// on distinct outputs.

#ifndef AUDIO_VESKNET_TOKEN_SELECTOR_H_
#define AUDIO_VESKNET_TOKEN_SELECTOR_H_

#include <cstdint>
#include <map>
#include <vector>

#include "audio/dsp/matrix.h"

namespace audio_vesknet {

// Validated at TokenSelector construction (fatal checks, in field order except
// that max_candidates_to_return is checked before the two fields above it).
struct TokenSelectorParams {
  int alphabet_size = 17;            // Distinct symbols, spacer included, >= 3.
  int spacer = 16;                   // Symbol separating repetitions, [0, alphabet_size).
  int symbols_in_token = 16;         // Data symbols per token, > 0.
  bool use_checksum_symbol = false;  // One checksum symbol follows the data.
  // Most symbol sequences scored per call, >= max_candidates_rank. Bounds the
  // cost of a call whatever the noise.
  int max_candidates_to_consider = 128;
  // Best sequences kept for the spacer and checksum checks,
  // >= max_candidates_to_return.
  int max_candidates_rank = 6;
  int max_candidates_to_return = 2;  // Most tokens returned per call, > 0.
  // Share of a frame's best score removed from all its scores, >= 0; with 1/3
  // only scores above a third of the frame's best survive.
  float token_threshold_factor = 1.0f / 3;
};

struct TokenCandidate {
  std::vector<int32_t> symbols;  // symbols_in_token data symbols, spacer and checksum removed.
  float score = 0.0f;            // Sum of the sequence's entries in the scores table.
  std::vector<uint8_t> bytes;    // Left empty by the selector; the caller decodes into it.
  int start_index = 0;           // Frame index at which a repetition (its spacer) starts.
};

// The checksum symbol of data symbols in an alphabet of `alphabet_size` (>= 2)
// symbols whose last one is reserved: with m = alphabet_size - 1, the value
// (m - sum mod m) mod m, in [0, m). The sum of the data symbols and the
// checksum is then a multiple of m, and the checksum is never the reserved
// symbol. Symbols are expected non-negative.
int32_t ChecksumSymbol(int alphabet_size, const std::vector<int32_t>& symbols);

class TokenSelector {
 public:
  explicit TokenSelector(const TokenSelectorParams& params);

  // candidates: frame index (increasing, any unit the caller counts frames in,
  //   >= 0) -> alphabet_size non-negative scores, larger is better (fatal
  //   check on the size).
  // scores_table: out, resized to alphabet_size x symbol_period(); column c
  //   holds the thresholded, normalised scores of the frames whose index is c
  //   mod symbol_period(), each frame with equal weight, each column summing
  //   to 1 (unless empty), and pruned so that the product of the columns'
  //   counts of positive entries is at most max_candidates_to_consider (a
  //   column's best entry is never pruned). Left unpruned when some column
  //   received no frame.
  // token_candidates: out, replaced with at most max_candidates_to_return
  //   accepted tokens by decreasing score; empty when some position of the
  //   period received no frame or nothing passed the checks.
  void SelectTokens(const std::map<int, std::vector<float>>& candidates,
                    audio_dsp::MatrixXf* scores_table,
                    std::vector<TokenCandidate>* token_candidates) const;

  // Frames in one repetition: symbols_in_token + checksum (0 or 1) + spacer.
  int symbol_period() const { return symbol_period_; }
  const TokenSelectorParams& params() const { return params_; }

 private:
  // Step 4 of the selection: zeroes the weakest entries until few enough
  // sequences remain.
  void PruneScoresTable(audio_dsp::MatrixXf* scores_table) const;

  // Accepts `sequence` (one symbol per column) if its spacer and checksum are
  // right, filling *token; first_index: first frame index of each column.
  bool CheckSequence(const std::vector<int32_t>& sequence, const std::vector<int>& first_index,
                     TokenCandidate* token) const;

  const TokenSelectorParams params_;
  const int symbol_period_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_TOKEN_SELECTOR_H_
