#pragma once

namespace quorelastic::testing {

// Whether a sanitizer watches: it takes memory of its own, and ends a process that runs out.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
inline constexpr bool kIsSanitized = true;
#else
inline constexpr bool kIsSanitized = false;
#endif

}  // namespace quorelastic::testing
