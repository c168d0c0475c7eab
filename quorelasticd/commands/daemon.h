#pragma once

#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>

#include "data_root/index_registry.h"

namespace quorelasticd {

// What the daemon counts of itself.
struct Statistics {
  std::chrono::steady_clock::time_point start = std::chrono::steady_clock::now();
  std::atomic<size_t> connections{0};  // now
  std::atomic<uint64_t> requests{0};
  std::atomic<uint64_t> failed_requests{0};  // those that were answered with an error
};

// What the commands work on. For any thread.
class Daemon {
 public:
  // Both must outlive it.
  Daemon(IndexRegistry& registry, Statistics& statistics) : registry_(registry), statistics_(statistics) {}

  IndexRegistry& registry() const { return registry_; }
  Statistics& statistics() const { return statistics_; }

 private:
  IndexRegistry& registry_;
  Statistics& statistics_;
};

}  // namespace quorelasticd
