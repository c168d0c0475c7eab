#include "elastic/index/library_guard.h"

#include <algorithm>
#include <cerrno>
#include <utility>
#include <vector>

#include "elastic/check/index_check.h"
#include "elastic/common/path.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/commit/shared_files.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/segment/whole_segment.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

// A check of whole segments that found something is not repeated for every search that would need it: not for so long,
// nor for so many times what it took.
constexpr std::chrono::minutes kRefusalHolds{1};
constexpr int kRefusalHoldsTimes = 10;

void RequireSafe(const std::vector<HealthFinding>& findings) {
  for (const HealthFinding& finding : findings) {
    if (finding.grade != HealthFinding::Grade::kUnsafe) continue;
    throw IndexDamagedError(finding.file, finding.offset,
                            "expected " + finding.expected + ", found " + finding.found);
  }
}

}  // namespace

LibraryGuard::LibraryGuard(std::string folder) : folder_(std::move(folder)) {}

bool LibraryGuard::Identity::operator==(const Identity& other) const {
  return device == other.device && inode == other.inode && size == other.size &&
         changed.tv_sec == other.changed.tv_sec && changed.tv_nsec == other.changed.tv_nsec;
}

bool LibraryGuard::KnownFile::Is(const Identity& file) const {
  return identity.has_value() ? *identity == file : is_written_here;
}

int64_t LibraryGuard::AdmitNewestCommit() {
  const std::lock_guard lock(admission_mutex_);
  const format::DiskFolder folder(folder_);
  std::optional<IndexDamagedError> refusal;
  const auto admit = [&](const format::Commit& commit) {
    refusal.reset();
    try {
      Admit(folder, commit);
      generation_ = commit.generation;
    } catch (const IndexDamagedError& error) {
      refusal = error;  // the commit before is no way out: it is this one that the library would open
    }
  };
  try {
    format::UseNewestCommit(folder, admit);
  } catch (const IndexIoError& error) {
    // What the commit or its manifest names has to be there.
    const std::string name = error.path().substr(error.path().rfind('/') + 1);
    if (format::SegmentOfFile(name).empty() || !format::IsAbsenceError(error)) throw;
    format::RethrowOpening(error);
  }
  if (refusal.has_value()) throw IndexDamagedError(*refusal);
  return generation_;
}

void LibraryGuard::Admit(const format::Folder& folder, const format::Commit& commit) {
  if (commit.generation < generation_ && !folder.Exists(format::CommitFileName(generation_))) {
    ForgetFiles();  // the index was put back to what it was
  }
  if (!AdmitByManifest(folder, commit)) AdmitUnknownSegments(folder, commit);
  std::erase_if(refusals_, [&](const auto& refusal) { return refusal.first <= commit.generation; });
}

bool LibraryGuard::AdmitByManifest(const format::Folder& folder, const format::Commit& commit) {
  if (manifest_.has_value() && manifest_->BelongsTo(folder, commit)) return true;
  std::optional<format::Manifest> manifest = format::FindManifest(folder, commit);
  if (!manifest.has_value()) return false;
  Identities files;
  for (const format::Manifest::File& file : manifest->files) {
    // The library takes some files for such as were never written where they are missing.
    RequireSize(*folder.Open(file.name), file);
    files.emplace(file.name, Identify(file.name));
  }
  Take(*manifest);
  manifest_ = std::move(manifest);
  KeepOnly(files);
  // So that it is seen where another takes the place of a file that was never opened.
  const std::lock_guard lock(files_mutex_);
  for (auto& [name, known] : files_) {
    const auto identity = files.find(name);
    if (identity != files.end() && !known.identity.has_value()) known.identity = identity->second;
  }
  return true;
}

void LibraryGuard::AdmitUnknownSegments(const format::Folder& folder, const format::Commit& commit) {
  manifest_.reset();
  format::Commit unknown = commit;
  unknown.segments.clear();
  Identities files;
  format::SharedFiles shared(folder);
  for (const format::SegmentInfo& segment : commit.segments) {
    // As they are before the check: who changes one meanwhile makes it unknown.
    Identities of_segment = IdentifyAll(format::WholeSegment(folder, segment, shared).file_names());
    if (!Knows(of_segment)) unknown.segments.push_back(segment);
    files.merge(of_segment);
  }
  if (unknown.segments.empty()) return KeepOnly(files);
  CheckSegments(folder, unknown);
  NoteChecked(files);
  KeepOnly(files);
  // It may have come meanwhile.
  AdmitByManifest(folder, commit);
}

