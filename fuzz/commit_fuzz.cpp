#include "elastic/format/commit/commit.h"

#include <cstdint>
#include <set>
#include <string>

#include "elastic/format/commit/file_names.h"
#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// The file segments_N as it is, and as "segments", where the oldest layout may stand.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  for (const int64_t generation : {0, 1}) {
    quorelastic::fuzz::DecodeWithinBounds([&] {
      const Commit commit = ReadCommit(quorelastic::fuzz::FuzzInput(data, size).TakeSource(), generation);
      std::set<std::string> names;
      for (const SegmentInfo& segment : commit.segments) {
        Require(IsSegmentName(segment.name), "a segment's name cannot leave the folder");
        Require(names.insert(segment.name).second, "a segment is there once");
        Require(segment.document_count >= 0, "a segment has no negative number of documents");
        Require(segment.deletions_generation >= -1, "no generation is below -1");
      }
    });
  }
  return 0;
}
