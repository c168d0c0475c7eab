#include "elastic/common/durable_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>

#include "elastic/common/file_descriptor.h"
#include "elastic/common/path.h"
#include "elastic/format/io/folder.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

bool WriteFully(int descriptor, std::string_view bytes, uint64_t offset) {
  while (!bytes.empty()) {
    const ssize_t written = pwrite(descriptor, bytes.data(), bytes.size(), static_cast<off_t>(offset));
    if (written < 0 && errno == EINTR) continue;
    if (written < 0) return false;
    bytes.remove_prefix(static_cast<size_t>(written));
    offset += static_cast<uint64_t>(written);
  }
  return true;
}

void WriteFileDurably(const std::string& folder, const std::string& name, std::string_view bytes) {
  const std::string path = JoinPath(folder, name);
  const std::string draft = path + ".new";
  // Made anew: whatever bears the name, left behind or laid there (a link, a FIFO), is not written through.
  if (unlink(draft.c_str()) != 0 && errno != ENOENT) throw IndexIoError(draft, "cannot remove file", errno);
  FileDescriptor file(open(draft.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0666));
  if (!file.is_open()) throw IndexIoError(draft, "cannot create file", errno);
  const bool written = WriteFully(file.get(), bytes, 0) && fsync(file.get()) == 0 && file.Close() &&
                       rename(draft.c_str(), path.c_str()) == 0;
  if (!written) {
    const int failure = errno;
    unlink(draft.c_str());
    throw IndexIoError(path, "cannot write file", failure);
  }
  SyncFolder(folder);
}

void SyncFolder(const std::string& folder) {
  const FileDescriptor directory(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!directory.is_open() || fsync(directory.get()) != 0) {
    throw IndexIoError(folder, "cannot make the folder's entries durable", errno);
  }
}

}  // namespace vantrel::elastic
