#pragma once

#include <string>

namespace quorelastic::testing {

// What the index library's own checker makes of an index.
enum class LibraryVerdict {
  kClean,
  kNotClean,
  kFailed  // it crashed, ran too long, took too much memory, or threw
};

// Runs the checker in a child process, with 2 GiB of memory (not where a sanitizer needs more) and 10 seconds.
LibraryVerdict CheckWithLibrary(const std::string& path);

}  // namespace quorelastic::testing
