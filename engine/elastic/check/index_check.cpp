#include "elastic/check/index_check.h"

#include <algorithm>
#include <cerrno>
#include <memory>
#include <mutex>
#include <optional>
#include <thread>
#include <tuple>
#include <utility>

#include "elastic/check/commit_check.h"
#include "elastic/check/digest_check.h"
#include "elastic/check/meter.h"
#include "elastic/check/mismatch.h"
#include "elastic/check/parallel.h"
#include "elastic/check/segment_check.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/format/io/watched_folder.h"
#include "elastic/manifest/manifest.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::check {
namespace {

// Segments whose files are opened together, so that a writer cannot take them away: as many as stay below the usual
// limit of open files. Those that are missing count: why they are takes memory.
constexpr size_t kMostFiles = 512;

// How much memory the names in those segments may take before no more of them are opened.
constexpr uint64_t kMostNamesMemory = uint64_t{8} << 20;

// How many newer commits are taken up before the index is given up as one that does not hold still.
constexpr int kMostCommits = 100;

// Findings beyond so many are kept only where they are unsafe, since a repair needs to know of those. A commit of missing
// segments would have hundreds of thousands.
constexpr size_t kMostFindings = 20'000;

// Gathers findings from several threads.
class Findings {
 public:
  // Runs a check and keeps what it finds. Exceptions that say nothing about the index pass.
  template <typename Check>
  void Run(const std::string& segment, Check check) {
    try {
      check();
    } catch (const Mismatch& mismatch) {
      Add(segment, mismatch.finding());
    } catch (const IndexDamagedError& error) {
      Add(segment,
          {.file = error.path(),
           .offset = error.offset(),
           .expected = "what the format demands",
           .found = ProblemOf(error, error.path() + ": offset " + std::to_string(error.offset()) + ": "),
           .grade = Grade::kUnsafe});
    } catch (const format::FileMissingError& error) {
      const std::lock_guard lock(mutex_);
      file_is_missing_ = true;
      AddLocked(segment, {.file = error.path(),
                          .expected = "a file that can be opened",
                          .found = ProblemOf(error, error.path() + ": ")});
    }
  }

  // In the order of segments and files, each once.
  std::vector<HealthFinding> Take() {
    const auto key = [](const HealthFinding& f) {
      return std::tie(f.segment, f.file, f.offset, f.expected, f.found);
    };
    std::sort(all_.begin(), all_.end(), [&](const auto& a, const auto& b) { return key(a) < key(b); });
    all_.erase(std::unique(all_.begin(), all_.end()), all_.end());
    return std::move(all_);
  }

  bool file_is_missing() const { return file_is_missing_; }

 private:
  static std::string ProblemOf(const IndexError& error, const std::string& start) {
    const std::string what = error.what();
    return what.starts_with(start) ? what.substr(start.size()) : what;
  }

  void Add(const std::string& segment, HealthFinding finding) {
    const std::lock_guard lock(mutex_);
    AddLocked(segment, std::move(finding));
  }

  void AddLocked(const std::string& segment, HealthFinding finding) {
    if (all_.size() >= kMostFindings && finding.grade == Grade::kDamaged) return;
    finding.segment = segment;
    all_.push_back(std::move(finding));
  }

  std::mutex mutex_;
  std::vector<HealthFinding> all_;
  bool file_is_missing_ = false;
};

unsigned ThreadsFor(const HealthOptions& options) {
  return options.threads > 0 ? options.threads : std::max(1U, std::thread::hardware_concurrency());
}

// Checks a commit, some of its segments after the other.
class CommitRun {
 public:
  CommitRun(const format::Folder& folder, const format::Commit& commit, unsigned threads, Meter& meter)
      : commit_(commit),
        threads_(threads),
        meter_(meter),
        manifest_(FindManifest(folder)),
        metered_(folder, meter),
        folder_(metered_, manifest_),
        shared_(folder_) {}

  void Run() {
    findings_.Run("", [this] { CheckCommit(folder_, commit_); });
    CheckSegments();
    OpenTheRest();
    FinishDigests();
  }

  void CheckSegments() {
    meter_.SetSegments(commit_.segments.size());
    for (size_t next = 0; next < commit_.segments.size();) {
      std::vector<std::unique_ptr<SegmentCheck>> batch;
      size_t files = 0;
      uint64_t names = 0;
      for (; next < commit_.segments.size() && files < kMostFiles && names < kMostNamesMemory; ++next) {
        SegmentCheck& segment =
            *batch.emplace_back(std::make_unique<SegmentCheck>(folder_, commit_.segments[next], shared_));
        findings_.Run(segment.files().info().name, [&] { segment.ReadFields(); });
        files += segment.files().files_tried();
        names += segment.NamesMemory();
        meter_.AddSegmentOpened();
      }
      RunBatch(batch);
      FinishDigests();
    }
  }

