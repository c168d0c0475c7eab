#pragma once

#include <atomic>
#include <chrono>
#include <future>
#include <mutex>
#include <string>

#include "vantrel/elastic/index_health.h"

namespace quorelasticd {

// A check of an index under way, on threads of its own. For one thread at a time.
class HealthRun {
 public:
  explicit HealthRun(const std::string& path);
  HealthRun(const HealthRun&) = delete;
  HealthRun& operator=(const HealthRun&) = delete;

  // Cancels the check if it has not ended: HealthOptions::progress says how soon it ends.
  ~HealthRun();

  // Waits for the end, but not longer than that. Whether it has come.
  bool WaitFor(std::chrono::milliseconds most) const {
    return report_.wait_for(most) == std::future_status::ready;
  }

  vantrel::elastic::HealthProgress progress() const;

  // Once at the end. Throws what the check has thrown.
  vantrel::elastic::HealthReport TakeReport() { return report_.get(); }

 private:
  void Note(const vantrel::elastic::HealthProgress& progress);

  mutable std::mutex mutex_;
  vantrel::elastic::HealthProgress progress_;
  std::atomic<bool> is_given_up_ = false;
  std::future<vantrel::elastic::HealthReport> report_;  // the last one: its threads use what is above
};

}  // namespace quorelasticd
