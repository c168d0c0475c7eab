#pragma once

#include <string>

namespace quorelastic::testing {

// Expects that the index in a folder that nobody writes to is clean by two checkers: the index library's own, and the
// engine's reading, which walks every live term of every segment, finds each id once, and as many ids as there are
// documents. They run in a child process, because damage can crash the first.
void ExpectCleanIndex(const std::string& path);

}  // namespace quorelastic::testing
