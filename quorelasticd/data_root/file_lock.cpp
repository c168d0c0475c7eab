#include "data_root/file_lock.h"

#include <fcntl.h>

#include <cerrno>
#include <cstdio>
#include <system_error>
#include <utility>

namespace quorelasticd {

FileLock::FileLock(FileDescriptor file) : file_(std::move(file)) {}

std::optional<FileLock> FileLock::TryLock(const std::string& path) {
  constexpr mode_t kMode = 0640;
  FileDescriptor file(open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK, kMode));
  if (!file.is_open()) throw std::system_error(errno, std::generic_category(), path);
  struct flock whole_file {};
  whole_file.l_type = F_WRLCK;
  whole_file.l_whence = SEEK_SET;
  while (fcntl(file.get(), F_OFD_SETLK, &whole_file) != 0) {
    if (errno == EAGAIN || errno == EACCES) return std::nullopt;
    if (errno != EINTR) throw std::system_error(errno, std::generic_category(), path);
  }
  return FileLock(std::move(file));
}

}  // namespace quorelasticd
