#pragma once

#include <set>
#include <string>
#include <vector>

namespace quorelastic::testing {

// A file of the repository that these tests stand in.
std::string RepositoryPath(const std::string& path);

// What the last group of a pattern (see FindAll) matches in the sources under a folder of the repository. Tests hold
// documents to it.
std::set<std::string> FindInSources(const std::string& folder, const std::string& pattern);

}  // namespace quorelastic::testing
