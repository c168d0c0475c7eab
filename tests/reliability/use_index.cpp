// use_index FOLDER FIELD TERM: does with an index what a daemon would: searches it in several ways, deletes from it,
// merges it, commits. What cannot be done is told in a line that begins with "error: "; then too it ends with status 0.

#include <cstdio>
#include <exception>
#include <string>

#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/search.h"
#include "vantrel/elastic/search_error.h"

namespace {

using namespace vantrel::elastic;

template <typename Operation>
void Try(const char* what, Operation operation) {
  try {
    operation();
    return;
  } catch (const IndexError& error) {
    std::printf("error: %s: %s\n", what, error.what());
  } catch (const SearchError& error) {
    std::printf("error: %s: %s\n", what, error.what());
  }
}

void Search(Index& index, const std::string& query) {
  SearchRequest request;
  request.query = query;
  request.size = 1000;
  const SearchResult result = index.Search(request);
  std::printf("%s: %llu\n", query.c_str(), static_cast<unsigned long long>(result.total));
  for (const SearchHit& hit : result.hits) {
    std::printf(" %.6f", hit.score);
    for (const FieldValues& field : hit.fields) {
      for (const std::string& value : field.values) std::printf(" %s=%s", field.name.c_str(), value.c_str());
    }
    std::printf("\n");
  }
}

void UseIndex(const std::string& path, const std::string& field, const std::string& term) {
  const auto index = Index::Open(path);
  for (const std::string& query :
       {std::string("*:*"), field + ":\"" + term + "\"", field + ":*", field + ":a*",
        std::string("body:\"a the\"~8"), std::string("body:[a TO c]")}) {
    Try("search", [&] { Search(*index, query); });
  }
  Try("delete", [&] { index->Delete(field, term); });
  Try("optimize", [&] { index->Optimize(); });
  Try("commit", [&] { index->Commit(); });
  Try("search", [&] { Search(*index, "*:*"); });
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 4) return 2;
  Try("open", [&] { UseIndex(argv[1], argv[2], argv[3]); });
  return 0;
}
