#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <exception>
#include <functional>
#include <mutex>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "elastic/format/io/watched_folder.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic::check {

// Counts what is opened and read, and calls HealthOptions::progress. Thread-safe.
//
// The clock, not the number of bytes, decides when: a byte may take long, on a slow disk or as part of a crafted
// file. The clock is looked at each time that bytes are read. What the callback throws leaves the read at hand, and
// from then on every other read, so that all threads end.
class Meter : public format::ReadWatcher {
 public:
  // Between two calls of the callback.
  static constexpr std::chrono::milliseconds kInterval{20};

  explicit Meter(std::function<void(const HealthProgress&)> callback) : callback_(std::move(callback)) {}

  void NoteOpened(const format::ByteSource& file) override;
  void NoteRead(uint64_t bytes) override;

  // A commit of so many segments is begun.
  void SetSegments(size_t segments) {
    segments_ = segments;
    segments_opened_ = 0;
  }
  void AddSegmentOpened() { ++segments_opened_; }

  // The paths of what was opened since the last call, sorted.
  std::vector<std::string> TakeFiles();

  // Calls the callback, if there is one, with what is counted so far.
  void Report();

 private:
  using Clock = std::chrono::steady_clock;

  void ReportIfDue();

  std::function<void(const HealthProgress&)> callback_;
  std::atomic<Clock::rep> due_ = (Clock::now() + kInterval).time_since_epoch().count();
  std::mutex calling_;       // for what follows
  std::exception_ptr stop_;  // what the callback has thrown
  std::atomic<bool> is_stopped_ = false;

  std::mutex opening_;  // for what follows
  std::set<std::string> files_;
  std::atomic<uint64_t> opened_ = 0;
  std::atomic<uint64_t> read_ = 0;
  std::atomic<size_t> segments_ = 0;
  std::atomic<size_t> segments_opened_ = 0;
};

}  // namespace vantrel::elastic::check
