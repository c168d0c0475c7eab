#pragma once

#include <vector>

#include "elastic/format/io/folder.h"
#include "vantrel/elastic/suggest_terms.h"

namespace vantrel::elastic {

// SuggestTerms for any kind of folder.
std::vector<SuggestedTerm> SuggestTermsIn(const std::vector<const format::Folder*>& folders,
                                          const SuggestRequest& request);

}  // namespace vantrel::elastic
