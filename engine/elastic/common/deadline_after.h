#pragma once

#include <chrono>
#include <optional>

namespace vantrel::elastic {

// When a time limit that begins now is over; never where it is 0 or less, or beyond the end of the clock's time.
inline std::optional<std::chrono::steady_clock::time_point> DeadlineAfter(std::chrono::milliseconds limit) {
  using Clock = std::chrono::steady_clock;
  const auto now = Clock::now();
  const auto most = std::chrono::duration_cast<std::chrono::milliseconds>(Clock::time_point::max() - now);
  if (limit.count() <= 0 || limit >= most) return std::nullopt;
  return now + limit;
}

}  // namespace vantrel::elastic
