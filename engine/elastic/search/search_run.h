#pragma once

#include <functional>
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

// What SearchIndexes does, of which see there, on the snapshots that `open` hands out. It is asked for newer ones where
// another search has failed on the same.
SearchResult RunSearch(const std::function<std::vector<SearchedIndex>()>& open, const SearchRequest& request,
                       const SearchPluginRegistry& plugins, const SearchLimits& limits);

}  // namespace vantrel::elastic
