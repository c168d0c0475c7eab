#pragma once

#include <cstdint>
#include <string>

namespace quorelastic::testing {

// How much of a file the page cache holds, in pages, and how many pages it has. Throws std::system_error.
struct PageCount {
  uint64_t resident = 0;
  uint64_t all = 0;
};
PageCount CountPages(const std::string& path);

// Has every file of a folder, and of those in it, thrown out of the page cache. False where that cannot be had: file
// systems in memory keep everything there.
bool ThrowOutOfPageCache(const std::string& folder);

}  // namespace quorelastic::testing
