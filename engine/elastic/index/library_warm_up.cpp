#include "elastic/index/library_warm_up.h"

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/SerialMergeScheduler.h>

#include <chrono>
#include <memory>
#include <mutex>

#include "elastic/index/text_analyzer.h"
#include "elastic/search/hit_collector.h"
#include "elastic/search/query_builder.h"
#include "elastic/search/time_check.h"
#include "elastic/search/timed_reader.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;

Lucene::IndexReaderPtr WriteAndOpen(const Lucene::DirectoryPtr& directory) {
  const auto writer = newLucene<Lucene::IndexWriter>(directory, NewTextAnalyzer(), true,
                                                     Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
  // The default one leaves a thread behind, which could outlive the library's statics.
  writer->setMergeScheduler(newLucene<Lucene::SerialMergeScheduler>());
  for (int i = 0; i < 3; ++i) {
    const auto document = newLucene<Lucene::Document>();
    document->add(newLucene<Lucene::Field>(L"text", L"one two three", Lucene::AbstractField::STORE_YES,
                                           Lucene::AbstractField::INDEX_ANALYZED,
                                           Lucene::AbstractField::TERM_VECTOR_WITH_POSITIONS_OFFSETS));
    writer->addDocument(document);
    writer->commit();
  }
  writer->deleteDocuments(newLucene<Lucene::Term>(L"text", L"four"));
  writer->optimize();
  writer->close();
  return Lucene::IndexReader::open(directory, true);
}

// Goes once through everything that searching and writing use.
void WarmUp() {
  IndexSettings settings;
  settings.fields = {{.name = "text"}};
  const Lucene::IndexReaderPtr reader = WriteAndOpen(newLucene<Lucene::RAMDirectory>());
  const auto time = std::make_shared<TimeCheck>(std::chrono::steady_clock::time_point::max());
  const auto searcher = newLucene<Lucene::IndexSearcher>(newLucene<TimedReader>(reader, time));
  for (const char* query : {"one", "one two", "+one -two", "\"one two\"", "\"one three\"~5", "t*", "*o*",
                            "twi~", "[one TO two]", "*:*", "one AND (two OR three)^2"}) {
    searcher->search(BuildQuery(query, settings, SearchLimits()).query, newLucene<HitCollector>(10, time));
  }
  reader->document(0);
  reader->reopen()->close();
}

}  // namespace

void WarmUpIndexLibrary() {
  static std::once_flag once;
  std::call_once(once, WarmUp);
}

}  // namespace vantrel::elastic
