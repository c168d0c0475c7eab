#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "vantrel/elastic/suggest_terms.h"

namespace vantrel::elastic {

// The best of the terms that it is shown, and never more of them than were asked for: the most frequent first, of
// equal ones the first in the order of their bytes.
class BestTerms {
 public:
  explicit BestTerms(uint64_t most) : most_(most) {}

  // Whether Add() would change anything.
  bool WouldTake(std::string_view term, uint64_t document_frequency) const;

  void Add(std::string_view term, uint64_t document_frequency);

  // Best first. Nothing is left here.
  std::vector<SuggestedTerm> Take();

 private:
  uint64_t most_;
  std::vector<SuggestedTerm> heap_;  // the worst on top
};

}  // namespace vantrel::elastic
