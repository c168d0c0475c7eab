#include "support/run_benchmark.h"

#include <csignal>
#include <exception>
#include <iostream>

#include "support/scratch_folder.h"

namespace quorelastic::bench {

int RunBenchmark(const std::function<bool(const std::string& folder)>& measure) {
  // Closed output ends the benchmark by an exception, so that what it started and wrote is cleaned up. A handler, unlike
  // an ignored signal, is not passed on to the programs that are measured.
  std::signal(SIGPIPE, [](int) {});
  std::cout.exceptions(std::ios::badbit);
  try {
    const ScratchFolder folder;
    return measure(folder.path()) ? 0 : 1;
  } catch (const std::exception& error) {
    std::cerr << error.what() << std::endl;
    return 2;
  }
}

}  // namespace quorelastic::bench
