#include "search_fixture.h"

#include <algorithm>
#include <stdexcept>

namespace quorelastic::testing {

using vantrel::elastic::Document;
using vantrel::elastic::FieldSettings;
using vantrel::elastic::Index;
using vantrel::elastic::SearchFilter;
using vantrel::elastic::SearchHit;
using vantrel::elastic::SearchRequest;
using vantrel::elastic::SearchResult;

SearchRequest Request(const std::string& query) {
  SearchRequest request;
  request.query = query;
  request.size = 1000;
  return request;
}

SearchFilter Filter(const std::string& plugin, const std::string& data) {
  SearchFilter filter;
  filter.plugin = plugin;
  if (!filter.data.fromString(data)) throw std::logic_error("no JSON: " + data);
  return filter;
}

std::vector<std::string> Ids(const SearchResult& result) {
  std::vector<std::string> ids;
  for (const SearchHit& hit : result.hits) ids.push_back(hit.id);
  return ids;
}

std::vector<std::string> SortedIds(const SearchResult& result) {
  std::vector<std::string> ids = Ids(result);
  std::sort(ids.begin(), ids.end());
  return ids;
}

std::vector<std::string> Values(const SearchHit& hit, const std::string& field) {
  for (const auto& loaded : hit.fields) {
    if (loaded.name == field) return loaded.values;
  }
  return {};
}

Document Pieces(const std::vector<std::string>& pieces) {
  Document document;
  for (const std::string& piece : pieces) {
    const size_t equals = piece.find('=');
    document.fields.push_back({piece.substr(0, equals), piece.substr(equals + 1)});
  }
  return document;
}

OwnIndex::OwnIndex(std::vector<FieldSettings> fields) {
  vantrel::elastic::IndexSettings settings;
  settings.fields = std::move(fields);
  index_ = Index::Create(folder_.path(), settings);
}

void OwnIndex::Add(const std::vector<std::string>& pieces) {
  index_->Add(Pieces(pieces));
  index_->Commit();
}

std::vector<std::string> OwnIndex::Find(const std::string& query) const { return Find(query, {}); }

std::vector<std::string> OwnIndex::Find(const std::string& query,
                                        const std::vector<SearchFilter>& filters) const {
  SearchRequest request = Request(query);
  request.filters = filters;
  return SortedIds(index_->Search(request));
}

}  // namespace quorelastic::testing
