#include "elastic/suggest/merged_prefix_walk.h"

#include <algorithm>
#include <utility>

namespace vantrel::elastic {
namespace {

// The order of a heap with the smallest term on top.
constexpr auto kLater = [](const PrefixWalk* left, const PrefixWalk* right) {
  return left->text() > right->text();
};

}  // namespace

MergedPrefixWalk::MergedPrefixWalk(std::vector<std::unique_ptr<PrefixWalk>> walks)
    : walks_(std::move(walks)) {
  for (const auto& walk : walks_) at_term_.push_back(walk.get());
}

bool MergedPrefixWalk::Next() {
  for (PrefixWalk* const walk : at_term_) {
    if (!walk->Next()) continue;
    ahead_.push_back(walk);
    std::push_heap(ahead_.begin(), ahead_.end(), kLater);
  }
  at_term_.clear();
  if (ahead_.empty()) return false;
  do {
    TakeSmallest();
  } while (!ahead_.empty() && ahead_.front()->text() == text());
  return true;
}

void MergedPrefixWalk::TakeSmallest() {
  std::pop_heap(ahead_.begin(), ahead_.end(), kLater);
  at_term_.push_back(ahead_.back());
  ahead_.pop_back();
}

uint64_t MergedPrefixWalk::document_frequency() const {
  uint64_t sum = 0;
  for (const PrefixWalk* const walk : at_term_) sum += static_cast<uint64_t>(walk->document_frequency());
  return sum;
}

bool MergedPrefixWalk::IsLive() const {
  return std::any_of(at_term_.begin(), at_term_.end(),
                     [](PrefixWalk* walk) { return walk->IsLiveAtFirstSight(); }) ||
         std::any_of(at_term_.begin(), at_term_.end(), [](PrefixWalk* walk) { return walk->IsLive(); });
}

}  // namespace vantrel::elastic