  Findings& findings() { return findings_; }
  HealthReport::Manifest manifest_use() const { return manifest_use_; }

 private:
  // Empty where there is none for this commit.
  format::Manifest FindManifest(const format::Folder& folder) {
    if (!folder.Exists(format::kManifestName)) return {};
    manifest_use_ = HealthReport::Manifest::kNotUsed;
    format::Manifest found;
    findings_.Run("", [&] {
      try {
        std::optional<format::Manifest> read = format::ReadManifest(*folder.Open(format::kManifestName));
        if (!read.has_value() || !read->BelongsTo(folder, commit_)) return;
        found = std::move(*read);
        manifest_use_ = HealthReport::Manifest::kCompared;
      } catch (const IndexDamagedError& error) {
        // No harm to the index library, which does not know the file.
        Refuse(Grade::kDamaged, error.path(), error.offset(), "a manifest as it was written", "another one");
      } catch (const IndexError& error) {
        format::RethrowOpening(error);
      }
    });
    return found;
  }

  void RunBatch(const std::vector<std::unique_ptr<SegmentCheck>>& batch) {
    std::vector<SegmentCheck::Part> parts;
    for (const auto& segment : batch) {
      std::vector<SegmentCheck::Part> more = segment->Parts();
      std::move(more.begin(), more.end(), std::back_inserter(parts));
    }
    // The longest first, so that none is left over for one thread at the end.
    std::stable_sort(parts.begin(), parts.end(),
                     [](const auto& a, const auto& b) { return a.size > b.size; });
    std::vector<std::function<void()>> tasks;
    tasks.reserve(parts.size());
    for (const SegmentCheck::Part& part : parts) {
      tasks.emplace_back([this, &part] { findings_.Run(part.segment, part.run); });
    }
    RunParallel(tasks, threads_);
  }

  // What no check of a segment has read of the files that are open.
  void FinishDigests() {
    std::vector<std::function<void()>> tasks;
    for (const auto& check : folder_.TakeOpened()) {
      tasks.emplace_back([this, check] {
        findings_.Run(std::string(format::SegmentOfFile(check->name())), [&] { check->Finish(); });
      });
    }
    RunParallel(tasks, threads_);
  }

  // What the manifest names, and no segment may have opened: the commit's own file, and what is missing.
  void OpenTheRest() {
    for (const format::Manifest::File& file : manifest_.files) {
      findings_.Run(std::string(format::SegmentOfFile(file.name)), [&] {
        try {
          folder_.Open(file.name);
        } catch (const IndexError& error) {
          format::RethrowOpening(error);
        }
      });
    }
  }

  const format::Commit& commit_;
  unsigned threads_;
  Meter& meter_;
  Findings findings_;
  HealthReport::Manifest manifest_use_ = HealthReport::Manifest::kNone;
  format::Manifest manifest_;
  format::WatchedFolder metered_;
  DigestCheckedFolder folder_;
  format::SharedFiles shared_;
};

}  // namespace

HealthReport CheckFolder(const format::Folder& folder, const HealthOptions& options) {
  Meter meter(options.progress);
  const format::WatchedFolder metered(folder, meter);
  for (int left = kMostCommits;; --left) {
    HealthReport report;
    format::Commit commit;
    Findings finding_it;
    bool is_found = false;
    finding_it.Run("", [&] {
      commit = FindCommit(metered);
      is_found = true;
    });
    report.findings = finding_it.Take();
    if (!is_found) {
      report.files = meter.TakeFiles();
      return report;
    }
    report.generation = commit.generation;
    CommitRun run(folder, commit, ThreadsFor(options), meter);
    run.Run();
    report.manifest = run.manifest_use();
    report.findings = run.findings().Take();
    report.files = meter.TakeFiles();
    meter.Report();
    // Not by the names alone: a newer one that is incomplete does not take over.
    format::Commit newest;
    if (run.findings().file_is_missing()) finding_it.Run("", [&] { newest = FindCommit(metered); });
    const bool is_overtaken = newest.generation > commit.generation;
    if (!is_overtaken) return report;
    if (left == 0)
      throw IndexIoError(folder.path(), "the index changes faster than it can be checked", EBUSY);
  }
}

std::vector<HealthFinding> CheckSegments(const format::Folder& folder, const format::Commit& commit) {
  Meter meter({});
  CommitRun run(folder, commit, ThreadsFor({}), meter);
  run.CheckSegments();
  return run.findings().Take();
}

}  // namespace vantrel::elastic::check

namespace vantrel::elastic {

HealthReport CheckIndexHealth(const std::string& path, const HealthOptions& options) {
  return check::CheckFolder(format::DiskFolder(path, format::DiskFolder::Access::kInOrder), options);
}

bool IsIndexCorrupted(const std::string& path) { return !CheckIndexHealth(path).clean(); }

}  // namespace vantrel::elastic
