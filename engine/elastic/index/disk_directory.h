#pragma once

#include <atomic>
#include <deque>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>

#include "elastic/format/io/byte_source.h"
#include "elastic/index/byte_path_directory.h"
#include "elastic/index/library_guard.h"
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
// - It takes what it reads on trust. Here a guard, if there is one, has files verified, and a commit's own file is
//   handed out only where it can be decoded.
// - Where the newest commit cannot be opened, it takes the one before, whatever the reason. Here nothing is opened any
//   more once the system has refused to open or to read a file, but for segments.gen, which is only a hint.
//
// Exceptions are the library's own (Lucene::IOException), as it tidies up after no other. For one thread at a
// time, but for openInput and what comes from it.
class DiskDirectory : public BytePathDirectory {
 public:
  // `path` is used byte for byte; PrepareIndexLibrary() must have been called. No lock factory is taken: the writer
  // must hold our own lock, and the library's keeps nobody out.
  explicit DiskDirectory(const std::string& path, std::shared_ptr<LibraryGuard> guard = nullptr);
  ~DiskDirectory() override;

  // The first failure; nothing as long as all went well. To be asked after each operation of the library that
  // writes: it does not pass on all of them.
  const std::optional<IndexIoError>& failure() const { return failure_; }

  // Throws what the failure of an operation of the library comes down to, which had that purpose ("cannot search"):
  // IndexIoError where the system refused to open or to read something, else IndexError about the folder, with
  // `reason`, what the library says. Where it says nothing, with the newest thing that could not be read.
  [[noreturn]] void ThrowFailure(const char* purpose, std::string reason) const;

  // The newest refusal of the system to open or to read a file; nothing as long as there was none. Whoever asked the
  // library whether the index is whole has then not learned it.
  std::optional<IndexIoError> io_problem() const;

  // Whether something has failed that read through this directory. The library keeps for good what it has half read,
  // and crashes when it closes a reader that has failed on norms: so its readers are then not to be used again, and
  // not to be closed, but dropped.
  bool has_failed_reading() const { return has_failed_reading_; }

  // Takes note of a failed write and throws it as the library's exception.
  [[noreturn]] void Fail(const IndexIoError& error);

  // Takes note of a failure to read, with what is known of it. For any thread.
  void NoteFailedReading() { has_failed_reading_ = true; }
  void NoteFailedReading(const IndexError& error);

  Lucene::IndexOutputPtr createOutput(const Lucene::String& name) override;
  Lucene::IndexInputPtr openInput(const Lucene::String& name) override;
  Lucene::IndexInputPtr openInput(const Lucene::String& name, int32_t buffer_size) override;
  void sync(const Lucene::String& name) override;
  void deleteFile(const Lucene::String& name) override;

 private:
  void NoteReadProblem(const IndexError& error);
  std::optional<IndexIoError> refusal() const;
  std::shared_ptr<const format::ByteSource> Open(const std::string& name) const;

  std::string path_;
  // May be shared with other directories of the same folder; may be empty.
  std::shared_ptr<LibraryGuard> guard_;
  std::set<std::string> uncommitted_;  // names created since the last commit
  std::optional<IndexIoError> failure_;
  mutable std::mutex read_problem_mutex_;
  std::optional<IndexIoError> refusal_;   // the first, that of segments.gen left out
  std::string read_problem_;              // the newest, as the library tells it
  std::deque<IndexIoError> io_problems_;  // the newest that are the system's: each thread may meet one
  std::atomic<bool> has_failed_reading_ = false;
};

}  // namespace vantrel::elastic
