#include "elastic/search/snapshot.h"

#include <cerrno>
#include <ctime>
#include <utility>

#include "elastic/index/run_reading.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

// Longer than the steps of any file system's clock.
constexpr time_t kSettledSeconds = 3;

}  // namespace

Snapshot::Snapshot(boost::shared_ptr<DiskDirectory> directory, Lucene::IndexReaderPtr reader)
    : directory_(std::move(directory)), reader_(std::move(reader)) {}

Snapshot::~Snapshot() {
  if (directory_->has_failed_reading()) return;
  try {
    reader_->close();
  } catch (...) {
    // Nothing was written: there is nothing to lose.
  }
}

SnapshotKeeper::SnapshotKeeper(std::string folder, std::shared_ptr<LibraryGuard> guard)
    : folder_(std::move(folder)), guard_(std::move(guard)) {}

std::shared_ptr<const Snapshot> SnapshotKeeper::Newest() {
  const std::lock_guard lock(mutex_);
  if (snapshot_ != nullptr && snapshot_->directory()->has_failed_reading()) snapshot_.reset();
  const FolderState state = Look();
  const bool same_folder = state.device == state_.device && state.inode == state_.inode;
  const bool unchanged = same_folder && state_.settled && state.changed.tv_sec == state_.changed.tv_sec &&
                         state.changed.tv_nsec == state_.changed.tv_nsec;
  if (snapshot_ != nullptr && unchanged) return snapshot_;
  if (!same_folder && state_.inode != 0) {
    snapshot_.reset();
    guard_->Forget();
  }
  // Also where the commit is at hand: it may have been given its manifest since.
  const int64_t generation = guard_->AdmitNewestCommit();
  if (snapshot_ == nullptr || generation != generation_) Open(generation);
  state_ = state;
  return snapshot_;
}

SnapshotKeeper::FolderState SnapshotKeeper::Look() const {
  struct stat status {};
  if (stat(folder_.c_str(), &status) != 0) throw IndexIoError(folder_, "cannot examine index folder", errno);
  const time_t age = time(nullptr) - status.st_mtim.tv_sec;
  return {status.st_dev, status.st_ino, status.st_mtim, age >= kSettledSeconds};
}

void SnapshotKeeper::Open(int64_t generation) {
  // An older commit than the one at hand is that of another index, put in its place.
  const auto before = generation > generation_ ? snapshot_ : nullptr;
  const auto directory =
      before == nullptr ? Lucene::newLucene<DiskDirectory>(folder_, guard_) : before->directory();
  RunReading(directory, "cannot open the index for searching", [&] {
    const Lucene::IndexReaderPtr reader =
        before == nullptr ? Lucene::IndexReader::open(directory, true) : before->reader()->reopen(true);
    if (before == nullptr || reader != before->reader()) {
      snapshot_ = std::make_shared<const Snapshot>(directory, reader);
    }
  });
  generation_ = generation;
}

}  // namespace vantrel::elastic
