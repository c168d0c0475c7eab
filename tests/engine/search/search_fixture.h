#pragma once

#include <memory>
#include <string>
#include <vector>

#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search.h"

namespace quorelastic::testing {

// The text of the exception of type E that a call throws; a test failure where it throws none.
template <typename E, typename Call>
E Thrown(Call call) {
  try {
    call();
  } catch (const E& error) {
    return error;
  }
  throw std::logic_error("the expected exception was not thrown");
}

// A request for up to a thousand hits.
vantrel::elastic::SearchRequest Request(const std::string& query);

// A filter by a plugin with data in JSON, which must be right.
vantrel::elastic::SearchFilter Filter(const std::string& plugin, const std::string& data);

// The ids of what was found, in the order it was found in, and sorted.
std::vector<std::string> Ids(const vantrel::elastic::SearchResult& result);
std::vector<std::string> SortedIds(const vantrel::elastic::SearchResult& result);

// The values of a loaded field of a hit.
std::vector<std::string> Values(const vantrel::elastic::SearchHit& hit, const std::string& field);

// An index in a folder of its own, removed with it.
class OwnIndex {
 public:
  explicit OwnIndex(std::vector<vantrel::elastic::FieldSettings> fields);

  // Adds a document of "field=value" pieces and makes it visible.
  void Add(const std::vector<std::string>& pieces);

  vantrel::elastic::Index& operator*() const { return *index_; }
  vantrel::elastic::Index* operator->() const { return index_.get(); }
  const std::shared_ptr<vantrel::elastic::Index>& shared() const { return index_; }
  const std::string& path() const { return folder_.path(); }

  // The sorted ids of all that a query finds, a filter kept in mind.
  std::vector<std::string> Find(const std::string& query) const;
  std::vector<std::string> Find(const std::string& query,
                                const std::vector<vantrel::elastic::SearchFilter>& filters) const;

 private:
  TemporaryFolder folder_;
  std::shared_ptr<vantrel::elastic::Index> index_;
};

// A document of "field=value" pieces.
vantrel::elastic::Document Pieces(const std::vector<std::string>& pieces);

}  // namespace quorelastic::testing
