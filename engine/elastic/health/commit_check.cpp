#include "elastic/health/commit_check.h"

#include <algorithm>
#include <charconv>
#include <limits>
#include <set>
#include <string>
#include <utility>

#include "elastic/format/file_names.h"
#include "elastic/format/opening_error.h"
#include "elastic/format/quoted.h"
#include "elastic/health/mismatch.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::health {
namespace {

using format::Commit;
using format::SegmentInfo;

std::string CommitPath(const format::Folder& folder, const Commit& commit) {
  return format::JoinPath(folder.path(), format::CommitFileName(commit.generation));
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
    Refuse(Grade::kDamaged, format::JoinPath(folder.path(), name), 0,
           "\"segments\" and a generation, as a commit is called", format::Quoted(name));
  }
  if (has_commit) return;
  Refuse(Grade::kDamaged, folder.path(), 0, "an index", "no segments file");
}

void RefuseTooLarge(const format::Folder& folder, int64_t hinted) {
  const auto newest = folder.Open(format::CommitFileName(std::max(hinted, format::ListedGeneration(folder))));
  if (newest->size() <= format::kLargestCommit) return;
  Refuse(Grade::kUnsafe, newest->name(), 0,
         "a commit of up to " + std::to_string(format::kLargestCommit) + " bytes",
         std::to_string(newest->size()));
}

// A newer commit that is incomplete is passed over, but not one that the disk cannot read: there is no verdict then.
void RequireReadable(const format::Folder& folder, const Commit& found) {
  const int64_t newest = format::ListedGeneration(folder);
  if (newest <= found.generation) return;
  try {
    format::ReadCommit(folder.Open(format::CommitFileName(newest)), newest);
  } catch (const IndexIoError& error) {
    if (!format::IsMissingError(error)) throw;
  } catch (const IndexError&) {
    // Incomplete, as was to be expected.
  }
}

void CheckSegment(const std::string& file, const Commit& commit, const SegmentInfo& segment) {
  const auto refuse = [&](Grade grade, const std::string& expected, const std::string& found) {
    Refuse(grade, file, 0, "segment " + segment.name + " with " + expected, found);
  };
  const std::optional<int64_t> number = NumberOf(segment.name);
  if (!number.has_value() || *number >= commit.counter) {
    refuse(Grade::kDamaged, "a number below the next one's, " + std::to_string(commit.counter),
           "that the next segment could take its place");
  }
  if (segment.store_offset < SegmentInfo::kOwnStore) {
    refuse(Grade::kUnsafe, "a place in its document store", std::to_string(segment.store_offset));
  }
  if (segment.deleted_count < SegmentInfo::kNotCounted || segment.deleted_count > segment.document_count) {
    refuse(Grade::kDamaged, "a count of deleted documents up to " + std::to_string(segment.document_count),
           std::to_string(segment.deleted_count));
  }
  if (segment.deletions_generation == SegmentInfo::kNoDeletions && segment.deleted_count > 0) {
    refuse(Grade::kDamaged, "no deleted documents, having no file of them",
           std::to_string(segment.deleted_count));
  }
  if (!segment.norm_generations.has_value()) return;
  for (const int64_t generation : *segment.norm_generations) {
    if (generation < SegmentInfo::kNoOwnNorms)
      refuse(Grade::kDamaged, "generations of norms", std::to_string(generation));
  }
}

}  // namespace

Commit FindCommit(const format::Folder& folder) {
  RequireCommitNames(folder);
  const int64_t hinted = format::HintedGeneration(folder);
  Commit found;
  try {
    format::UseNewestCommit(folder, [&](Commit commit) { found = std::move(commit); });
    RequireReadable(folder, found);
  } catch (const IndexIoError& error) {
    if (error.path() == folder.path()) throw;
    format::RethrowOpening(error);
  } catch (const IndexDamagedError&) {
    throw;
  } catch (const IndexError&) {
    RefuseTooLarge(folder, hinted);
    throw;
  }
  if (hinted > found.generation && IsCommitLost(folder, hinted)) {
    Refuse(Grade::kDamaged, format::JoinPath(folder.path(), std::string(format::kSegmentsGen)), 4,
           "the generation of a commit in the folder, such as " + std::to_string(found.generation),
           std::to_string(hinted));
  }
  return found;
}

void CheckCommit(const format::Folder& folder, const Commit& commit) {
  const std::string file = CommitPath(folder, commit);
  RequireEqual(Grade::kDamaged, file, commit.end, "the commit to end at", commit.end, commit.size);
  std::set<std::string> names;
  int64_t documents = 0;
  for (const SegmentInfo& segment : commit.segments) {
    CheckSegment(file, commit, segment);
    if (!names.insert(segment.name).second) {
      Refuse(Grade::kDamaged, file, 0, "each segment once", segment.name + " twice");
    }
    documents += segment.document_count;
  }
  if (documents > std::numeric_limits<int32_t>::max()) {
    Refuse(Grade::kUnsafe, file, 0, "documents up to " + std::to_string(std::numeric_limits<int32_t>::max()),
           std::to_string(documents));
  }
}

}  // namespace vantrel::elastic::health
