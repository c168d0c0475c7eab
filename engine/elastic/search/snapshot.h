#pragma once

#include <lucene++/LuceneHeaders.h>
#include <sys/stat.h>

#include <cstdint>
#include <memory>
#include <mutex>
#include <string>

#include "elastic/index/disk_directory.h"
#include "elastic/index/library_guard.h"

namespace vantrel::elastic {

// An index as of one commit, open for searching. Whoever searches holds it; with the last holder, its files are
// closed. May be used by several threads at once.
class Snapshot {
 public:
  Snapshot(boost::shared_ptr<DiskDirectory> directory, Lucene::IndexReaderPtr reader);
  Snapshot(const Snapshot&) = delete;
  Snapshot& operator=(const Snapshot&) = delete;
  ~Snapshot();

  const boost::shared_ptr<DiskDirectory>& directory() const { return directory_; }
  const Lucene::IndexReaderPtr& reader() const { return reader_; }

 private:
  boost::shared_ptr<DiskDirectory> directory_;
  Lucene::IndexReaderPtr reader_;
};

// Has the newest commit of a folder at hand. For any thread.
class SnapshotKeeper {
 public:
  // The index library reads through `guard`.
  SnapshotKeeper(std::string folder, std::shared_ptr<LibraryGuard> guard);

  // The newest commit when this was called, or a later one. While the folder is as it was, that costs one look
  // at its status; after a new commit, just the new segments are opened. Throws IndexError.
  std::shared_ptr<const Snapshot> Newest();

 private:
  // What tells that nothing was created, renamed or removed in the folder.
  struct FolderState {
    dev_t device = 0;
    ino_t inode = 0;
    timespec changed{};
    bool settled = false;  // the change is long enough ago for another one to bear another time
  };

  FolderState Look() const;
  void Open(int64_t generation);

  std::string folder_;
  std::shared_ptr<LibraryGuard> guard_;
  std::mutex mutex_;
  FolderState state_;
  int64_t generation_ = 0;
  std::shared_ptr<const Snapshot> snapshot_;
};

}  // namespace vantrel::elastic
