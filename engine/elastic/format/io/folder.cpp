#include "elastic/format/io/folder.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <utility>

#include "elastic/common/file_descriptor.h"
#include "elastic/common/path.h"
#include "elastic/format/io/opening_error.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

// The kernel caps one read a little under 2 GiB; smaller pieces keep a signal's restart cheap.
constexpr size_t kLongestRead = size_t{1} << 30;

void RequireRegularFile(const std::string& path, const struct stat& status) {
  if (S_ISDIR(status.st_mode)) throw IndexIoError(path, "cannot open file", EISDIR);
  if (!S_ISREG(status.st_mode)) throw IndexError(path, "not a regular file");
}

// Looks before it opens, since opening alone may set a device going; and does not block, in case a FIFO is put
// in the file's place meanwhile.
int OpenRegularFile(const std::string& path) {
  struct stat status {};
  if (stat(path.c_str(), &status) != 0) throw IndexIoError(path, "cannot open file", errno);
  RequireRegularFile(path, status);
  const int descriptor = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY);
  if (descriptor < 0) throw IndexIoError(path, "cannot open file", errno);
  return descriptor;
}

class FileSource : public ByteSource {
 public:
  FileSource(std::string path, DiskFolder::Access access)
      : path_(std::move(path)), file_(OpenRegularFile(path_)) {
    struct stat status {};
    if (fstat(file_.get(), &status) != 0) throw IndexIoError(path_, "cannot examine file", errno);
    RequireRegularFile(path_, status);
    size_ = static_cast<uint64_t>(status.st_size);
    // Only a hint: a file system may not take it.
    if (access == DiskFolder::Access::kInOrder) posix_fadvise(file_.get(), 0, 0, POSIX_FADV_SEQUENTIAL);
  }

  const std::string& name() const override { return path_; }
  uint64_t size() const override { return size_; }

  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override {
    while (!out.empty()) {
      const ssize_t got =
          pread(file_.get(), out.data(), std::min(out.size(), kLongestRead), static_cast<off_t>(offset));
      if (got < 0 && errno == EINTR) continue;
      if (got < 0) throw IndexIoError(path_, "cannot read at offset " + std::to_string(offset), errno);
      if (got == 0) throw IndexError(path_, "file shrank to " + std::to_string(offset) + " bytes while read");
      out = out.subspan(static_cast<size_t>(got));
      offset += static_cast<uint64_t>(got);
    }
  }

 private:
  std::string path_;
  FileDescriptor file_;
  uint64_t size_ = 0;
};

bool IsFolder(const std::string& folder, const dirent& entry) {
  if (entry.d_type != DT_UNKNOWN && entry.d_type != DT_LNK) return entry.d_type == DT_DIR;
  struct stat status {};
  return stat(JoinPath(folder, entry.d_name).c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

}  // namespace

DiskFolder::DiskFolder(std::string path, Access access) : path_(std::move(path)), access_(access) {
  // The system would take the part before a zero byte for the path.
  const size_t zero = path_.find('\0');
  if (zero != std::string::npos) {
    throw IndexIoError(path_.substr(0, zero), "path goes on after a zero byte", ENOENT);
  }
  struct stat status {};
  if (stat(path_.c_str(), &status) != 0) throw IndexIoError(path_, "cannot open index folder", errno);
  if (!S_ISDIR(status.st_mode)) throw IndexIoError(path_, "cannot open index folder", ENOTDIR);
}

std::vector<std::string> DiskFolder::List() const {
  const std::unique_ptr<DIR, int (*)(DIR*)> stream(opendir(path_.c_str()), closedir);
  if (stream == nullptr) throw IndexIoError(path_, "cannot list index folder", errno);
  std::vector<std::string> names;
  for (;;) {
    errno = 0;
    const dirent* entry = readdir(stream.get());
    if (entry == nullptr) break;
    if (!IsFolder(path_, *entry)) names.emplace_back(entry->d_name);
  }
  if (errno != 0) throw IndexIoError(path_, "cannot list index folder", errno);
  return names;
}

bool DiskFolder::Exists(const std::string& name) const {
  const std::string path = JoinPath(path_, name);
  if (access(path.c_str(), F_OK) == 0) return true;
  if (!IsAbsence(errno)) throw IndexIoError(path, "cannot examine file", errno);
  return false;
}

std::shared_ptr<const ByteSource> DiskFolder::Open(const std::string& name) const {
  return std::make_shared<FileSource>(JoinPath(path_, name), access_);
}

}  // namespace vantrel::elastic::format
