#include "elastic/index/disk_directory.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

// Not without the index library's main header.
#include <lucene++/BufferedIndexInput.h>
#include <lucene++/BufferedIndexOutput.h>

#include <cerrno>
#include <span>
#include <utility>

#include "elastic/common/durable_file.h"
#include "elastic/common/file_descriptor.h"
#include "elastic/common/path.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/folder.h"
#include "elastic/format/io/opening_error.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;
using Lucene::StringUtils;

class DiskOutput : public Lucene::BufferedIndexOutput {
 public:
  DiskOutput(boost::shared_ptr<DiskDirectory> directory, std::string path)
      : directory_(std::move(directory)), path_(std::move(path)) {
    file_ = FileDescriptor(::open(path_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666));
    if (!file_.is_open()) directory_->Fail(IndexIoError(path_, "cannot create file", errno));
  }

  using BufferedIndexOutput::flushBuffer;

  void flushBuffer(const uint8_t* bytes, int32_t offset, int32_t length) override {
    const std::string_view piece(reinterpret_cast<const char*>(bytes) + offset, static_cast<size_t>(length));
    if (WriteFully(file_.get(), piece, static_cast<uint64_t>(bufferStart))) return;
    directory_->Fail(IndexIoError(path_, "cannot write file", errno));
  }

  void close() override {
    if (!file_.is_open()) return;
    BufferedIndexOutput::close();
    if (!file_.Close()) directory_->Fail(IndexIoError(path_, "cannot write file", errno));
  }

  int64_t length() override {
    struct stat status {};
    if (fstat(file_.get(), &status) == 0) return status.st_size;
    directory_->Fail(IndexIoError(path_, "cannot examine file", errno));
  }

 private:
  boost::shared_ptr<DiskDirectory> directory_;
  std::string path_;
  FileDescriptor file_;
};

// Clones share the file and outlive the original's close().
class DiskInput : public Lucene::BufferedIndexInput {
 public:
  DiskInput() = default;  // of a clone to be
  DiskInput(boost::shared_ptr<DiskDirectory> directory, std::shared_ptr<const format::ByteSource> source,
            int32_t buffer_size)
      : BufferedIndexInput(buffer_size), directory_(std::move(directory)), source_(std::move(source)) {}

  int64_t length() override { return source_ == nullptr ? 0 : static_cast<int64_t>(source_->size()); }

  void close() override {
    BufferedIndexInput::close();
    source_.reset();
  }

  Lucene::LuceneObjectPtr clone(const Lucene::LuceneObjectPtr& other) override {
    const auto copy = BufferedIndexInput::clone(other ? other : newLucene<DiskInput>());
    const auto input = boost::dynamic_pointer_cast<DiskInput>(copy);
    input->directory_ = directory_;
    input->source_ = source_;
    return copy;
  }

 protected:
  void readInternal(uint8_t* bytes, int32_t offset, int32_t length) override {
    if (source_ == nullptr) boost::throw_exception(Lucene::AlreadyClosedException(L"this file is closed"));
    try {
      source_->ReadAt(static_cast<uint64_t>(getFilePointer()),
                      std::span(bytes + offset, static_cast<size_t>(length)));
    } catch (const IndexError& error) {
      directory_->NoteFailedReading(error);
      boost::throw_exception(Lucene::IOException(StringUtils::toUnicode(error.what())));
    }
  }

  void seekInternal(int64_t /*position*/) override {}

 private:
  boost::shared_ptr<DiskDirectory> directory_;
  std::shared_ptr<const format::ByteSource> source_;
};

void SyncFile(const std::string& path) {
  const FileDescriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (!file.is_open() || fsync(file.get()) != 0) throw IndexIoError(path, "cannot make file durable", errno);
}

std::string AsToldByLibrary(const IndexError& error) {
  return StringUtils::toUTF8(StringUtils::toUnicode(error.what()));
}

}  // namespace

DiskDirectory::DiskDirectory(const std::string& path, std::shared_ptr<LibraryGuard> guard)
    : BytePathDirectory(path), path_(path), guard_(std::move(guard)) {}

DiskDirectory::~DiskDirectory() = default;

void DiskDirectory::Fail(const IndexIoError& error) {
  // segments.gen is but a hint, written when the commit is already durable: whoever reads it can do without.
  const bool harmless = error.path() == JoinPath(path_, std::string(format::kSegmentsGen));
  if (!failure_.has_value() && !harmless) failure_ = error;
  boost::throw_exception(Lucene::IOException(StringUtils::toUnicode(error.what())));
}

