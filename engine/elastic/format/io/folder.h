#pragma once

#include <memory>
#include <string>
#include <vector>

#include "elastic/format/io/byte_source.h"

namespace vantrel::elastic::format {

// Where the files of an index stand side by side.
class Folder {
 public:
  Folder() = default;
  Folder(const Folder&) = delete;
  Folder& operator=(const Folder&) = delete;
  virtual ~Folder() = default;

  // What error messages call it.
  virtual const std::string& path() const = 0;

  // The names of what is in it, but for folders, in no order. Throws IndexIoError.
  virtual std::vector<std::string> List() const = 0;

  // Throws IndexIoError where the system does not say.
  virtual bool Exists(const std::string& name) const = 0;

  // Opens a file for reading. Throws IndexIoError where it is missing, unreadable or a folder, IndexError where it is
  // something else than a file.
  virtual std::shared_ptr<const ByteSource> Open(const std::string& name) const = 0;
};

// A folder that looks at what is opened in another one, which must outlive it.
class ForwardingFolder : public Folder {
 public:
  const std::string& path() const override { return folder_.path(); }
  std::vector<std::string> List() const override { return folder_.List(); }
  bool Exists(const std::string& name) const override { return folder_.Exists(name); }

 protected:
  explicit ForwardingFolder(const Folder& folder) : folder_(folder) {}

  const Folder& folder() const { return folder_; }

 private:
  const Folder& folder_;
};

// A folder of the file system. Nothing in it is ever created, locked or changed, and it is read by pread into
// buffers, never by mapping: a bad sector or a file that shrinks is an error then, not a signal.
class DiskFolder : public Folder {
 public:
  // How the files are going to be read. The system reads further ahead where that is from begin to end.
  enum class Access { kAnywhere, kInOrder };

  // `path` is used byte for byte. Throws IndexIoError when there is no such folder.
  explicit DiskFolder(std::string path, Access access = Access::kAnywhere);

  const std::string& path() const override { return path_; }
  std::vector<std::string> List() const override;
  bool Exists(const std::string& name) const override;
  std::shared_ptr<const ByteSource> Open(const std::string& name) const override;

 private:
  std::string path_;
  Access access_;
};

}  // namespace vantrel::elastic::format
