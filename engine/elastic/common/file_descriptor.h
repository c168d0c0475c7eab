#pragma once

#include <unistd.h>

#include <utility>

namespace vantrel::elastic {

// Owns an open file of the operating system, or none (-1).
class FileDescriptor {
 public:
  FileDescriptor() = default;
  explicit FileDescriptor(int descriptor) : descriptor_(descriptor) {}
  FileDescriptor(FileDescriptor&& other) noexcept : descriptor_(std::exchange(other.descriptor_, -1)) {}
  FileDescriptor& operator=(FileDescriptor&& other) noexcept {
    std::swap(descriptor_, other.descriptor_);
    return *this;
  }
  FileDescriptor(const FileDescriptor&) = delete;
  FileDescriptor& operator=(const FileDescriptor&) = delete;
  ~FileDescriptor() { Close(); }

  bool is_open() const { return descriptor_ >= 0; }
  int get() const { return descriptor_; }

  // Closes it now, for who wants to know: false, with errno set, where the system reports that something
  // written earlier was lost. True when there was nothing to close.
  bool Close() {
    const int closing = std::exchange(descriptor_, -1);
    return closing < 0 || close(closing) == 0;
  }

 private:
  int descriptor_ = -1;
};

}  // namespace vantrel::elastic
