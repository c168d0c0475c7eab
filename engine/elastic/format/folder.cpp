#include "elastic/format/folder.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <utility>

#include "elastic/format/file_descriptor.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

// The kernel caps one read a little under 2 GiB; smaller pieces keep a signal's restart cheap.
constexpr size_t kLongestRead = size_t{1} << 30;

class FileSource : public ByteSource {
 public:
  // Non-blocking, so that a FIFO that bears an index file's name cannot hold us up.
  explicit FileSource(std::string path)
      : path_(std::move(path)), file_(open(path_.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK)) {
    if (!file_.is_open()) throw IndexIoError(path_, "cannot open file", errno);
    struct stat status {};
    if (fstat(file_.get(), &status) != 0) throw IndexIoError(path_, "cannot examine file", errno);
    if (S_ISDIR(status.st_mode)) throw IndexIoError(path_, "cannot open file", EISDIR);
    if (!S_ISREG(status.st_mode)) throw IndexError(path_, "not a regular file");
    size_ = static_cast<uint64_t>(status.st_size);
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

}  // namespace

std::string JoinPath(const std::string& folder, const std::string& name) {
  return folder.ends_with('/') ? folder + name : folder + "/" + name;
}

DiskFolder::DiskFolder(std::string path) : path_(std::move(path)) {
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
    names.emplace_back(entry->d_name);
  }
  if (errno != 0) throw IndexIoError(path_, "cannot list index folder", errno);
  return names;
}

bool DiskFolder::Exists(const std::string& name) const {
  return access(JoinPath(path_, name).c_str(), F_OK) == 0;
}

std::shared_ptr<const ByteSource> DiskFolder::Open(const std::string& name) const {
  return std::make_shared<FileSource>(JoinPath(path_, name));
}

}  // namespace vantrel::elastic::format
