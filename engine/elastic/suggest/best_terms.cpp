#include "elastic/suggest/best_terms.h"

#include <algorithm>
#include <string>
#include <utility>

#include "elastic/format/segment/term_order.h"

namespace vantrel::elastic {
namespace {

// As the order of a heap, it puts the worst on top.
constexpr auto kBetter = [](const SuggestedTerm& left, const SuggestedTerm& right) {
  return left.document_frequency != right.document_frequency
             ? left.document_frequency > right.document_frequency
             : left.term < right.term;
};

}  // namespace

bool BestTerms::WouldTake(std::string_view term, uint64_t document_frequency, size_t same) {
  same_as_worst_ = std::min(same_as_worst_, same);
  if (heap_.size() < most_) return true;
  if (heap_.empty()) return false;
  const SuggestedTerm& worst = heap_.front();
  if (document_frequency != worst.document_frequency) return document_frequency > worst.document_frequency;
  same_as_worst_ = format::SameLength(term, worst.term, same_as_worst_);
  return (format::OrdersBefore(term, worst.term, same_as_worst_) & format::kByCodePoints) != 0;
}

void BestTerms::Add(std::string_view term, uint64_t document_frequency) {
  if (!WouldTake(term, document_frequency)) return;
  if (heap_.size() == most_) {
    std::pop_heap(heap_.begin(), heap_.end(), kBetter);
    heap_.pop_back();
  }
  heap_.push_back({std::string(term), document_frequency});
  std::push_heap(heap_.begin(), heap_.end(), kBetter);
  same_as_worst_ = 0;
}

std::vector<SuggestedTerm> BestTerms::Take() {
  std::sort_heap(heap_.begin(), heap_.end(), kBetter);
  return std::exchange(heap_, {});
}

}  // namespace vantrel::elastic