void LibraryGuard::CheckSegments(const format::Folder& folder, const format::Commit& commit) {
  using Clock = std::chrono::steady_clock;
  const auto start = Clock::now();
  const auto refusal = refusals_.find(commit.generation);
  if (refusal != refusals_.end() && start < refusal->second.until)
    throw IndexDamagedError(refusal->second.error);
  try {
    RequireSafe(check::CheckSegments(folder, commit));
  } catch (const IndexDamagedError& error) {
    const auto end = Clock::now();
    const Clock::duration hold = std::max<Clock::duration>(kRefusalHolds, kRefusalHoldsTimes * (end - start));
    refusals_.insert_or_assign(commit.generation, Refusal{.until = end + hold, .error = error});
    throw;
  }
}

std::shared_ptr<const format::ByteSource> LibraryGuard::Open(const std::string& name) {
  const format::DiskFolder folder(folder_);
  auto file = folder.Open(name);
  if (name.starts_with('_')) {
    auto verification = Find(name);
    if (verification == nullptr) {
      AdmitNewestCommit();
      verification = Find(name);
    }
    if (verification == nullptr)
      throw IndexError(file->name(), "neither of the newest commit nor of its manifest");
    return std::make_shared<VerifiedFile>(std::move(file), std::move(verification));
  }
  if (const auto generation = format::CommitGeneration(name)) format::ReadCommit(file, *generation);
  return file;
}

LibraryGuard::Identity LibraryGuard::Identify(const std::string& name) const {
  struct stat status {};
  const std::string path = JoinPath(folder_, name);
  if (stat(path.c_str(), &status) != 0) throw IndexIoError(path, "cannot examine file", errno);
  return {status.st_dev, status.st_ino, status.st_size, status.st_mtim};
}

LibraryGuard::Identities LibraryGuard::IdentifyAll(const std::set<std::string>& names) const {
  Identities files;
  for (const std::string& name : names) files.emplace(name, Identify(name));
  return files;
}

bool LibraryGuard::Knows(const Identities& files) const {
  const std::lock_guard lock(files_mutex_);
  return std::all_of(files.begin(), files.end(), [this](const auto& file) {
    const auto known = files_.find(file.first);
    return known != files_.end() && known->second.Is(file.second);
  });
}

// What was known already stays, with its digests.
void LibraryGuard::NoteChecked(const Identities& files) {
  const std::lock_guard lock(files_mutex_);
  for (const auto& [name, identity] : files) {
    const auto known = files_.find(name);
    if (known != files_.end() && known->second.Is(identity)) continue;
    files_.insert_or_assign(name, KnownFile{.identity = identity});
  }
}

// Readers of an older commit have their files open by now.
void LibraryGuard::KeepOnly(const Identities& files) {
  const std::lock_guard lock(files_mutex_);
  std::erase_if(files_, [&](const auto& entry) {
    return !entry.second.is_written_here && !files.contains(entry.first);
  });
}

// What is known of the file that bears the name now; nothing where that is nothing.
std::shared_ptr<FileVerification> LibraryGuard::Find(const std::string& name) {
  const Identity identity = Identify(name);
  const std::lock_guard lock(files_mutex_);
  const auto found = files_.find(name);
  if (found == files_.end()) return nullptr;
  KnownFile& known = found->second;
  const format::Manifest::File* const expected = known.verification->expected();
  if (known.identity.has_value() && !(*known.identity == identity)) {
    if (expected == nullptr) {
      files_.erase(found);
      return nullptr;
    }
    const auto again = std::make_shared<FileVerification>();
    again->Expect(*expected);
    known.verification = again;
  }
  // Without digests, one that is written here may still grow.
  if (!known.is_written_here || expected != nullptr) known.identity = identity;
  return known.verification;
}

void LibraryGuard::NoteWritten(const std::string& name) {
  const std::lock_guard lock(files_mutex_);
  files_[name] = {.is_written_here = true};
}

void LibraryGuard::NoteDeleted(const std::string& name) {
  const std::lock_guard lock(files_mutex_);
  files_.erase(name);
}

void LibraryGuard::Take(const format::Manifest& manifest) {
  const std::lock_guard lock(files_mutex_);
  for (const format::Manifest::File& file : manifest.files) {
    const auto known = files_.find(file.name);
    if (known != files_.end()) {
      const format::Manifest::File* const expected = known->second.verification->expected();
      if (expected == nullptr) known->second.verification->Expect(file);
      if (expected == nullptr || *expected == file) continue;
    }
    KnownFile another;
    another.verification->Expect(file);
    files_.insert_or_assign(file.name, std::move(another));
  }
}

void LibraryGuard::Forget() {
  const std::lock_guard lock(admission_mutex_);
  manifest_.reset();
  generation_ = 0;
  refusals_.clear();
  ForgetFiles();
}

void LibraryGuard::ForgetFiles() {
  const std::lock_guard lock(files_mutex_);
  std::erase_if(files_, [](const auto& entry) {
    return !entry.second.is_written_here || entry.second.verification->expected() != nullptr;
  });
}

}  // namespace vantrel::elastic
