#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "vantrel/elastic/suggest_terms.h"

namespace vantrel::elastic {

// The best of the terms that it is shown, and never more of them than were asked for: the most frequent first, of
// equal ones the first in the order of their bytes. Terms may be long and share most of their bytes: a comparison takes
// time in proportion to what is not shared with the term before, and only a term that is taken is copied.
class BestTerms {
 public:
  explicit BestTerms(uint64_t most) : most_(most) {}

  // Whether Add() would change anything. Where this is called for each term in turn, `same` may say how many leading
  // bytes are those of the term of the call before.
  bool WouldTake(std::string_view term, uint64_t document_frequency, size_t same = 0);

  void Add(std::string_view term, uint64_t document_frequency);

  // Best first. Nothing is left here.
  std::vector<SuggestedTerm> Take();

 private:
  uint64_t most_;
  std::vector<SuggestedTerm> heap_;  // the worst on top
  size_t same_as_worst_ = 0;  // how many leading bytes the worst and the last term have in common, at least
};

}  // namespace vantrel::elastic
