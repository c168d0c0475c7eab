#pragma once

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/DefaultSimilarity.h>

#include <cstdint>
#include <map>
#include <memory>
#include <utility>
#include <vector>

namespace vantrel::elastic {

// What a term weighs in a search, counted over all the indexes that it goes over. For one thread at a time.
class CommonStatistics {
 public:
  explicit CommonStatistics(std::vector<Lucene::IndexReaderPtr> readers);

  int32_t CountDocuments() const { return documents_; }
  int32_t CountDocumentsWith(const Lucene::TermPtr& term);

 private:
  std::vector<Lucene::IndexReaderPtr> readers_;
  int32_t documents_ = 0;
  std::map<std::pair<Lucene::String, Lucene::String>, int32_t> known_;  // by field and text
};

// Scales the scores of a query as it did those of the first index that it was asked for: the same query may be
// made up differently in another index, where a pattern stands for other terms.
class CommonScale : public Lucene::DefaultSimilarity {
 public:
  double queryNorm(double sum_of_squared_weights) override;

 private:
  double scale_ = 0;  // none yet
};

// Searches one index, with scores that can be compared to those in the others.
class CommonSearcher : public Lucene::IndexSearcher {
 public:
  CommonSearcher(const Lucene::IndexReaderPtr& index_reader, std::shared_ptr<CommonStatistics> statistics);

  int32_t docFreq(const Lucene::TermPtr& term) override { return statistics_->CountDocumentsWith(term); }
  int32_t maxDoc() override { return statistics_->CountDocuments(); }

 private:
  std::shared_ptr<CommonStatistics> statistics_;
};

}  // namespace vantrel::elastic
