#pragma once

#include <chrono>
#include <cstdint>
#include <optional>

namespace vantrel::elastic {

// Gives a search up when its time is over. To look at the clock takes longer than most steps of a search, so it is
// looked at once in so many of them. For one thread at a time.
class TimeCheck {
 public:
  using Deadline = std::optional<std::chrono::steady_clock::time_point>;

  explicit TimeCheck(Deadline deadline) : deadline_(deadline) {}
  TimeCheck(const TimeCheck&) = delete;
  TimeCheck& operator=(const TimeCheck&) = delete;

  bool has_deadline() const { return deadline_.has_value(); }

  // To be called with each step; `weight` is how many documents could have been looked at instead. Throws as
  // LookAtClock().
  void Step(uint32_t weight = 1) {
    steps_ += weight;
    if (steps_ >= kInterval) LookAtClock();
  }

  // Throws the library's TimeExceededException after the deadline.
  void LookAtClock();

 private:
  static constexpr uint32_t kInterval = 1024;

  const Deadline deadline_;
  uint32_t steps_ = 0;  // since the clock was looked at
};

}  // namespace vantrel::elastic
