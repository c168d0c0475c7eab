#pragma once

#include <lucene++/LuceneHeaders.h>

#include <algorithm>
#include <map>
#include <string>
#include <vector>

#include "vantrel/elastic/suggest_terms.h"

namespace quorelastic::testing {

// What an index holds of each field's terms, as the index library tells: in how many documents by the dictionaries,
// and whether any of these lives.
struct LibraryFrequency {
  uint64_t documents = 0;
  bool is_live = false;
};
using LibraryFrequencies = std::map<std::string, std::map<std::string, LibraryFrequency>>;

// Reads every dictionary of some indexes through the index library alone: slow, plain, and what suggestions are
// judged by.
inline LibraryFrequencies ReadLibraryFrequencies(const std::vector<std::string>& paths) {
  using Lucene::StringUtils;
  LibraryFrequencies frequencies;
  for (const std::string& path : paths) {
    const auto reader =
        Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(path)), true);
    for (const Lucene::IndexReaderPtr& segment : reader->getSequentialSubReaders()) {
      const Lucene::TermEnumPtr terms = segment->terms();
      while (terms->next()) {
        const Lucene::TermPtr term = terms->term();
        LibraryFrequency& entry =
            frequencies[StringUtils::toUTF8(term->field())][StringUtils::toUTF8(term->text())];
        entry.documents += static_cast<uint64_t>(terms->docFreq());
        entry.is_live = segment->termDocs(term)->next() || entry.is_live;
      }
    }
    reader->close();
  }
  return frequencies;
}

// All suggestions that there are, in their order.
inline std::vector<vantrel::elastic::SuggestedTerm> SuggestByBruteForce(const LibraryFrequencies& frequencies,
                                                                        const std::string& field,
                                                                        const std::string& prefix) {
  std::vector<vantrel::elastic::SuggestedTerm> suggestions;
  const auto terms = frequencies.find(field);
  if (terms == frequencies.end()) return suggestions;
  for (const auto& [text, frequency] : terms->second) {
    if (text.starts_with(prefix) && frequency.is_live) suggestions.push_back({text, frequency.documents});
  }
  std::stable_sort(suggestions.begin(), suggestions.end(), [](const auto& left, const auto& right) {
    return left.document_frequency > right.document_frequency;
  });
  return suggestions;
}

}  // namespace quorelastic::testing
