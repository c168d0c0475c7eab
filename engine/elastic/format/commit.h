#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "elastic/format/byte_source.h"
#include "elastic/format/folder.h"

namespace vantrel::elastic::format {

// One segment as a commit describes it. Where the layout is too old to say, "look into the folder" is meant.
struct SegmentInfo {
  static constexpr int64_t kNoDeletions = -1;
  static constexpr int64_t kLookForDeletions = 0;

  enum class Compound { kNo, kYes, kLookForFile };

  std::string name;            // "_0"
  int32_t document_count = 0;  // deleted ones included; 0 or more
  int64_t deletions_generation = kNoDeletions;
  Compound compound = Compound::kLookForFile;
};

// A point in the index's life: the segments that make it up.
struct Commit {
  int64_t generation = 0;
  std::vector<SegmentInfo> segments;
};

// Decodes a file segments_N. Layout, by format number F (the newer the smaller; -9 is written today):
//
//   Int F                       absent, with the Long, when the first Int is 0 or more: that is the oldest
//                               layout, and the Int is the counter
//   Long version, Int counter   counter: number of the next segment
//   Int segment count, then for each segment
//     String name, Int document count
//     up to F = -1, that is all of a segment; from F <= -2 on follow
//     Long deletions generation (-1 none, 0 look for _S.del)
//     F <= -4: Int offset in a shared document store, -1 none; if any: String its segment, Byte compound
//     F <= -3: Byte one norms file for all fields
//     Int count of norm generations, -1 none; a Long each
//     Byte compound (1 yes, -1 no, 0 look for _S.cfs)
//     F <= -6: Int deleted documents;  F <= -7: Byte has positions
//     F <= -9: Int count of diagnostics, two Strings each
//   F = -8: Byte has user data, if so one String;  F <= -9: Int count of user data, two Strings each
//   F <= -5: Long CRC-32 of every byte before it
//
// Bytes after that are ignored. Throws IndexDamagedError, IndexIoError, and IndexError for a file of over
// 256 MiB, which no commit reaches.
Commit ReadCommit(const std::shared_ptr<const ByteSource>& source, int64_t generation);

// Finds the newest commit of the folder that `use` accepts, and hands it over. The newest generation is the
// larger of what the folder lists and what segments.gen says; the one before it is tried where the newest is
// not readable (a commit being written). `use` opens what the commit refers to; where it throws because a
// writer has replaced the commit meanwhile, the search begins again, else its exception passes on.
void UseNewestCommit(const Folder& folder, const std::function<void(Commit)>& use);

}  // namespace vantrel::elastic::format
