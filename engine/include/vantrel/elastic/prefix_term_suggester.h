#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/term_suggester.h"

namespace vantrel::elastic {

class Index;

// Suggests the terms of a field that begin with what was typed, over several indexes as if they were one; see
// SuggestTerms() for which and in what order. Each suggestion is of the type "prefix".
class VANTREL_ELASTIC_EXPORT PrefixTermSuggester : public TermSuggesterImpl {
 public:
  // The indexes are shared with the caller; an empty pointer among them is passed over. It never offers more than
  // `most_offered`, and nothing where that is 0 or less.
  PrefixTermSuggester(const std::vector<std::shared_ptr<Index>>& indexes, int32_t most_offered)
      : most_offered_(most_offered), indexes_(indexes) {}

  // Throws IndexError where an index cannot be used, also where there is none of its name.
  std::vector<Suggestion> Suggest(const std::string& field, const std::string& prefix,
                                  uint64_t most) const override;

 private:
  int32_t most_offered_;
  std::vector<std::shared_ptr<Index>> indexes_;
};

}  // namespace vantrel::elastic
