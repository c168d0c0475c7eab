#include "vantrel/elastic/search.h"

#include <algorithm>
#include <exception>
#include <functional>
#include <set>
#include <utility>

#include "elastic/common/deadline_after.h"
#include "elastic/common/quoted.h"
#include "elastic/index/run_reading.h"
#include "elastic/search/common_searcher.h"
#include "elastic/search/field_filter.h"
#include "elastic/search/hit_collector.h"
#include "elastic/search/query_builder.h"
#include "elastic/search/search_run.h"
#include "elastic/search/stored_fields.h"
#include "elastic/search/time_check.h"
#include "elastic/search/timed_reader.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;

void CheckIndexCount(size_t indexes, const SearchLimits& limits) {
  if (indexes <= limits.indexes) return;
  throw LimitExceededError("indexes", limits.indexes,
                           "the search goes over " + std::to_string(indexes) + " indexes");
}

void CheckRequest(const SearchRequest& request, const SearchLimits& limits) {
  if (request.from > limits.window || request.size > limits.window - request.from) {
    throw LimitExceededError("window", limits.window,
                             "from " + std::to_string(request.from) + " and size " +
                                 std::to_string(request.size) + " reach too far");
  }
  if (request.filters.size() > limits.filters) {
    throw LimitExceededError("filters", limits.filters,
                             "the search has " + std::to_string(request.filters.size()) + " filters");
  }
}

// Null where the request has no filter.
Lucene::FilterPtr MakeFilter(const SearchRequest& request, const SearchPluginRegistry& plugins,
                             const SearchPluginContext& context, const std::shared_ptr<TimeCheck>& time) {
  std::vector<Lucene::FilterPtr> made;
  for (const SearchFilter& filter : request.filters) {
    if (filter.plugin.empty()) continue;
    const auto plugin = plugins.Find(filter.plugin);
    if (plugin == nullptr) throw UnknownPluginError(filter.plugin);
    made.push_back(plugin->MakeFilter(context, filter.data));
    if (!made.back()) throw PluginDataError(filter.plugin, "the plugin made no filter of its data");
  }
  return made.empty() ? Lucene::FilterPtr() : newLucene<AllFilter>(made, time);
}

// What it takes to load a document, in documents looked at.
constexpr uint32_t kLoadWeight = 128;

// Another search has failed on the same snapshot meanwhile, and left behind what is not whole.
class SpoiledSnapshot : public std::exception {
 public:
  explicit SpoiledSnapshot(boost::shared_ptr<DiskDirectory> directory) : directory_(std::move(directory)) {}

  const DiskDirectory& directory() const { return *directory_; }

 private:
  boost::shared_ptr<DiskDirectory> directory_;
};

// How many more snapshots are tried then.
constexpr int kMostSnapshots = 3;

class SearchRun {
 public:
  SearchRun(const std::vector<SearchedIndex>& indexes, const SearchRequest& request,
            const SearchPluginRegistry& plugins, const SearchLimits& limits)
      : indexes_(indexes),
        request_(request),
        limits_(limits),
        time_(std::make_shared<TimeCheck>(DeadlineAfter(request.time_limit))),
        collector_(newLucene<HitCollector>(request.from + request.size, time_)) {
    for (const SearchedIndex& index : indexes_) {
      queries_.push_back(BuildQuery(request.query, index.settings, limits));
      filters_.push_back(MakeFilter(request, plugins, {index.settings, limits}, time_));
    }
  }

  SearchResult Run() {
    Collect();
    SearchResult result;
    result.total = collector_->total();
    result.max_score = collector_->max_score();
    Describe(result);
    LoadHits(result);
    return result;
  }

 private:
  void Collect() {
    std::vector<Lucene::IndexReaderPtr> readers;
    for (const SearchedIndex& index : indexes_) readers.push_back(Timed(index.snapshot->reader()));
    const auto statistics = std::make_shared<CommonStatistics>(readers);
    const auto scale = newLucene<CommonScale>();
    for (size_t i = 0; i < indexes_.size(); ++i) {
      collector_->SetIndex(i);
      Read(indexes_[i], "cannot search", [&] {
        const auto searcher = newLucene<CommonSearcher>(readers[i], statistics);
        searcher->setSimilarity(scale);
        searcher->search(queries_[i].query->weight(searcher), filters_[i], collector_);
      });
    }
  }

