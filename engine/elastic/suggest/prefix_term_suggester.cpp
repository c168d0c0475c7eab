#include "vantrel/elastic/prefix_term_suggester.h"

#include <algorithm>
#include <utility>

#include "vantrel/elastic/index.h"
#include "vantrel/elastic/suggest_terms.h"

namespace vantrel::elastic {

std::vector<Suggestion> PrefixTermSuggester::Suggest(const std::string& field, const std::string& prefix,
                                                     uint64_t most) const {
  std::vector<std::string> folders;
  for (const auto& index : indexes_) {
    if (index != nullptr) folders.push_back(index->path());
  }
  const auto most_offered = static_cast<uint64_t>(std::max(most_offered_, 0));
  std::vector<Suggestion> suggestions;
  for (const SuggestedTerm& suggested :
       SuggestTerms(folders, {.field = field, .prefix = prefix, .limit = std::min(most, most_offered)})) {
    JsonValue payload;
    payload["doc_freq"] = Json::UInt64{suggested.document_frequency};
    payload["term"] = suggested.term;
    suggestions.emplace_back("prefix", std::move(payload));
  }
  return suggestions;
}

}  // namespace vantrel::elastic
