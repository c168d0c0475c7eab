#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "elastic/format/io/byte_source.h"
#include "elastic/format/io/folder.h"

namespace vantrel::elastic::format {

// What a WatchedFolder calls. It may throw, to cancel what reads: the exception leaves the call to the folder or the
// file. Must be thread-safe where several threads read.
class ReadWatcher {
 public:
  ReadWatcher() = default;
  ReadWatcher(const ReadWatcher&) = delete;
  ReadWatcher& operator=(const ReadWatcher&) = delete;
  virtual ~ReadWatcher() = default;

  // After a file was opened.
  virtual void NoteOpened(const ByteSource& file) = 0;

  // After each read of `bytes` bytes, 0 to WatchedFolder::kLongestRead.
  virtual void NoteRead(uint64_t bytes) = 0;
};

// A folder whose files call a watcher whenever bytes are read from them. All decoders read through small buffers, so
// that no loop over the bytes of an index goes on for long without a call.
class WatchedFolder : public ForwardingFolder {
 public:
  // A longer read is split.
  static constexpr uint64_t kLongestRead = uint64_t{256} << 10;

  // Both must outlive it; the watcher also the files.
  WatchedFolder(const Folder& folder, ReadWatcher& watcher) : ForwardingFolder(folder), watcher_(watcher) {}

  std::shared_ptr<const ByteSource> Open(const std::string& name) const override;

 private:
  ReadWatcher& watcher_;
};

}  // namespace vantrel::elastic::format
