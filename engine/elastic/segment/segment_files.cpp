#include "elastic/segment/segment_files.h"

#include <optional>
#include <utility>

#include "elastic/format/commit/file_names.h"
#include "elastic/format/segment/compound_file.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

// Of all segments together, in the files: seventeen times as much in memory where they are very short.
constexpr uint64_t kMostNames = uint64_t{4} << 20;

}  // namespace

bool IsCompound(const Folder& folder, const SegmentInfo& info) {
  if (info.compound == SegmentInfo::Compound::kLookForFile) return folder.Exists(info.name + ".cfs");
  return info.compound == SegmentInfo::Compound::kYes;
}

bool HasDeletions(const Folder& folder, const SegmentInfo& info) {
  if (info.deletions_generation != SegmentInfo::kLookForDeletions) {
    return info.deletions_generation != SegmentInfo::kNoDeletions;
  }
  return folder.Exists(DeletionsFileName(info.name, info.deletions_generation));
}

SegmentFiles OpenSegment(const Folder& folder, SegmentInfo info, Need need) {
  std::optional<CompoundFile> compound;
  if (IsCompound(folder, info)) compound.emplace(folder.Open(info.name + ".cfs"));
  const auto open = [&](const char* extension) {
    const std::string name = info.name + extension;
    return compound.has_value() ? compound->Open(name) : folder.Open(name);
  };

  SegmentFiles files;
  files.field_infos = open(".fnm");
  files.terms = open(".tis");
  files.terms_index = open(".tii");
  if (HasDeletions(folder, info)) {
    try {
      files.postings = open(".frq");
      // Never within the compound file.
      files.deletions = folder.Open(DeletionsFileName(info.name, info.deletions_generation));
    } catch (const IndexError&) {
      if (need == Need::kAll) throw;
      files.liveness_failure = std::current_exception();
    }
  }
  files.info = std::move(info);
  return files;
}

std::vector<SegmentFiles> OpenNewestSegments(const Folder& folder, Need need) {
  std::vector<SegmentFiles> opened;
  UseNewestCommit(folder, [&](Commit commit) {
    // Apart, so that a failure closes what is open before another commit is tried.
    std::vector<SegmentFiles> segments;
    uint64_t names = 0;
    for (SegmentInfo& segment : commit.segments) {
      const SegmentFiles& files = segments.emplace_back(OpenSegment(folder, std::move(segment), need));
      names += files.field_infos->size();
      if (names > kMostNames) {
        throw IndexDamagedError(files.field_infos->name(), 0,
                                "the field names of the segments up to this one take more than " +
                                    std::to_string(kMostNames) + " bytes together");
      }
    }
    opened = std::move(segments);
  });
  return opened;
}

}  // namespace vantrel::elastic::format
