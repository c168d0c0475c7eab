#pragma once

#include <atomic>
#include <boost/asio/any_io_executor.hpp>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <utility>

#include "base/turns.h"
#include "data_root/index_registry.h"
#include "vantrel/elastic/search_plugin.h"

namespace quorelasticd {

// What the daemon counts of itself.
struct Statistics {
  std::chrono::steady_clock::time_point start = std::chrono::steady_clock::now();
  std::atomic<size_t> connections{0};  // now
  std::atomic<uint64_t> requests{0};
  std::atomic<uint64_t> failed_requests{0};  // those that were answered with an error
};

// What searches work with.
struct Searching {
  const vantrel::elastic::SearchPluginRegistry& plugins;
  // Searches that are few run on the threads of their connections, which spares them two changes of thread. These
  // are fewer turns than such threads: one is always left for everybody else.
  Turns& quick_turns;
  // For the others; apart from writers, so that no merge delays a search.
  boost::asio::any_io_executor executor;
  std::chrono::milliseconds time_limit;
};

// What checks and repairs work with: they wait for most of their time, which would keep writers from a shared thread.
struct HealthWork {
  Turns& turns;                           // as many as there are threads
  boost::asio::any_io_executor executor;  // theirs alone
};

// What the commands work on. For any thread.
class Daemon {
 public:
  // What is referred to must outlive it.
  Daemon(IndexRegistry& registry, Statistics& statistics, Searching searching, HealthWork health)
      : registry_(registry),
        statistics_(statistics),
        searching_(std::move(searching)),
        health_(std::move(health)) {}

  IndexRegistry& registry() const { return registry_; }
  Statistics& statistics() const { return statistics_; }
  const Searching& searching() const { return searching_; }
  const HealthWork& health() const { return health_; }

 private:
  IndexRegistry& registry_;
  Statistics& statistics_;
  Searching searching_;
  HealthWork health_;
};

}  // namespace quorelasticd
