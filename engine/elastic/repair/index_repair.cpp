#include "vantrel/elastic/index_repair.h"

#include <lucene++/LuceneHeaders.h>

// Not without the library's main header.
#include <lucene++/CheckIndex.h>

#include <sys/stat.h>

#include <optional>
#include <set>

#include "elastic/format/commit.h"
#include "elastic/format/folder.h"
#include "elastic/repair/checked_directory.h"
#include "elastic/repair/checker_trial.h"
#include "elastic/search/library_failure.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_health.h"
#include "vantrel/elastic/library_setup.h"
#include "vantrel/elastic/write_lock.h"

namespace vantrel::elastic {
namespace {

// Throws where there is no commit to start from.
void CheckCommit(const std::string& path) {
  format::UseNewestCommit(format::DiskFolder(path), [](const format::Commit&) {});
}

// The lock, where it can be had without leaving a file: on an index that needs no repair, nothing is changed.
// Nothing where there is no file to lock, or this user may not; who may not will not get further than the check.
std::optional<WriteLock> TakeLockThatIsThere(const std::string& path) {
  struct stat status {};
  if (stat(format::JoinPath(path, WriteLock::kFileName).c_str(), &status) != 0) return std::nullopt;
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

// The segments that the checker cannot even be asked about.
std::set<std::string> FindCondemned(const std::string& path) {
  const HealthReport report = CheckIndexHealth(path);
  std::set<std::string> unsafe;
  for (const HealthFinding& finding : report.findings) {
    if (finding.grade == HealthFinding::Grade::kUnsafe && !finding.segment.empty())
      unsafe.insert(finding.segment);
  }
  std::set<std::string> condemned;
  const uint64_t bytes = unsafe.empty() ? 0 : SizeOf(report);
  for (const std::string& segment : unsafe) {
    if (!CheckerSurvives(path, segment, bytes)) condemned.insert(segment);
  }
  return condemned;
}

// One look of the library's checker at an index, and what it may do about it.
class Checker {
 public:
  explicit Checker(const std::string& path)
      : path_(path), directory_(Lucene::newLucene<CheckedDirectory>(path, FindCondemned(path))) {
    RunReading(path_, directory_, "cannot check the index", [&] {
      checker_ = Lucene::newLucene<Lucene::CheckIndex>(directory_);
      status_ = checker_->checkIndex();
    });
    // Without a list of segments there is nothing that the library could go on from; it would crash.
    if (!status_->clean && !status_->newSegments) {
      throw IndexError(path_, "the index library cannot read the commit; nothing was changed");
    }
  }

  bool is_clean() const { return status_->clean; }

  void Fix() {
    RunReading(path_, directory_, "cannot repair the index", [&] { checker_->fixIndex(status_); });
    if (directory_->failure().has_value()) throw IndexIoError(*directory_->failure());
  }

 private:
  std::string path_;
  boost::shared_ptr<CheckedDirectory> directory_;
  Lucene::CheckIndexPtr checker_;
  Lucene::IndexStatusPtr status_;
};

}  // namespace

RepairOutcome RepairIndex(const std::string& path) {
  PrepareIndexLibrary();
  CheckCommit(path);
  std::optional<WriteLock> lock = TakeLockThatIsThere(path);
  if (!lock.has_value()) {
    if (Checker(path).is_clean()) return RepairOutcome::kClean;
    lock.emplace(path);
  }
  // With the lock: what was seen without may have been of a writer at work.
  Checker checker(path);
  if (checker.is_clean()) return RepairOutcome::kClean;
  checker.Fix();
  return RepairOutcome::kRepaired;
}

}  // namespace vantrel::elastic
