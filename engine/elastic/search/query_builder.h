#pragma once

#include <lucene++/LuceneHeaders.h>

#include <string>
#include <vector>

#include "vantrel/elastic/index_settings.h"
#include "vantrel/elastic/search.h"

namespace vantrel::elastic {

// A query string as an index with certain settings understands it.
struct UnderstoodQuery {
  Lucene::QueryPtr query;
  std::vector<std::string> warnings;  // each once
};

// Parses a query string; see SearchRequest for what it means. Throws QuerySyntaxError and LimitExceededError.
UnderstoodQuery BuildQuery(const std::string& query, const IndexSettings& settings,
                           const SearchLimits& limits);

}  // namespace vantrel::elastic
