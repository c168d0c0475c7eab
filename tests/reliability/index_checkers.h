#pragma once

#include <string>
#include <vector>

namespace quorelastic::testing {

// What the index library's own checker finds wrong with the index in a folder that nobody writes to; "" where it
// finds nothing. It runs in a child process, because damage can crash it.
std::string FindDamageByLibrary(const std::string& path);

// The ids of the documents that are not deleted, as the engine's own reading finds them: every live term of every
// segment is walked, and those of the field "id" are handed back, sorted. An id that two segments hold comes twice.
// Throws IndexError where the index is damaged.
std::vector<std::string> WalkLiveIds(const std::string& path);

// Expects that both find nothing wrong, that each id is there once, and that the documents are as many.
void ExpectCleanIndex(const std::string& path);

}  // namespace quorelastic::testing
