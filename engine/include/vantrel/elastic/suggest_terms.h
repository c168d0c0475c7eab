#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// Which terms are wanted.
struct SuggestRequest {
  std::string field;   // may be empty: a field can bear that name
  std::string prefix;  // bytes of UTF-8; may be empty, and may end within a character
  uint64_t skip = 0;   // the best ones passed over
  uint64_t limit = 10;

  // When it gives up, counted from its beginning; 0 is never. The clock is looked at each time that bytes are read, at
  // least every 256 KiB, from whichever file.
  std::chrono::milliseconds time_limit{0};
};

// A term that begins with the prefix.
struct SuggestedTerm {
  std::string term;  // UTF-8
  // In how many documents of all the indexes it is by their dictionaries: deleted documents count until they are
  // merged away.
  uint64_t document_frequency = 0;

  bool operator==(const SuggestedTerm&) const = default;
};

// The terms of a field that begin with a prefix, compared byte by byte, over several indexes as if they were one.
// The most frequent come first, of equally frequent ones the first in the order of their bytes; of this order,
// [skip, skip + limit) is handed back. A term that just deleted documents hold is left out. A field that is not
// there has no terms.
//
// Each index is the folder of its files, taken byte for byte, and is seen as of its newest commit; nothing is
// created, locked or changed, and no settings are needed. Memory goes with skip + limit, not with the terms that
// there are; time goes with those that begin with the prefix. Any number of threads may do this at once, also
// while others write.
//
// Throws IndexError where an index cannot be used, SearchTimeoutError.
VANTREL_ELASTIC_EXPORT std::vector<SuggestedTerm> SuggestTerms(const std::vector<std::string>& folders,
                                                               const SuggestRequest& request);

}  // namespace vantrel::elastic
