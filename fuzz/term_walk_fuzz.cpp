#include "elastic/terms/term_walk.h"

#include "elastic/format/segment_files.h"
#include "fuzz_input.h"

using quorelastic::fuzz::FuzzInput;
using quorelastic::fuzz::Require;
using quorelastic::testing::MemoryFolder;
using vantrel::elastic::TermWalk;
namespace format = vantrel::elastic::format;

// A field and a text, each after a byte for its length, where the walks begin by the index over the dictionary, and a
// byte that says whether they pass over terms of deleted documents; then the files of a folder.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzInput input(data, size);
  const std::string field = input.TakeText();
  const std::string text = input.TakeText();
  const bool live_only = input.TakeByte() % 2 != 0;
  MemoryFolder folder;
  input.TakeFiles(folder);
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    for (format::SegmentFiles& files : format::OpenNewestSegments(folder, format::Need::kAll)) {
      // The first segment that is damaged would keep the others from being walked.
      quorelastic::fuzz::DecodeWithinBounds([&] {
        TermWalk walk(std::move(files), live_only);
        walk.StartNear(field, text);
        uint64_t walked = 0;
        for (; walk.Next(); ++walked) Require(walk.Term() != nullptr, "a walk stands at a term");
        Require(walked <= walk.Count(), "no more terms are walked than there are");
      });
    }
  });
}
