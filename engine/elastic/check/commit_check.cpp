#include "elastic/check/commit_check.h"

#include <charconv>
#include <string>

#include "elastic/check/mismatch.h"
#include "elastic/common/path.h"
#include "elastic/common/quoted.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/opening_error.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::check {
namespace {

using format::Commit;
using format::SegmentInfo;

std::string CommitPath(const format::Folder& folder, const Commit& commit) {
  return JoinPath(folder.path(), format::CommitFileName(commit.generation));
}

// The number that a segment's name stands for; nothing past 64 bits.
std::optional<int64_t> NumberOf(const std::string& segment) {
  int64_t number = 0;
  const auto [end, error] = std::from_chars(segment.data() + 1, segment.data() + segment.size(), number, 36);
  if (error != std::errc() || end != segment.data() + segment.size()) return std::nullopt;
  return number;
}

// Whether segments.gen tells of a commit that is newer than any in the folder. A writer makes the file known only
// after the commit is on the disk.
bool IsCommitLost(const format::Folder& folder, int64_t hinted) {
  return hinted > format::ListedGeneration(folder) && hinted == format::HintedGeneration(folder) &&
         !folder.Exists(format::CommitFileName(hinted));
}

// A folder without a commit, or with a file that only seems to be one.
void RequireCommitNames(const format::Folder& folder) {
  bool has_commit = format::HintedGeneration(folder) >= 0;
  for (const std::string& name : folder.List()) {
    if (!name.starts_with(format::kSegments) || name == format::kSegmentsGen) continue;
    has_commit = true;
    if (format::CommitGeneration(name).has_value()) continue;
    Refuse(Grade::kDamaged, JoinPath(folder.path(), name), 0,
           "\"segments\" and a generation, as a commit is called", Quoted(name));
  }
  if (has_commit) return;
  Refuse(Grade::kDamaged, folder.path(), 0, "an index", "no segments file");
}

void CheckSegment(const std::string& file, const Commit& commit, const SegmentInfo& segment) {
  const auto refuse = [&](const std::string& expected, const std::string& found) {
    Refuse(Grade::kDamaged, file, 0, "segment " + segment.name + " with " + expected, found);
  };
  const std::optional<int64_t> number = NumberOf(segment.name);
  if (!number.has_value() || *number >= commit.counter) {
    refuse("a number below the next one's, " + std::to_string(commit.counter),
           "that the next segment could take its place");
  }
  if (segment.deleted_count < SegmentInfo::kNotCounted || segment.deleted_count > segment.document_count) {
    refuse("a count of deleted documents up to " + std::to_string(segment.document_count),
           std::to_string(segment.deleted_count));
  }
  if (segment.deletions_generation == SegmentInfo::kNoDeletions && segment.deleted_count > 0) {
    refuse("no deleted documents, having no file of them", std::to_string(segment.deleted_count));
  }
}

}  // namespace

Commit FindCommit(const format::Folder& folder) {
  RequireCommitNames(folder);
  const int64_t hinted = format::HintedGeneration(folder);
  Commit found;
  try {
    found = format::ReadNewestCommit(folder);
  } catch (const IndexIoError& error) {
    if (error.path() == folder.path() || !format::IsAbsenceError(error)) throw;
    throw format::AsMissing(error);
  }
  if (hinted > found.generation && IsCommitLost(folder, hinted)) {
    Refuse(Grade::kDamaged, JoinPath(folder.path(), std::string(format::kSegmentsGen)), 4,
           "the generation of a commit in the folder, such as " + std::to_string(found.generation),
           std::to_string(hinted));
  }
  return found;
}

void CheckCommit(const format::Folder& folder, const Commit& commit) {
  const std::string file = CommitPath(folder, commit);
  RequireEqual(Grade::kDamaged, file, commit.end, "the commit to end at", commit.end, commit.size);
  for (const SegmentInfo& segment : commit.segments) CheckSegment(file, commit, segment);
}

}  // namespace vantrel::elastic::check
