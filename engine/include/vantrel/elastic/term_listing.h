#pragma once

#include <memory>
#include <optional>
#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// The terms of an index in order, each once.
struct TermListingRequest {
  std::optional<std::string> field = {};  // all fields without
  std::string prefix = {};                // bytes of UTF-8, may end within a character
  bool live_only = false;                 // only terms that a document holds which is not deleted
};

// Walks the terms of all segments of an index together, by field and then by text, in the order of their bytes. The
// index is the folder of its files, taken byte for byte, and is seen as of its newest commit; nothing is created, locked
// or changed. The files stay open, so that nothing written meanwhile disturbs the walk. Where a field is selected, the
// walk reads the dictionary near its terms only; it checks that the index over the dictionary led to the right place.
//
// Time goes with the bytes of the files that are read, memory with the number of segments. For one thread at a time.
// Everything may throw IndexError.
class VANTREL_ELASTIC_EXPORT TermListing {
 public:
  TermListing(const std::string& folder, const TermListingRequest& request);
  TermListing(const TermListing&) = delete;
  TermListing& operator=(const TermListing&) = delete;
  ~TermListing();

  enum class Move {
    kTerm,        // a term that was selected
    kPassedOver,  // nothing yet, but this has taken time
    kEnd,
  };
  Move Next();

  // The term that Next() came to, in UTF-8.
  const std::string& field() const;
  const std::string& text() const;

 private:
  class Walk;

  std::unique_ptr<Walk> walk_;
};

}  // namespace vantrel::elastic
