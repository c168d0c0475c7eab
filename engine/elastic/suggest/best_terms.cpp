#include "elastic/suggest/best_terms.h"

#include <algorithm>
#include <string>
#include <utility>

namespace vantrel::elastic {
namespace {

bool IsBetter(std::string_view left, uint64_t left_frequency, std::string_view right,
              uint64_t right_frequency) {
  return left_frequency != right_frequency ? left_frequency > right_frequency : left < right;
}

// As the order of a heap, it puts the worst on top.
constexpr auto kBetter = [](const SuggestedTerm& left, const SuggestedTerm& right) {
  return IsBetter(left.term, left.document_frequency, right.term, right.document_frequency);
};

}  // namespace

bool BestTerms::WouldTake(std::string_view term, uint64_t document_frequency) const {
  if (heap_.size() < most_) return true;
  if (heap_.empty()) return false;
  return IsBetter(term, document_frequency, heap_.front().term, heap_.front().document_frequency);
}

void BestTerms::Add(std::string_view term, uint64_t document_frequency) {
  if (!WouldTake(term, document_frequency)) return;
  if (heap_.size() == most_) {
    std::pop_heap(heap_.begin(), heap_.end(), kBetter);
    heap_.pop_back();
  }
  heap_.push_back({std::string(term), document_frequency});
  std::push_heap(heap_.begin(), heap_.end(), kBetter);
}

std::vector<SuggestedTerm> BestTerms::Take() {
  std::sort_heap(heap_.begin(), heap_.end(), kBetter);
  return std::exchange(heap_, {});
}

}  // namespace vantrel::elastic
