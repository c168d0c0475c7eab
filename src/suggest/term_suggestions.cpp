#include "suggest/term_suggestions.h"

#include <cstdint>
#include <iostream>
#include <memory>
#include <vector>

#include "error/report_lucene_errors.h"
#include "vantrel/elastic/index_container.h"
#include "vantrel/elastic/prefix_term_suggester.h"
#include "vantrel/elastic/term_suggester.h"

namespace {

using vantrel::elastic::Index;
using vantrel::elastic::IndexContainer;
using vantrel::elastic::PrefixTermSuggester;
using vantrel::elastic::Suggestion;
using vantrel::elastic::TermSuggester;

constexpr int32_t kMostOffered = 10;
constexpr unsigned int kSkip = 0;
constexpr int kLimit = 10;

}  // namespace

void ShowSuggestions(const std::string& index_name, const std::string& field, const std::string& prefix) {
  std::vector<std::shared_ptr<Index>> indexes;
  // What is thrown here is not reported: it ends the run.
  indexes.push_back(IndexContainer::Instance()->IndexGet(index_name));
  ReportLuceneErrors([&] {
    const auto suggester = std::make_shared<TermSuggester>();
    suggester->AddBackEnd(std::make_shared<PrefixTermSuggester>(indexes, kMostOffered));
    for (const Suggestion& suggestion : suggester->GetSuggest(field, prefix, kSkip, kLimit)) {
      std::cout << "type: " << suggestion.type() << ", " << suggestion.payload().toString() << std::endl;
    }
  });
}
