#pragma once

#include <string>
#include <vector>

namespace quorelastic::bench {

// Queries such as people ask of WordNet, each in one of several forms: a word, two alternatives, two words that
// must both be there, a phrase, a field. Made of the words of its glosses, the same in every run.
std::vector<std::string> MakeWordnetQueries(size_t count);

}  // namespace quorelastic::bench
