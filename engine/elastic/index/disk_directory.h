#pragma once

#include <mutex>
#include <optional>
#include <set>
#include <string>

#include "elastic/index/byte_path_directory.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

// The folder of an index as the index library writes it, with what the library's own directory lacks:
//
// - Its files swallow a failed write: on a full disk it commits segments that are cut off. And it goes on,
//   deleting the commit before, when the new one's segments_N cannot be made durable. Here a failure is
//   thrown, and it sticks: from then on nothing is created or synced any more, and nothing is deleted but
//   what was made since the last commit. So the last commit stays whole, whatever the library makes of the
//   failure.
// - It never syncs the folder, so that a new file's name could be lost with the power. Here a commit's folder
//   is synced with it, before the library deletes the files of the commit before.
// - It reads endlessly where the medium fails; here that is an error that names the file.
//
// Exceptions are the library's own (Lucene::IOException), as it tidies up after no other. For one thread at a
// time, but for openInput and what comes from it.
class DiskDirectory : public BytePathDirectory {
 public:
  // `path` is used byte for byte; PrepareIndexLibrary() must have been called. No lock factory is taken: the writer
  // must hold our own lock, and the library's keeps nobody out.
  explicit DiskDirectory(const std::string& path);
  ~DiskDirectory() override;

  // The first failure; nothing as long as all went well. To be asked after each operation of the library that
  // writes: it does not pass on all of them.
  const std::optional<IndexIoError>& failure() const { return failure_; }

  // The newest thing that could not be opened or read, as one line; empty as long as there was none. It may
  // be harmless, but where the library fails without a reason, this is it.
  std::string last_read_problem() const;

  // Takes note of a failed write and throws it as the library's exception.
  [[noreturn]] void Fail(const IndexIoError& error);

  // The same for a failed read, which does not stick. For any thread.
  void NoteReadProblem(const IndexError& error);

  Lucene::IndexOutputPtr createOutput(const Lucene::String& name) override;
  Lucene::IndexInputPtr openInput(const Lucene::String& name) override;
  Lucene::IndexInputPtr openInput(const Lucene::String& name, int32_t buffer_size) override;
  void sync(const Lucene::String& name) override;
  void deleteFile(const Lucene::String& name) override;

 private:
  std::string path_;
  std::set<std::string> uncommitted_;  // names created since the last commit
  std::optional<IndexIoError> failure_;
  mutable std::mutex read_problem_mutex_;
  std::string read_problem_;
};

}  // namespace vantrel::elastic
