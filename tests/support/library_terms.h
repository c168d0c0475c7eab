#pragma once

#include <string>
#include <vector>

namespace quorelastic::testing {

struct LibraryTerm {
  std::wstring field;
  std::wstring text;

  bool operator==(const LibraryTerm&) const = default;
};

// The dictionary of one segment.
struct LibrarySegment {
  std::string name;
  std::vector<LibraryTerm> all;
  std::vector<LibraryTerm> live;  // those that at least one document holds that is not deleted
};

// Reads every dictionary of an index through the index library alone, one term after the other: slow, plain, and
// what the engine's reading is judged by.
std::vector<LibrarySegment> ReadLibraryTerms(const std::string& index_path);

}  // namespace quorelastic::testing
