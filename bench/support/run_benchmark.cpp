#include "support/run_benchmark.h"

#include <exception>
#include <iostream>

#include "support/scratch_folder.h"

namespace quorelastic::bench {

int RunBenchmark(const std::function<bool(const std::string& folder)>& measure) {
  try {
    const ScratchFolder folder;
    return measure(folder.path()) ? 0 : 1;
  } catch (const std::exception& error) {
    std::cerr << error.what() << std::endl;
    return 2;
  }
}

}  // namespace quorelastic::bench
