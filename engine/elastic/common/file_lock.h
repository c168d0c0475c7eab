#pragma once

#include <sys/types.h>

#include <optional>
#include <string>

#include "elastic/common/file_descriptor.h"

namespace vantrel::elastic {

// An exclusive lock on a file, held against every other process and every other FileLock of this one. It belongs to
// the open file description, so the kernel releases it when its holder dies. The file is never deleted: a lock on a
// deleted file would not keep out the process that creates the next one.
class FileLock {
 public:
  // Does not wait; returns nothing where another holds the lock. A missing file is created with `mode`; a symbolic link
  // is not followed, as it could create a file anywhere. Throws IndexIoError where the system refuses, IndexError where
  // the path is no regular file.
  static std::optional<FileLock> TryLock(const std::string& path, mode_t mode);

 private:
  explicit FileLock(FileDescriptor file);

  FileDescriptor file_;
};

}  // namespace vantrel::elastic
