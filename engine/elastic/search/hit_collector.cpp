#include "elastic/search/hit_collector.h"

// Not without the index library's main header.
#include <lucene++/Scorer.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <tuple>
#include <utility>

namespace vantrel::elastic {
namespace {

// Boosts within boosts can leave the range of a score; neither the order nor JSON could do with what comes of that.
double FiniteScore(double score) {
  constexpr double kLargest = std::numeric_limits<float>::max();
  if (std::isnan(score)) return 0;
  return std::clamp(score, -kLargest, kLargest);
}

bool IsBetter(const FoundDocument& a, const FoundDocument& b) {
  if (a.score != b.score) return a.score > b.score;
  return std::tie(a.index, a.document) < std::tie(b.index, b.document);
}

}  // namespace

HitCollector::HitCollector(size_t most_kept, std::shared_ptr<TimeCheck> time)
    : most_kept_(most_kept), time_(std::move(time)) {}

std::vector<FoundDocument> HitCollector::TakeBest() {
  std::sort(heap_.begin(), heap_.end(), IsBetter);
  return std::move(heap_);
}

void HitCollector::setScorer(const Lucene::ScorerPtr& scorer) { scorer_ = scorer.get(); }

void HitCollector::collect(int32_t document) {
  const FoundDocument found{FiniteScore(scorer_->score()), index_, document_base_ + document};
  max_score_ = total_ == 0 ? found.score : std::max(max_score_, found.score);
  ++total_;
  time_->Step();
  if (heap_.size() < most_kept_) {
    heap_.push_back(found);
    std::push_heap(heap_.begin(), heap_.end(), IsBetter);
  } else if (most_kept_ > 0 && IsBetter(found, heap_.front())) {
    std::pop_heap(heap_.begin(), heap_.end(), IsBetter);
    heap_.back() = found;
    std::push_heap(heap_.begin(), heap_.end(), IsBetter);
  }
}

void HitCollector::setNextReader(const Lucene::IndexReaderPtr& /*reader*/, int32_t document_base) {
  time_->LookAtClock();
  document_base_ = document_base;
}

}  // namespace vantrel::elastic
