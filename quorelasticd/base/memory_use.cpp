#include "base/memory_use.h"

#include <malloc.h>

#include <utility>

namespace quorelasticd {

void MemoryUse::GiveBack() {
  constexpr size_t kLarge = size_t{512} << 10;
  if (std::exchange(largest_, 0) >= kLarge) malloc_trim(0);
}

}  // namespace quorelasticd
