#pragma once

#include <cstdint>
#include <string>

namespace quorelastic::testing {

// The number above 0 that the environment variable `name` holds, `by_default` where it is not set: how the long runs
// are told from the short ones. Throws std::runtime_error where it holds something else.
int RunSize(const char* name, int by_default);

// What the run's random choices hang on: the environment variable QUORELASTIC_SEED, else `by_default`, or another each
// time. It is printed, so that a run can be repeated.
uint32_t RunSeed();
uint32_t RunSeed(uint32_t by_default);

// Tells a figure of the run called `run`, on a line of its own.
void Tell(const std::string& run, const std::string& figure);

}  // namespace quorelastic::testing
