#include "vantrel/elastic/index_repair.h"
#include "elastic/common/path.h"

#include <lucene++/LuceneHeaders.h>

// Not without the library's main header.
#include <lucene++/CheckIndex.h>
#include <lucene++/SegmentInfo.h>
#include <lucene++/SegmentInfos.h>

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <functional>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <utility>
#include <vector>

#include "elastic/format/commit/commit.h"
#include "elastic/format/commit/shared_files.h"
#include "elastic/format/io/folder.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/format/segment/term_vectors.h"
#include "elastic/index/manifest_keeper.h"
#include "elastic/index/run_reading.h"
#include "elastic/repair/blame.h"
#include "elastic/repair/checked_directory.h"
#include "elastic/repair/checker_trial.h"
#include "elastic/segment/whole_segment.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_health.h"
#include "vantrel/elastic/library_setup.h"
#include "vantrel/elastic/write_lock.h"

namespace vantrel::elastic {
namespace {

// How often a plan starts anew because there is a newer commit.
constexpr int kMostTries = 10;

// What the library may take for a segment without a trial, in bytes.
constexpr uint64_t kMuchMemory = uint64_t{32} << 20;
constexpr uint64_t kMuchGrowth = 64;  // times the size of a file

// Throws where there is no commit to start from.
format::Commit ReadNewestCommit(const std::string& path) {
  return format::ReadNewestCommit(format::DiskFolder(path));
}

// The lock, where it can be had without leaving a file: on an index that needs no repair, nothing is changed.
// Nothing where there is no file to lock, or this user may not; who may not will not get further than the check.
std::optional<WriteLock> TakeLockThatIsThere(const std::string& path) {
  struct stat status {};
  if (stat(JoinPath(path, WriteLock::kFileName).c_str(), &status) != 0) return std::nullopt;
  try {
    return WriteLock(path);
  } catch (const IndexIoError&) {
    return std::nullopt;
  }
}

uint64_t SizeOf(const HealthReport& report) {
  uint64_t bytes = 0;
  for (const std::string& file : report.files) {
    struct stat status {};
    if (stat(file.c_str(), &status) == 0) bytes += static_cast<uint64_t>(status.st_size);
  }
  return bytes;
}

// What the checker cannot be asked about without care.
struct UnsafeSegments {
  std::set<std::string> condemned;  // it does not survive them
  std::set<std::string> survived;   // alone, it does; by luck, maybe
  uint64_t index_bytes = 0;
};

bool CheckerSurvives(const std::string& path, std::span<const std::string> segments, uint64_t index_bytes) {
  return SurvivesTrial(path, index_bytes, [&] {
    auto only = Lucene::Collection<Lucene::String>::newInstance();
    for (const std::string& segment : segments) only.add(Lucene::StringUtils::toUnicode(segment));
    const auto directory = Lucene::newLucene<CheckedDirectory>(path, std::set<std::string>());
    Lucene::newLucene<Lucene::CheckIndex>(directory)->checkIndex(only);
  });
}

// Tries unsafe segments in groups, and halves those that the checker does not survive, down to single segments. What is
// not settled when kMostFailures trials have failed is condemned: a failure may take its whole time, and there may be
// thousands of segments.
class UnsafeTrials {
 public:
  UnsafeTrials(const std::string& path, UnsafeSegments& segments) : path_(path), segments_(segments) {}

  void TryAll(std::span<const std::string> names) {
    const size_t size = std::max<size_t>((names.size() + kGroups - 1) / kGroups, 1);
    for (; !names.empty(); names = names.subspan(std::min(size, names.size()))) {
      Try(names.first(std::min(size, names.size())));
    }
  }

 private:
  // So few are each tried alone.
  static constexpr size_t kGroups = 8;
  static constexpr int kMostFailures = 8;

  void Try(std::span<const std::string> group) {
    if (failures_left_ > 0 && CheckerSurvives(path_, group, segments_.index_bytes)) {
      segments_.survived.insert(group.begin(), group.end());
      return;
    }
    if (failures_left_ > 0) --failures_left_;
    if (group.size() == 1 || failures_left_ == 0) {
      segments_.condemned.insert(group.begin(), group.end());
      return;
    }
    Try(group.first(group.size() / 2));
    Try(group.subspan(group.size() / 2));
  }

