#pragma once

#include <sys/resource.h>
#include <unistd.h>

#include "support/sanitized.h"

namespace quorelastic::testing {

// What a child process that meets damage is to get by with: 2 GiB of addresses, ten seconds, and no core file.
inline void LimitChild() {
  constexpr rlim_t kMostMemory = rlim_t{2} << 30;
  constexpr unsigned kMostSeconds = 10;
  const rlimit no_core = {0, 0};
  setrlimit(RLIMIT_CORE, &no_core);
  const rlimit memory = {kMostMemory, kMostMemory};
  if (!kIsSanitized) setrlimit(RLIMIT_AS, &memory);
  alarm(kMostSeconds);
}

}  // namespace quorelastic::testing