void DiskDirectory::ThrowFailure(const char* purpose, std::string reason) const {
  const std::lock_guard lock(read_problem_mutex_);
  if (reason.empty()) reason = read_problem_;
  for (const IndexIoError& problem : io_problems_) {
    if (reason.find(AsToldByLibrary(problem)) != std::string::npos) throw IndexIoError(problem);
  }
  if (reason.empty()) reason = "the index library gives no reason";
  throw IndexError(path_, std::string(purpose) + ": " + reason);
}

void DiskDirectory::NoteFailedReading(const IndexError& error) {
  NoteReadProblem(error);
  // The library does well without segments.gen, and without a commit that is not whole.
  const bool harmless = error.path().starts_with(JoinPath(path_, std::string(format::kSegments)));
  if (!harmless) NoteFailedReading();
}

std::optional<IndexIoError> DiskDirectory::io_problem() const {
  const std::lock_guard lock(read_problem_mutex_);
  if (io_problems_.empty()) return std::nullopt;
  return io_problems_.back();
}

void DiskDirectory::NoteReadProblem(const IndexError& error) {
  const std::lock_guard lock(read_problem_mutex_);
  read_problem_ = AsToldByLibrary(error);
  const auto* const problem = dynamic_cast<const IndexIoError*>(&error);
  if (problem == nullptr || format::IsAbsenceError(*problem)) return;
  if (problem->path() != JoinPath(path_, std::string(format::kSegmentsGen))) {
    if (!refusal_.has_value()) refusal_ = *problem;
    has_failed_reading_ = true;
  }
  constexpr size_t kKept = 16;
  if (io_problems_.size() == kKept) io_problems_.pop_front();
  io_problems_.push_back(*problem);
}

std::optional<IndexIoError> DiskDirectory::refusal() const {
  const std::lock_guard lock(read_problem_mutex_);
  return refusal_;
}

std::shared_ptr<const format::ByteSource> DiskDirectory::Open(const std::string& name) const {
  if (guard_ != nullptr) return guard_->Open(name);
  auto file = format::DiskFolder(path_).Open(name);
  if (const auto generation = format::CommitGeneration(name)) format::ReadCommit(file, *generation);
  return file;
}

Lucene::IndexOutputPtr DiskDirectory::createOutput(const Lucene::String& name) {
  ensureOpen();
  if (failure_.has_value()) Fail(*failure_);
  const std::string own_name = StringUtils::toUTF8(name);
  const std::string path = JoinPath(path_, own_name);
  // Never written over: readers may hold the old file open.
  if (unlink(path.c_str()) != 0 && errno != ENOENT) Fail(IndexIoError(path, "cannot replace file", errno));
  uncommitted_.insert(own_name);
  if (guard_ != nullptr) guard_->NoteWritten(own_name);
  return newLucene<DiskOutput>(boost::static_pointer_cast<DiskDirectory>(shared_from_this()), path);
}

Lucene::IndexInputPtr DiskDirectory::openInput(const Lucene::String& name) {
  return openInput(name, Lucene::BufferedIndexInput::BUFFER_SIZE);
}

Lucene::IndexInputPtr DiskDirectory::openInput(const Lucene::String& name, int32_t buffer_size) {
  ensureOpen();
  const std::string own_name = StringUtils::toUTF8(name);
  try {
    if (const auto refused = refusal(); refused.has_value()) throw IndexIoError(*refused);
    return newLucene<DiskInput>(boost::static_pointer_cast<DiskDirectory>(shared_from_this()), Open(own_name),
                                buffer_size);
  } catch (const IndexError& error) {
    NoteReadProblem(error);
    boost::throw_exception(Lucene::FileNotFoundException(StringUtils::toUnicode(error.what())));
  }
}

void DiskDirectory::sync(const Lucene::String& name) {
  ensureOpen();
  if (failure_.has_value()) Fail(*failure_);
  const std::string own_name = StringUtils::toUTF8(name);
  try {
    SyncFile(JoinPath(path_, own_name));
    if (!format::CommitGeneration(own_name).has_value()) return;
    SyncFolder(path_);
  } catch (const IndexIoError& error) {
    Fail(error);
  }
  uncommitted_.clear();
}

void DiskDirectory::deleteFile(const Lucene::String& name) {
  ensureOpen();
  const std::string own_name = StringUtils::toUTF8(name);
  if (failure_.has_value() && !uncommitted_.contains(own_name)) Fail(*failure_);
  const std::string path = JoinPath(path_, own_name);
  if (unlink(path.c_str()) != 0) {
    // No harm to the index: the library tries again, and every writer removes what no commit refers to.
    const IndexIoError error(path, "cannot delete file", errno);
    boost::throw_exception(Lucene::IOException(StringUtils::toUnicode(error.what())));
  }
  uncommitted_.erase(own_name);
  if (guard_ != nullptr) guard_->NoteDeleted(own_name);
}

}  // namespace vantrel::elastic