  const std::string& path_;
  UnsafeSegments& segments_;
  int failures_left_ = kMostFailures;
};

uint64_t MostMemoryOfVectors(const format::WholeSegment& files, uint32_t fields) {
  uint64_t most = 0;
  if (!files.Has(".tvx")) return most;
  format::TermVectorsReader vectors(files.Open(".tvx"), files.Open(".tvd"), files.Open(".tvf"), fields);
  const format::SegmentInfo& info = files.info();
  const auto first = static_cast<uint64_t>(std::max(info.store_offset, 0));
  const uint64_t end = std::min(first + static_cast<uint64_t>(info.document_count), vectors.documents());
  for (uint64_t document = first; document < end && most <= kMuchMemory; ++document) {
    vectors.Seek(document);
    uint64_t bytes = 0;
    for (size_t field = 0; field < vectors.fields().size(); ++field) {
      vectors.SeekTerms(field);
      vectors.PassTerms();
      bytes += vectors.LibraryMemory();
    }
    most = std::max(most, bytes);
  }
  return most;
}

// Whether the texts in the index over a dictionary take much more memory than the file has bytes.
bool HasLongTexts(const format::WholeSegment& files, uint32_t fields) {
  format::TermCursor index(files.Open(".tii"), format::TermCursor::File::kIndex, fields,
                           files.info().document_count);
  uint64_t bytes = 0;
  while (index.Next()) {
    bytes += sizeof(wchar_t) * index.text().size();
    if (bytes > kMuchMemory && bytes / kMuchGrowth > index.end_offset()) return true;
  }
  return false;
}

// Whether the library would take much more memory for a segment than the segment takes on disk. What cannot be read is
// for the check to tell.
bool NeedsMuchMemory(const format::Folder& folder, const format::SegmentInfo& info,
                     format::SharedFiles& shared) {
  try {
    const format::WholeSegment files(folder, info, shared);
    const auto fields = static_cast<uint32_t>(format::ReadFieldInfos(files.Open(".fnm")).size());
    const bool has_much_deleted =
        files.HasDeletions() && static_cast<uint64_t>(info.document_count) / 8 > kMuchMemory;
    return has_much_deleted || HasLongTexts(files, fields) ||
           MostMemoryOfVectors(files, fields) > kMuchMemory;
  } catch (const IndexDamagedError&) {
  } catch (const format::FileMissingError&) {
  }
  return false;
}

UnsafeSegments FindUnsafeSegments(const std::string& path, const format::Commit& commit) {
  const HealthReport report = CheckIndexHealth(path);
  std::set<std::string> unsafe;
  for (const HealthFinding& finding : report.findings) {
    if (finding.grade == HealthFinding::Grade::kUnsafe && !finding.segment.empty())
      unsafe.insert(finding.segment);
  }
  // Also where nothing is wrong with them: the checker runs in this process. They come first, as long as none has failed.
  std::vector<std::string> large;
  const format::DiskFolder folder(path);
  format::SharedFiles shared(folder);
  for (const format::SegmentInfo& segment : commit.segments) {
    if (!unsafe.contains(segment.name) && NeedsMuchMemory(folder, segment, shared))
      large.push_back(segment.name);
  }
  UnsafeSegments segments;
  if (unsafe.empty() && large.empty()) return segments;
  segments.index_bytes = SizeOf(report);
  UnsafeTrials trials(path, segments);
  trials.TryAll(large);
  // Nothing was found wrong with them that they could be dropped for.
  if (!segments.condemned.empty()) {
    throw IndexError(path, "the index library would take too much memory or time to check segment " +
                               *segments.condemned.begin() + "; nothing was changed");
  }
  trials.TryAll(std::vector<std::string>(unsafe.begin(), unsafe.end()));
  return segments;
}

// One look of the library's checker at an index, and what it may do about it.
class Checker {
 public:
  explicit Checker(const std::string& path) : path_(path), commit_(ReadNewestCommit(path)) {
    const UnsafeSegments unsafe = FindUnsafeSegments(path, commit_);
    const std::function<void()> check = [this] {
      checker_ = Lucene::newLucene<Lucene::CheckIndex>(directory_);
      status_ = checker_->checkIndex();
    };
    // Reading past the end of a table may crash or not, depending on what memory holds. So the check is rehearsed in a
    // copy of this process, and where the copy does not survive, the segments to blame are condemned as well.
    const auto survives = [&](const std::set<std::string>& without) {
      Condemn(unsafe.condemned, without);
      return SurvivesTrial(path_, unsafe.index_bytes, check);
    };
    Condemn(unsafe.condemned, {});
    if (!unsafe.survived.empty() && !survives({})) {
      // Once more, because the search has changed what memory holds.
      if (!survives(FindBlame(LargestFirst(unsafe.survived), survives))) {
        Condemn(unsafe.condemned, unsafe.survived);
      }
    }
    RunReading(directory_, "cannot check the index", check);
    // What the system did not let it read would be dropped for that.
    const std::optional<IndexIoError> problem = directory_->io_problem();
    if (!status_->clean && problem.has_value()) throw IndexIoError(*problem);
    // Without a list of segments there is nothing that the library could go on from; it would crash.
    if (!status_->clean && !status_->newSegments) {
      throw IndexError(path_, "the index library cannot read the commit; nothing was changed");
    }
  }

