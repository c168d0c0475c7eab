#pragma once

#include <memory>
#include <string>
#include <vector>

#include "elastic/search/snapshot.h"
#include "vantrel/elastic/index_settings.h"
#include "vantrel/elastic/search.h"

namespace vantrel::elastic {

// One of the indexes that a search goes over.
struct SearchedIndex {
  const std::string& path;
  const IndexSettings& settings;
  std::shared_ptr<const Snapshot> snapshot;
};

// What SearchIndexes does, of which see there, once the indexes' snapshots are at hand.
SearchResult RunSearch(const std::vector<SearchedIndex>& indexes, const SearchRequest& request,
                       const SearchPluginRegistry& plugins, const SearchLimits& limits);

}  // namespace vantrel::elastic
