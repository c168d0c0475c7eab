#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace quorelastic::testing {

struct LimitedRun {
  int status = 0;          // as of waitpid
  int64_t peak_bytes = 0;  // of memory; at least what this process takes
  std::string output;
  std::string errors;
};

// Runs a program with at most 2 GiB of address space (not where a sanitizer needs more) and 10 seconds, after
// which SIGALRM ends it.
LimitedRun RunLimited(const std::string& program, const std::vector<std::string>& arguments);

// The same for the tool.
LimitedRun RunToolLimited(const std::vector<std::string>& arguments);

}  // namespace quorelastic::testing
