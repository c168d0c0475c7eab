#pragma once

#include <optional>
#include <string>

#include "base/file_descriptor.h"

namespace quorelasticd {

// An exclusive lock on a file, held against every other process and every other holder in this one. It stands
// on the open file description: the kernel lifts it when its holder dies. The file is created where it is missing
// and never deleted.
class FileLock {
 public:
  // Does not wait. Nothing when somebody else holds the lock. Throws std::system_error where the file can be
  // neither opened nor created.
  static std::optional<FileLock> TryLock(const std::string& path);

 private:
  explicit FileLock(FileDescriptor file);

  FileDescriptor file_;
};

}  // namespace quorelasticd
