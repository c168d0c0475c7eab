#include "elastic/repair/blame.h"

#include <cstddef>
#include <span>
#include <utility>

namespace vantrel::elastic {
namespace {

using Names = std::span<const std::string>;

class BlameSearch {
 public:
  BlameSearch(Names suspects, const std::function<bool(const std::set<std::string>&)>& survives)
      : survives_(survives), out_(suspects.begin(), suspects.end()) {}

  // Puts back as much of the group as the operation survives.
  void PutBack(Names group, bool is_known_to_fail) {
    if (!is_known_to_fail && TryToPutBack(group)) return;
    if (group.size() == 1) return;
    const size_t half = group.size() / 2;
    const size_t left_out = out_.size() - half;
    PutBack(group.first(half), false);
    // With the first half back, the second one would make up the group that has failed.
    PutBack(group.subspan(half), out_.size() == left_out);
  }

  std::set<std::string> Take() { return std::move(out_); }

 private:
  bool TryToPutBack(Names group) {
    if (trials_left_ == 0) return false;
    --trials_left_;
    std::set<std::string> without = out_;
    for (const std::string& name : group) without.erase(name);
    if (!survives_(without)) return false;
    out_ = std::move(without);
    return true;
  }

  const std::function<bool(const std::set<std::string>&)>& survives_;
  std::set<std::string> out_;
  int trials_left_ = kMostBlameTrials;
};

}  // namespace

std::set<std::string> FindBlame(const std::vector<std::string>& suspects,
                                const std::function<bool(const std::set<std::string>& without)>& survives) {
  if (suspects.empty()) return {};
  BlameSearch search(suspects, survives);
  search.PutBack(suspects, true);
  return search.Take();
}

}  // namespace vantrel::elastic
