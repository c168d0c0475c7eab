#pragma once

#include <set>
#include <string>
#include <vector>

namespace quorelastic::testing {

// A file of the repository that these tests stand in.
std::string RepositoryPath(const std::string& path);

// What a pattern's only group matches in the sources under a folder of the repository; tests hold documents to it.
// The pattern is an ECMAScript one, and a match lies within one line or, where it says so, over several.
std::set<std::string> FindInSources(const std::string& folder, const std::string& pattern);

}  // namespace quorelastic::testing
