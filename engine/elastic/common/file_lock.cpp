#include "elastic/common/file_lock.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <utility>

#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

FileLock::FileLock(FileDescriptor file) : file_(std::move(file)) {}

std::optional<FileLock> FileLock::TryLock(const std::string& path, mode_t mode) {
  constexpr int kFlags = O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK;
  FileDescriptor file(open(path.c_str(), kFlags, mode));
  if (!file.is_open()) throw IndexIoError(path, "cannot open lock file", errno);
  struct stat status {};
  if (fstat(file.get(), &status) != 0) throw IndexIoError(path, "cannot examine lock file", errno);
  if (!S_ISREG(status.st_mode)) throw IndexError(path, "not a regular file");
  struct flock whole_file {};
  whole_file.l_type = F_WRLCK;
  whole_file.l_whence = SEEK_SET;
  while (fcntl(file.get(), F_OFD_SETLK, &whole_file) != 0) {
    if (errno == EAGAIN || errno == EACCES) return std::nullopt;
    if (errno != EINTR) throw IndexIoError(path, "cannot lock file", errno);
  }
  return FileLock(std::move(file));
}

}  // namespace vantrel::elastic
