#include "support/small_index.h"

#include "support/library_index.h"

namespace quorelastic::testing {

void WriteSmallIndex(const std::string& path, bool compound) {
  LibraryIndex index(path, {.compound = compound});
  for (const char* text : {"alpha beta alpha", "alpha beta alpha", "alpha beta alpha gamma"}) {
    index.Add({{.name = "body", .value = text, .vector = LibraryField::Vector::kPositionsAndOffsets}});
  }
  index.Commit();
  index.Delete("body", "gamma");
}

void WriteSkippingIndex(const std::string& path) {
  LibraryIndex index(path, {.compound = false});
  for (int number = 0; number < 300; ++number)
    index.Add({{.name = "body", .value = "often", .stored = false}});
}

}  // namespace quorelastic::testing
