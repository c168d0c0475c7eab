#pragma once

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/segment/term_order.h"
#include "elastic/terms/selected_terms.h"

namespace vantrel::elastic {

// Several dictionaries cannot be merged by one order of terms: a dictionary is sorted by the other one.
class SortedOtherwise : public std::runtime_error {
 public:
  SortedOtherwise() : std::runtime_error("segments are sorted by different orders of terms") {}
};

// The terms of several segments together, each once, by field and then by text, in one order.
//
// A tournament in which each segment's term is compared only behind what it is known to share with the one that won
// before: all comparisons together take time in proportion to the bytes that the dictionaries' files hold for these
// terms, however long the texts are that the terms share. For one thread at a time. Everything may throw what
// SelectedTerms throws, and SortedOtherwise.
class MergedTerms {
 public:
  using Move = SelectedTerms::Move;

  explicit MergedTerms(std::vector<std::unique_ptr<SelectedTerms>> segments,
                       format::TermOrders order = format::kByCodePoints);

  // Reads on by one term of one segment.
  Move Step();

  // Steps to the next term; false at the end.
  bool Next() {
    Move move = Move::kPassedOver;
    while (move == Move::kPassedOver) move = Step();
    return move == Move::kTerm;
  }

  // The term, while the last step was to one.
  const std::string& field() const;
  const std::string& text() const { return text_; }
  // How many leading bytes of the text are those of the term before.
  size_t same_length() const { return same_length_; }

  // In how many documents it is by the dictionaries: those that are deleted count until they are merged away.
  uint64_t document_frequency() const;

  // Whether at least one document holds it that is not deleted.
  bool IsLive() const;

 private:
  struct Segment {
    std::unique_ptr<SelectedTerms> terms = {};
    std::vector<uint32_t> field_ranks =
        {};             // by field number: its place among the names of all segments' fields
    uint32_t rank = 0;  // of the term's field
    bool is_at_end = false;
    size_t room = 0;  // for its texts, as far as it is counted
    // What the term has in common with the one that it was last compared with, as long as it has not won: 0 where the
    // field is another, else 1 and the number of leading bytes, as whole characters.
    size_t same = 0;

    std::string_view text() const { return terms->walk().cursor().text(); }
  };
  // A term as one segment has it.
  struct Occurrence {
    SelectedTerms* terms;
    int32_t field;
    format::TermInfo info;
  };

  void RankFields();
  void CountRoom(Segment& segment);
  void TakeTerm(Segment& segment);
  bool IsSameAsText(const Segment& segment) const;
  void Gather();
  size_t Build(size_t node);
  size_t Replay(size_t winner);
  size_t Play(size_t left, size_t right);

  format::TermOrders order_;
  std::vector<Segment> segments_;
  size_t room_ = 0;  // for the texts of all segments
  std::vector<size_t>
      losers_;  // by node; node k is above 2k and 2k+1, and the segments are behind the last node
  bool is_built_ = false;
  size_t top_ = 0;   // the winner
  size_t next_ = 0;  // the segment that is to be read on
  bool is_complete_ = false;
  std::string text_;
  size_t same_length_ = 0;
  std::vector<Occurrence> at_term_;
};

}  // namespace vantrel::elastic