  Lucene::IndexReaderPtr Timed(const Lucene::IndexReaderPtr& reader) const {
    return time_->has_deadline() ? newLucene<TimedReader>(reader, time_) : reader;
  }

  static void Read(const SearchedIndex& index, const char* purpose, const std::function<void()>& operation) {
    const auto& directory = index.snapshot->directory();
    RunReading(directory, purpose, [&] {
      try {
        operation();
      } catch (const Lucene::TimeExceededException&) {
        throw SearchTimeoutError();
      } catch (const SearchError&) {
        throw;
      } catch (...) {
        directory->NoteFailedReading();
        throw;
      }
    });
    if (directory->has_failed_reading()) throw SpoiledSnapshot(directory);
  }

  void Describe(SearchResult& result) const {
    std::set<std::string> told;
    const auto warn = [&](const std::string& warning) {
      if (told.insert(warning).second) result.warnings.push_back(warning);
    };
    for (const UnderstoodQuery& query : queries_) {
      if (result.query.empty()) result.query = Lucene::StringUtils::toUTF8(query.query->toString());
      for (const std::string& warning : query.warnings) warn(warning);
    }
    if (!request_.load_fields.has_value()) return;
    for (const std::string& name : *request_.load_fields) {
      const bool is_stored = std::any_of(indexes_.begin(), indexes_.end(), [&](const SearchedIndex& index) {
        return std::any_of(index.settings.fields.begin(), index.settings.fields.end(),
                           [&](const FieldSettings& field) { return field.stored && field.name == name; });
      });
      if (!is_stored) warn("there is no stored field " + Quoted(name) + " to load");
    }
  }

  void LoadHits(SearchResult& result) const {
    const std::vector<FoundDocument> best = collector_->TakeBest();
    std::vector<StoredFields> stored;
    for (const SearchedIndex& index : indexes_) stored.emplace_back(index.settings, request_.load_fields);
    size_t bytes = 0;
    for (size_t i = request_.from; i < best.size(); ++i) {
      const SearchedIndex& index = indexes_[best[i].index];
      SearchHit hit{best[i].index, "", best[i].score, {}};
      Read(index, "cannot load a document", [&] {
        time_->Step(kLoadWeight);
        bytes += stored[best[i].index].Load(*index.snapshot->reader(), best[i].document, hit);
      });
      if (bytes > limits_.result_bytes) {
        throw LimitExceededError("result_bytes", limits_.result_bytes,
                                 "the stored values of the hits take more than that in bytes");
      }
      result.hits.push_back(std::move(hit));
    }
  }

  const std::vector<SearchedIndex>& indexes_;
  const SearchRequest& request_;
  const SearchLimits& limits_;
  std::shared_ptr<TimeCheck> time_;
  boost::shared_ptr<HitCollector> collector_;
  std::vector<UnderstoodQuery> queries_;    // by index
  std::vector<Lucene::FilterPtr> filters_;  // by index
};

}  // namespace

SearchResult RunSearch(const std::function<std::vector<SearchedIndex>()>& open, const SearchRequest& request,
                       const SearchPluginRegistry& plugins, const SearchLimits& limits) {
  CheckRequest(request, limits);
  for (int left = kMostSnapshots;; --left) {
    const std::vector<SearchedIndex> indexes = open();
    try {
      return SearchRun(indexes, request, plugins, limits).Run();
    } catch (const SpoiledSnapshot& spoiled) {
      if (left == 0) spoiled.directory().ThrowFailure("cannot search", "");
    }
  }
}

SearchResult SearchIndexes(const std::vector<std::shared_ptr<Index>>& indexes, const SearchRequest& request,
                           const SearchPluginRegistry& plugins, const SearchLimits& limits) {
  CheckIndexCount(indexes.size(), limits);
  const auto open = [&] {
    std::vector<SearchedIndex> searched;
    searched.reserve(indexes.size());
    for (const std::shared_ptr<Index>& index : indexes) {
      searched.push_back({index->path(), index->settings(), index->NewestSnapshot()});
    }
    return searched;
  };
  return RunSearch(open, request, plugins, limits);
}

}  // namespace vantrel::elastic
