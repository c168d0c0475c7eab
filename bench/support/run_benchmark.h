#pragma once

#include <functional>
#include <string>

namespace quorelastic::bench {

// The main() of a benchmark: hands it a folder for what it needs on disk, which is removed afterwards. The status to
// exit with: 0 where `measure` is content, 1 where a target was missed, 2 where it threw, with the reason on standard
// error.
int RunBenchmark(const std::function<bool(const std::string& folder)>& measure);

}  // namespace quorelastic::bench
