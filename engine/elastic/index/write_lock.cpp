#include "vantrel/elastic/write_lock.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstdio>

#include "elastic/format/file_descriptor.h"
#include "elastic/format/folder.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

WriteLock::WriteLock(const std::string& folder) {
  const std::string path = format::JoinPath(folder, kFileName);
  // No link is followed: it could make a file anywhere.
  constexpr int kFlags = O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK;
  file_ = std::make_unique<format::FileDescriptor>(open(path.c_str(), kFlags, 0666));
  if (!file_->is_open()) throw IndexIoError(path, "cannot open lock file", errno);
  struct stat status {};
  if (fstat(file_->get(), &status) != 0) throw IndexIoError(path, "cannot examine lock file", errno);
  if (!S_ISREG(status.st_mode)) throw IndexError(path, "not a regular file");
  struct flock whole_file {};
  whole_file.l_type = F_WRLCK;
  whole_file.l_whence = SEEK_SET;
  while (fcntl(file_->get(), F_OFD_SETLK, &whole_file) != 0) {
    if (errno == EAGAIN || errno == EACCES) throw IndexLockedError(folder);
    if (errno != EINTR) throw IndexIoError(path, "cannot lock file", errno);
  }
}

WriteLock::WriteLock(WriteLock&& other) noexcept = default;

WriteLock& WriteLock::operator=(WriteLock&& other) noexcept = default;

WriteLock::~WriteLock() = default;

}  // namespace vantrel::elastic
