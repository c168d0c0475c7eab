#pragma once

#include <cstdint>
#include <memory>
#include <string_view>
#include <vector>

#include "elastic/suggest/prefix_walk.h"

namespace vantrel::elastic {

// Several walks together, each term once, in the order of their bytes. For one thread at a time. Everything may
// throw what a PrefixWalk throws.
class MergedPrefixWalk {
 public:
  explicit MergedPrefixWalk(std::vector<std::unique_ptr<PrefixWalk>> walks);

  // Moves to the next term, at first to the first one; false when there is none.
  bool Next();

  // The term, while Next() has returned true last; valid until the next call.
  std::string_view text() const { return at_term_.front()->text(); }

  // In how many documents it is by the dictionaries: those that are deleted count until they are merged away.
  uint64_t document_frequency() const;

  // Whether at least one document holds it that is not deleted.
  bool IsLive() const;

  // Throws IndexDamagedError about the term.
  [[noreturn]] void Damaged(const std::string& problem) const { at_term_.front()->Damaged(problem); }

 private:
  void TakeSmallest();

  std::vector<std::unique_ptr<PrefixWalk>> walks_;
  std::vector<PrefixWalk*> ahead_;    // a heap, the smallest term first
  std::vector<PrefixWalk*> at_term_;  // those that stand at the term
};

}  // namespace vantrel::elastic
