#include "elastic/cache/page_cache.h"

#include <fcntl.h>
#include <sys/sendfile.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <string>

#include "elastic/common/file_descriptor.h"

namespace vantrel::elastic {
namespace {

constexpr uint64_t kPiece = uint64_t{4} << 20;

FileDescriptor OpenForReading(const std::string& path) {
  // Not waiting, in case a FIFO stands there.
  return FileDescriptor(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
}

bool IsRegularFile(const FileDescriptor& file) {
  struct stat status {};
  return file.get() >= 0 && fstat(file.get(), &status) == 0 && S_ISREG(status.st_mode);
}

// Has the kernel read pages of files. It hands them to the null device, which takes them without looking: that way
// they come into the cache, and it waits for them, but nobody copies them.
class PageReader {
 public:
  // How many bytes were read: fewer than `length` where the file ends or cannot be read.
  uint64_t Read(const FileDescriptor& file, uint64_t offset, uint64_t length) {
    uint64_t done = 0;
    while (done < length) {
      const ssize_t got =
          ReadPiece(file.get(), static_cast<off_t>(offset + done), std::min(length - done, kPiece));
      if (got < 0 && errno == EINTR) continue;
      if (got <= 0) break;
      done += static_cast<uint64_t>(got);
    }
    return done;
  }

 private:
  ssize_t ReadPiece(int file, off_t offset, size_t length) {
    if (can_hand_over_) {
      const ssize_t got = sendfile(null_.get(), file, &offset, length);
      if (got >= 0 || (errno != EINVAL && errno != ENOSYS && errno != EBADF)) return got;
      can_hand_over_ = false;  // not from this file system, or not here
    }
    buffer_.resize(kPiece);
    return pread(file, buffer_.data(), length, offset);
  }

  FileDescriptor null_{open("/dev/null", O_WRONLY | O_CLOEXEC)};
  bool can_hand_over_ = true;
  std::vector<char> buffer_;
};

}  // namespace

PageCacheWarmUp BringIn(const std::vector<Extent>& extents, uint64_t most_bytes) {
  PageReader reader;
  PageCacheWarmUp result{.bytes = 0, .is_whole = true};
  for (const Extent& extent : extents) {
    const FileDescriptor file = OpenForReading(extent.path);
    if (!IsRegularFile(file)) continue;
    const uint64_t room = most_bytes - result.bytes;
    result.is_whole = extent.length <= room;
    // Has the kernel read ahead in larger pieces.
    posix_fadvise(file.get(), 0, 0, POSIX_FADV_SEQUENTIAL);
    result.bytes += reader.Read(file, extent.offset, std::min(extent.length, room));
    if (!result.is_whole) break;
  }
  return result;
}

}  // namespace vantrel::elastic
