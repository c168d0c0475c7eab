#pragma once

#include <chrono>
#include <cstdint>
#include <optional>

#include "elastic/deadline_after.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {

// Looks at the clock now and then. For one thread at a time.
class Deadline {
 public:
  // Counted from now; 0 is never.
  explicit Deadline(std::chrono::milliseconds time_limit) : end_(DeadlineAfter(time_limit)) {}

  // To be called for each small step. Throws SearchTimeoutError.
  void Check() {
    constexpr uint32_t kEvery = 1024;
    if (end_.has_value() && ++checks_ % kEvery == 0 && std::chrono::steady_clock::now() > *end_) {
      throw SearchTimeoutError();
    }
  }

 private:
  std::optional<std::chrono::steady_clock::time_point> end_;
  uint32_t checks_ = 0;
};

}  // namespace vantrel::elastic
