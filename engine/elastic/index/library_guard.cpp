#include "elastic/index/library_guard.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "elastic/format/file_names.h"
#include "elastic/health/index_check.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

// A check of whole segments is not repeated for every search that would need it.
constexpr std::chrono::minutes kRefusalHolds{1};

void RequireSafe(const std::vector<HealthFinding>& findings) {
  for (const HealthFinding& finding : findings) {
    if (finding.grade != HealthFinding::Grade::kUnsafe) continue;
    throw IndexDamagedError(finding.file, finding.offset,
                            "expected " + finding.expected + ", found " + finding.found);
  }
}

}  // namespace

LibraryGuard::LibraryGuard(std::string folder) : folder_(std::move(folder)) {}

void LibraryGuard::Admit(const format::Commit& commit) {
  const std::lock_guard lock(admission_mutex_);
  const format::DiskFolder folder(folder_);
  if (commit.generation < generation_) ForgetFiles();  // the index was put back to what it was
  generation_ = commit.generation;
  if (manifest_.has_value() && manifest_->BelongsTo(folder, commit)) return;
  manifest_.reset();
  std::optional<format::Manifest> manifest = format::FindManifest(folder, commit);
  if (!manifest.has_value()) return AdmitUnknownSegments(folder, commit);
  Take(*manifest);
  // The library takes some files for such as were never written where they are missing.
  for (const format::Manifest::File& file : manifest->files) {
    Find(file.name)->VerifySize(*folder.Open(file.name));
  }
  manifest_ = std::move(manifest);
}

void LibraryGuard::AdmitUnknownSegments(const format::Folder& folder, const format::Commit& commit) {
  format::Commit unknown = commit;
  unknown.segments.clear();
  std::set<std::string> names;
  for (const format::SegmentInfo& segment : commit.segments) {
    std::set<std::string> files = format::FilesOf(folder, segment);
    if (Knows(files)) continue;
    unknown.segments.push_back(segment);
    names.merge(files);
  }
  if (unknown.segments.empty()) return;
  const auto now = std::chrono::steady_clock::now();
  if (refusal_.generation == commit.generation && now < refusal_.until)
    throw IndexDamagedError(refusal_.error);
  try {
    RequireSafe(health::CheckSegments(folder, unknown));
  } catch (const IndexDamagedError& error) {
    refusal_ = {.generation = commit.generation, .until = now + kRefusalHolds, .error = error};
    throw;
  }
  const std::lock_guard lock(files_mutex_);
  for (const std::string& name : names) files_.try_emplace(name);
}

std::shared_ptr<const format::ByteSource> LibraryGuard::Open(const std::string& name) {
  const format::DiskFolder folder(folder_);
  auto file = folder.Open(name);
  if (name.starts_with('_')) {
    auto verification = Find(name);
    if (verification == nullptr) {
      format::UseNewestCommit(folder, [this](const format::Commit& commit) { Admit(commit); });
      verification = Find(name);
    }
    if (verification == nullptr) throw IndexError(file->name(), "no file of the newest commit");
    return std::make_shared<VerifiedFile>(std::move(file), std::move(verification));
  }
  if (const auto generation = format::CommitGeneration(name)) format::ReadCommit(file, *generation);
  return file;
}

bool LibraryGuard::Knows(const std::set<std::string>& names) const {
  const std::lock_guard lock(files_mutex_);
  return std::all_of(names.begin(), names.end(),
                     [this](const std::string& name) { return files_.contains(name); });
}

std::shared_ptr<FileVerification> LibraryGuard::Find(const std::string& name) const {
  const std::lock_guard lock(files_mutex_);
  const auto found = files_.find(name);
  return found == files_.end() ? nullptr : found->second.verification;
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
    KnownFile& known = files_[file.name];
    const format::Manifest::File* const expected = known.verification->expected();
    if (expected != nullptr && *expected != file) known = {};
    known.verification->Expect(file);
  }
}

void LibraryGuard::Forget() {
  const std::lock_guard lock(admission_mutex_);
  manifest_.reset();
  ForgetFiles();
}

void LibraryGuard::ForgetFiles() {
  const std::lock_guard lock(files_mutex_);
  std::erase_if(files_, [](const auto& entry) {
    return !entry.second.is_written_here || entry.second.verification->expected() != nullptr;
  });
}

}  // namespace vantrel::elastic
