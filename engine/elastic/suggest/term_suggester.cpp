#include "vantrel/elastic/term_suggester.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <iterator>

namespace vantrel::elastic {
namespace {

// Whole numbers of any type; whatever else a back-end puts there counts as nothing.
uint64_t FrequencyOf(const Suggestion& suggestion) {
  const Json::Value& frequency = suggestion.payload()["doc_freq"];
  return frequency.isUInt64() ? frequency.asUInt64() : 0;
}

bool ComesFirst(const Suggestion& left, const Suggestion& right) {
  const uint64_t left_frequency = FrequencyOf(left);
  const uint64_t right_frequency = FrequencyOf(right);
  if (left_frequency != right_frequency) return left_frequency > right_frequency;
  return left.payload()["term"] < right.payload()["term"];
}

}  // namespace

std::vector<Suggestion> TermSuggester::GetSuggest(const std::string& field, const std::string& prefix,
                                                  unsigned int skip, int limit) const {
  if (limit <= 0) return {};
  const uint64_t most = uint64_t{skip} + static_cast<uint64_t>(limit);
  std::vector<Suggestion> all;
  for (const auto& back_end : back_ends_) {
    if (back_end == nullptr) continue;
    std::vector<Suggestion> offered = back_end->Suggest(field, prefix, most);
    std::move(offered.begin(), offered.end(), std::back_inserter(all));
  }
  std::stable_sort(all.begin(), all.end(), ComesFirst);
  all.erase(all.begin(), all.begin() + static_cast<ptrdiff_t>(std::min<uint64_t>(skip, all.size())));
  if (all.size() > static_cast<size_t>(limit)) all.erase(all.begin() + limit, all.end());
  return all;
}

}  // namespace vantrel::elastic
