#include "base/memory_use.h"

#include <malloc.h>

#include <atomic>
#include <chrono>
#include <cstdint>
#include <utility>

namespace quorelasticd {
namespace {

// At most every 20 milliseconds in the whole process: meanwhile the allocator's locks are held.
bool IsTimeToTrim() {
  constexpr int64_t kPause = 20;
  static std::atomic<int64_t> next{0};  // in milliseconds of the steady clock
  const int64_t now = std::chrono::duration_cast<std::chrono::milliseconds>(
                          std::chrono::steady_clock::now().time_since_epoch())
                          .count();
  int64_t expected = next;
  return now >= expected && next.compare_exchange_strong(expected, now + kPause);
}

}  // namespace

void MemoryUse::GiveBack() {
  constexpr size_t kLarge = size_t{512} << 10;
  static std::atomic<bool> is_due{false};
  if (std::exchange(largest_, 0) >= kLarge) is_due = true;
  if (is_due && IsTimeToTrim() && is_due.exchange(false)) malloc_trim(0);
}

}  // namespace quorelasticd
