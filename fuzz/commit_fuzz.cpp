#include "elastic/format/commit.h"

#include "elastic/format/file_names.h"
#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// The file segments_N as it is.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    const Commit commit = ReadCommit(quorelastic::fuzz::FuzzInput(data, size).TakeSource(), 1);
    for (const SegmentInfo& segment : commit.segments) {
      Require(IsSegmentName(segment.name), "a segment's name cannot leave the folder");
      Require(segment.document_count >= 0, "a segment has no negative number of documents");
      Require(segment.deletions_generation >= -1, "no generation is below -1");
    }
  });
}