  // Of the commit as it was before anything was looked at.
  RepairReport Report() const {
    RepairReport report;
    report.generation = commit_.generation;
    report.is_clean = status_->clean;
    if (report.is_clean) return report;
    std::set<std::string> kept;
    for (int32_t number = 0; number < status_->newSegments->size(); ++number) {
      kept.insert(Lucene::StringUtils::toUTF8(status_->newSegments->info(number)->name));
    }
    for (const format::SegmentInfo& segment : commit_.segments) {
      if (kept.contains(segment.name)) continue;
      report.losses.push_back({.segment = segment.name,
                               .documents = CountLive(segment),
                               .is_condemned = condemned_.contains(segment.name)});
    }
    return report;
  }

  void Fix() {
    RunReading(directory_, "cannot repair the index", [&] { checker_->fixIndex(status_); });
    if (directory_->failure().has_value()) throw IndexIoError(*directory_->failure());
  }

 private:
  void Condemn(std::set<std::string> segments, const std::set<std::string>& more) {
    segments.insert(more.begin(), more.end());
    condemned_ = std::move(segments);
    directory_ = Lucene::newLucene<CheckedDirectory>(path_, condemned_);
  }

  // Those that hold the most documents are the last to be given up.
  std::vector<std::string> LargestFirst(const std::set<std::string>& names) const {
    std::vector<format::SegmentInfo> segments = commit_.segments;
    std::erase_if(segments, [&](const auto& segment) { return !names.contains(segment.name); });
    std::stable_sort(segments.begin(), segments.end(),
                     [](const auto& left, const auto& right) { return CountLive(left) > CountLive(right); });
    std::vector<std::string> sorted;
    sorted.reserve(segments.size());
    for (const format::SegmentInfo& segment : segments) sorted.push_back(segment.name);
    return sorted;
  }

  // As far as the commit tells.
  static uint64_t CountLive(const format::SegmentInfo& segment) {
    return static_cast<uint64_t>(std::max(segment.document_count - std::max(segment.deleted_count, 0), 0));
  }

  std::string path_;
  format::Commit commit_;
  std::set<std::string> condemned_;
  boost::shared_ptr<CheckedDirectory> directory_;
  Lucene::CheckIndexPtr checker_;
  Lucene::IndexStatusPtr status_;
};

}  // namespace

RepairReport RepairIndex(const std::string& path) {
  PrepareIndexLibrary();
  ReadNewestCommit(path);
  std::optional<WriteLock> lock = TakeLockThatIsThere(path);
  if (!lock.has_value()) {
    const RepairReport report = Checker(path).Report();
    if (report.is_clean) return report;
    lock.emplace(path);
  }
  // With the lock: what was seen without may have been of a writer at work.
  Checker checker(path);
  RepairReport report = checker.Report();
  if (report.is_clean) return report;
  ManifestKeeper manifest(path);
  checker.Fix();
  if (manifest.manifest().has_value()) manifest.Update();
  return report;
}

RepairReport PlanRepair(const std::string& path) {
  PrepareIndexLibrary();
  for (int tries = 0; tries < kMostTries; ++tries) {
    RepairReport report = Checker(path).Report();
    // A writer takes away the files of the commit before.
    if (report.is_clean || ReadNewestCommit(path).generation == report.generation) return report;
  }
  throw IndexIoError(path, "the index changes faster than it can be looked at", EBUSY);
}

}  // namespace vantrel::elastic
