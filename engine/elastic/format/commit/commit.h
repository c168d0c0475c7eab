#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "elastic/format/io/byte_source.h"
#include "elastic/format/io/folder.h"

namespace vantrel::elastic::format {

// One segment as a commit describes it. Where the layout is too old to say, "look into the folder" is meant.
struct SegmentInfo {
  static constexpr int64_t kNoDeletions = -1;
  static constexpr int64_t kLookForDeletions = 0;

  enum class Compound { kNo, kYes, kLookForFile };

  static constexpr int32_t kOwnStore = -1;
  static constexpr int32_t kNotCounted = -1;
  static constexpr int64_t kNoOwnNorms = -1;
  static constexpr int64_t kLookForNorms = 0;

  std::string name;            // "_0"
  int32_t document_count = 0;  // deleted ones included; 0 or more
  int64_t deletions_generation = kNoDeletions;
  int32_t deleted_count = kNotCounted;
  Compound compound = Compound::kLookForFile;

  // Where the stored fields and term vectors begin in a document store that several segments share.
  int32_t store_offset = kOwnStore;
  std::string store_segment = {};  // the store's name, that of a segment
  bool store_is_compound = false;

  // All norms in one file (.nrm), but for those that were changed: by field number, the generation of the file
  // with a field's own norms (.sN). Absent: the norms of no field were changed; in the older layouts, look.
  bool has_norms_file = false;
  std::optional<std::vector<int64_t>> norm_generations = {};

  std::optional<bool> has_positions = {};  // whether any field's postings have some
};

// A point in the index's life: the segments that make it up.
struct Commit {
  int64_t generation = 0;
  int32_t format = 0;   // 0 for the oldest layout
  int32_t counter = 0;  // the number of the next segment
  std::vector<SegmentInfo> segments;
  uint64_t end = 0;   // where in the file the layout ends
  uint64_t size = 0;  // of the file
};

// Room for any commit: its bytes, its segments, and of all its segments together the generations of norms, and the
// strings of diagnostics and user data with their bytes. They bound the time and memory of whoever reads a commit; the
// index library takes some two hundred bytes for a short string.
inline constexpr uint64_t kLargestCommit = uint64_t{8} << 20;
inline constexpr int32_t kMostSegments = int32_t{1} << 12;
inline constexpr int64_t kMostNormGenerations = int64_t{1} << 19;
inline constexpr uint64_t kMostCommitStrings = uint64_t{1} << 17;
inline constexpr uint64_t kMostCommitStringBytes = uint64_t{2} << 20;

inline constexpr int32_t kNewestCommitFormat = -9;

// Decodes a file segments_N. Layout, by format number F (the newer the smaller; -9 is written today):
//
//   Int F                       absent, with the Long, when the first Int is 0 or more: that is the oldest
//                               layout, only in the file "segments", and the Int is the counter
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
//   the oldest layout: Long version, or nothing
//
// Bytes after a checksum are ignored. A layout without one must end where the file does: a file of zeros, or with a
// flipped bit in F, would else be read as a commit of few segments or none, and a writer would delete the rest.
//
// What is returned makes sense: each segment is there once, no two segments have the same documents of a shared store,
// all documents together are at most 2^31 - 1, and offsets and generations are not below -1. So whoever goes through
// the segments of a commit does the work of each segment's files once. (The index library accepts a repeated segment,
// and reads its files each time.)
//
// Throws IndexDamagedError, also for a file larger than kLargestCommit, and IndexIoError. Whoever leaves it to others to
// compare the checksum takes kPassOver.
enum class CommitChecksum { kCompare, kPassOver };
Commit ReadCommit(const std::shared_ptr<const ByteSource>& source, int64_t generation,
                  CommitChecksum checksum = CommitChecksum::kCompare);

// What segments.gen says of the newest generation, -1 where it is missing, torn or unreadable: it is but a hint.
//
//   Int -2, Long generation, Long the same generation
int64_t HintedGeneration(const Folder& folder);

// The newest generation that the folder lists, -1 without any. Throws IndexIoError, and IndexError for a name that
// stands for a commit, but holds no generation.
int64_t ListedGeneration(const Folder& folder);

// Finds the newest commit of the folder that `use` accepts, and hands it over. The newest generation is the larger of
// what the folder lists and what segments.gen says. The generation before it is tried where the newest is missing,
// incomplete or damaged: its writer may still be at work. `use` opens what the commit refers to; where a file is
// missing because a writer has replaced the commit meanwhile, the search begins again.
//
// Any other refusal of the system (EACCES, EMFILE, EIO, ENOMEM ...), of the commit's own file or in `use`, is thrown at
// once: it says nothing about the commit, and is no reason to use an older one.
void UseNewestCommit(const Folder& folder, const std::function<void(Commit)>& use);

// The same for who needs no more than the commit.
Commit ReadNewestCommit(const Folder& folder);

}  // namespace vantrel::elastic::format
