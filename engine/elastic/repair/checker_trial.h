#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace vantrel::elastic {

// Whether a process lives through an operation of the index library on the index in the folder `path`: it is tried in a
// copy of this one, with 2 GiB of memory and a time that goes with `index_bytes`, a quarter of a second for a small one.
// Whoever does the same next will live through it as well, as it finds the same in the same memory. An exception counts
// as a failure. To be called where the process has no other thread. Throws IndexIoError where there can be no copy, or
// where the copy is killed by somebody else (SIGKILL), as where the machine's memory runs out.
bool SurvivesTrial(const std::string& path, uint64_t index_bytes, const std::function<void()>& operation);

}  // namespace vantrel::elastic
