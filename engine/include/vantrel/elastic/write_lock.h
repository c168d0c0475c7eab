#pragma once

#include <memory>
#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

class FileLock;

// The right to change the index in a folder: at most one WriteLock stands on it at a time, over all processes
// and within each. It is a lock on the open file description of a file of its own in the folder. Unlike a
// process-owned lock, it falls neither to a second attempt in the same process nor when another descriptor of
// the file is closed; the kernel lifts it when its holder dies. The file is never deleted: a lock on a
// deleted file would not keep out whoever creates the next.
//
// An Index takes it with its first change; who changes the files in any other way takes it first.
class VANTREL_ELASTIC_EXPORT WriteLock {
 public:
  // A name that no file of the index library bears.
  static constexpr const char* kFileName = "quorelastic.lock";

  // Takes the lock without waiting. Throws IndexLockedError where another holds it, IndexIoError where the
  // file can be neither opened nor created, IndexError where something else than a file bears its name.
  explicit WriteLock(const std::string& folder);
  WriteLock(WriteLock&& other) noexcept;
  WriteLock& operator=(WriteLock&& other) noexcept;
  WriteLock(const WriteLock&) = delete;
  WriteLock& operator=(const WriteLock&) = delete;
  ~WriteLock();

 private:
  std::unique_ptr<FileLock> lock_;
};

}  // namespace vantrel::elastic
