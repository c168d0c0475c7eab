#include "data_root/import_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>
#include <utility>

#include "base/limits.h"
#include "base/text.h"
#include "errors/request_error.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::FileDescriptor;

constexpr size_t kImportPiece = size_t{256} << 10;

[[noreturn]] void RefuseFile(const std::string& name, const std::string& problem) {
  throw RequestError(ErrorCode::kBadRequest, "file " + Quoted(name) + ": " + problem);
}

// Goes down one component at a time and follows no link: nothing that the file system holds leads out.
FileDescriptor OpenBelow(const std::string& folder, const std::string& name) {
  FileDescriptor place(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!place.is_open()) throw std::system_error(errno, std::generic_category(), folder);
  std::string_view rest = name;
  for (;;) {
    const size_t slash = rest.find('/');
    const std::string part(rest.substr(0, slash));
    if (part.empty() || part == "." || part == ".." || part.find('\0') != std::string::npos) {
      RefuseFile(name, "expected a path below the import folder");
    }
    const bool is_last = slash == std::string_view::npos;
    // Without O_NONBLOCK, a pipe that nobody writes to would be waited for.
    const int flags = O_RDONLY | O_NOFOLLOW | O_CLOEXEC | (is_last ? O_NONBLOCK : O_DIRECTORY);
    place = FileDescriptor(openat(place.get(), part.c_str(), flags));
    if (!place.is_open()) {
      if (errno == ELOOP || errno == ENOTDIR) RefuseFile(name, "leads over a link or a file");
      if (errno == ENOENT) RefuseFile(name, "not in the import folder");
      RefuseFile(name, "cannot be opened: " + std::generic_category().message(errno));
    }
    if (is_last) return place;
    rest.remove_prefix(slash + 1);
  }
}

}  // namespace

ImportFile::ImportFile(const std::string& folder, const std::string& name)
    : path_(folder + "/" + name), file_(OpenBelow(folder, name)) {
  struct stat status {};
  if (fstat(file_.get(), &status) != 0) throw std::system_error(errno, std::generic_category(), path_);
  if (!S_ISREG(status.st_mode)) RefuseFile(name, "is no regular file");
  total_bytes_ = static_cast<uint64_t>(status.st_size);
}

std::optional<ImportFile::Line> ImportFile::Next() {
  Line line;
  size_t searched = begin_;
  for (;;) {
    const size_t newline = buffer_.find('\n', searched);
    if (newline != std::string::npos) {
      line.text = std::string_view(buffer_).substr(begin_, newline - begin_);
      begin_ = newline + 1;
      break;
    }
    if (buffer_.size() - begin_ > kLongestImportLine) {  // the rest of it is read, but not kept
      line.is_too_long = true;
      begin_ = buffer_.size();
    }
    searched = buffer_.size() - begin_;
    if (at_end_ || !Fill()) {
      if (begin_ == buffer_.size() && !line.is_too_long) return std::nullopt;
      line.text = std::string_view(buffer_).substr(begin_);
      begin_ = buffer_.size();
      break;
    }
  }
  if (line.text.size() > kLongestImportLine) line.is_too_long = true;
  if (line.is_too_long) line.text = {};
  line.number = ++lines_;
  return line;
}

// False at the end of the file. What is not handed out moves to the front.
bool ImportFile::Fill() {
  buffer_.erase(0, begin_);
  begin_ = 0;
  if (is_given_up_) return false;
  const size_t kept = buffer_.size();
  buffer_.resize(kept + kImportPiece);
  ssize_t got = -1;
  do {
    got = read(file_.get(), buffer_.data() + kept, kImportPiece);
  } while (got < 0 && errno == EINTR);
  const int error = errno;
  buffer_.resize(kept + (got > 0 ? static_cast<size_t>(got) : 0));
  if (got < 0) throw std::system_error(error, std::generic_category(), path_);
  bytes_read_ += static_cast<uint64_t>(got);
  at_end_ = got == 0;
  return got > 0;
}

}  // namespace quorelasticd
