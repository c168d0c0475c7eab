#pragma once

#include <functional>
#include <set>
#include <string>
#include <vector>

namespace vantrel::elastic {

// How often FindBlame tries at most. A trial on a small index takes up to a quarter of a second.
inline constexpr int kMostBlameTrials = 20;

// Returns those of the `suspects`, names of segments, that make an operation fail. `survives` tries the operation on an
// index without some of the suspects; with all of them it has failed before.
//
// All suspects are taken out and put back in groups. A group that makes the operation fail is halved, down to single
// segments. So none of the segments returned could be put back alone. Where segments do harm only together, the first
// of the suspects are kept. To find one segment among n takes at most 2 log2(n) trials. After kMostBlameTrials, the
// segments that have not been put back are returned, too.
std::set<std::string> FindBlame(const std::vector<std::string>& suspects,
                                const std::function<bool(const std::set<std::string>& without)>& survives);

}  // namespace vantrel::elastic
