#pragma once

namespace quorelastic::testing {

// Whether a sanitizer watches: it takes memory of its own, and ends a process that runs out.
#ifdef QUORELASTIC_SANITIZED
inline constexpr bool kIsSanitized = true;
#else
inline constexpr bool kIsSanitized = false;
#endif

// How many times fewer cases a long campaign has under a sanitizer, where each takes that much longer.
inline constexpr int kFewer = kIsSanitized ? 8 : 1;

// Why a test that takes all descriptors away is skipped then: to see whether the memory of an object is there, it opens a
// pipe, and takes a look that fails for an object that is bad.
inline constexpr const char* kSanitizerNeedsDescriptors = "the sanitizer needs descriptors of its own";

}  // namespace quorelastic::testing
