#pragma once

#include <chrono>
#include <cstdint>

#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {

// Looks at the clock now and then. For one thread at a time.
class Deadline {
 public:
  // Counted from now; 0 is never.
  explicit Deadline(std::chrono::milliseconds time_limit)
      : is_set_(time_limit.count() > 0), end_(std::chrono::steady_clock::now() + time_limit) {}

  // To be called for each small step. Throws SearchTimeoutError.
  void Check() {
    constexpr uint32_t kEvery = 1024;
    if (is_set_ && ++checks_ % kEvery == 0 && std::chrono::steady_clock::now() > end_) {
      throw SearchTimeoutError();
    }
  }

 private:
  bool is_set_;
  std::chrono::steady_clock::time_point end_;
  uint32_t checks_ = 0;
};

}  // namespace vantrel::elastic
