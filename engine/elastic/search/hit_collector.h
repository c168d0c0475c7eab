#pragma once

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/Collector.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "elastic/search/time_check.h"

namespace vantrel::elastic {

// A document that a search found.
struct FoundDocument {
  double score = 0;
  size_t index = 0;      // which of the indexes
  int32_t document = 0;  // its number there
};

// Counts what a search over one or more indexes finds, and keeps the best: the higher score first, then the
// earlier index, then the lower document number.
class HitCollector : public Lucene::Collector {
 public:
  // Each document that is found takes part in the time check.
  HitCollector(size_t most_kept, std::shared_ptr<TimeCheck> time);

  // What is collected from now on is from this index.
  void SetIndex(size_t index) { index_ = index; }

  uint64_t total() const { return total_; }
  double max_score() const { return max_score_; }

  // The kept ones, best first.
  std::vector<FoundDocument> TakeBest();

  void setScorer(const Lucene::ScorerPtr& scorer) override;
  void collect(int32_t document) override;
  void setNextReader(const Lucene::IndexReaderPtr& reader, int32_t document_base) override;
  bool acceptsDocsOutOfOrder() override { return true; }

 private:
  size_t most_kept_;
  std::shared_ptr<TimeCheck> time_;
  size_t index_ = 0;
  int32_t document_base_ = 0;
  Lucene::Scorer* scorer_ = nullptr;  // the library's, which calls with it
  uint64_t total_ = 0;
  double max_score_ = 0;
  std::vector<FoundDocument> heap_;  // the worst on top
};

}  // namespace vantrel::elastic
