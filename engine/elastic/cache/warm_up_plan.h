#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace vantrel::elastic {

// A part of a file.
struct Extent {
  std::string path;
  uint64_t offset = 0;
  uint64_t length = 0;

  bool operator==(const Extent&) const = default;
};

// What to bring into the page cache of the indexes under `root`, in which order; see WarmPageCache(). A folder is an
// index where it holds a commit and its name does not begin with a dot. Whatever cannot be looked at is left out.
std::vector<Extent> PlanWarmUp(const std::string& root);

}  // namespace vantrel::elastic
