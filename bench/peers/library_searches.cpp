// Runs searches in this process through the index library alone, by so many threads at once: parses the query,
// takes the ten best, loads their stored fields.

#include <lucene++/LuceneHeaders.h>

#include <atomic>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <string>
#include <thread>
#include <vector>

namespace {

using Lucene::newLucene;
using Lucene::StringUtils;

size_t LoadHits(const Lucene::IndexSearcherPtr& searcher, const Lucene::TopDocsPtr& hits) {
  size_t bytes = 0;
  for (const Lucene::ScoreDocPtr& hit : hits->scoreDocs) {
    for (const Lucene::FieldablePtr& field : searcher->doc(hit->doc)->getFields()) {
      bytes += StringUtils::toUTF8(field->stringValue()).size();
    }
  }
  return bytes;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 4) {
    std::cerr << "usage: peer_library_searches FOLDER QUERIES THREADS\n";
    return 2;
  }
  std::vector<std::string> queries;
  std::ifstream file(argv[2]);
  for (std::string query; std::getline(file, query);) queries.push_back(query);
  const auto reader =
      Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(argv[1])), true);
  const auto searcher = newLucene<Lucene::IndexSearcher>(reader);
  std::atomic<size_t> next = 0;
  std::atomic<size_t> bytes = 0;
  const auto search = [&] {
    constexpr auto kVersion = Lucene::LuceneVersion::LUCENE_30;
    const auto analyzer =
        newLucene<Lucene::StandardAnalyzer>(kVersion, Lucene::HashSet<Lucene::String>::newInstance());
    for (size_t i = next++; i < queries.size(); i = next++) {
      const auto parser = newLucene<Lucene::QueryParser>(kVersion, L"gloss", analyzer);
      const Lucene::QueryPtr query = parser->parse(StringUtils::toUnicode(queries[i]));
      bytes += LoadHits(searcher, searcher->search(query, Lucene::FilterPtr(), 10));
    }
  };
  std::vector<std::thread> threads;
  const size_t count = std::strtoul(argv[3], nullptr, 10);
  threads.reserve(count);
  for (size_t i = 0; i < count; ++i) threads.emplace_back(search);
  for (std::thread& thread : threads) thread.join();
  std::cout << bytes << " bytes of stored fields" << std::endl;
  return bytes > 0 ? 0 : 1;
}
