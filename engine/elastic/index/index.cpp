#include "vantrel/elastic/index.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <optional>
#include <utility>

#include "elastic/format/commit.h"
#include "elastic/format/deletions.h"
#include "elastic/format/file_names.h"
#include "elastic/format/folder.h"
#include "elastic/format/segment_files.h"
#include "elastic/index/document_builder.h"
#include "elastic/index/durable_file.h"
#include "elastic/index/index_text.h"
#include "elastic/index/library_writer.h"
#include "elastic/index/settings_file.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/library_setup.h"
#include "vantrel/elastic/write_lock.h"

namespace vantrel::elastic {
namespace {

void CheckPath(const std::string& path) {
  if (path.empty()) throw IndexValueError(path, "the path of an index is not empty");
  if (const size_t zero = path.find('\0'); zero != std::string::npos) {
    throw IndexValueError(path.substr(0, zero), "the path goes on after a zero byte");
  }
  std::wstring wide;
  if (const char* problem = ToIndexText(path, wide)) {
    throw IndexValueError(path, std::string("the path ") + problem);
  }
}

void MakeFolder(const std::string& path) {
  if (mkdir(path.c_str(), 0777) == 0) return SyncFolder(format::JoinPath(path, ".."));
  if (errno != EEXIST) throw IndexIoError(path, "cannot create index folder", errno);
}

// What the library would take for files of an index, and might delete.
bool HoldsIndexFiles(const std::string& path) {
  const std::vector<std::string> names = format::DiskFolder(path).List();
  return std::any_of(names.begin(), names.end(), [](const std::string& name) {
    return name.starts_with(format::kSegments) || name.starts_with('_');
  });
}

}  // namespace

class Index::Impl {
 public:
  Impl(std::string path, IndexSettings settings)
      : path_(std::move(path)), settings_(std::move(settings)), builder_(path_, settings_) {}

  const std::string& path() const { return path_; }
  const IndexSettings& settings() const { return settings_; }
  const DocumentBuilder& builder() const { return builder_; }
  bool is_writing() const { return writer_.has_value(); }

  void StartWriting(WriteLock lock, LibraryWriter::Start start) {
    lock_ = std::move(lock);
    writer_.emplace(path_, *lock_, settings_.compound_files, start);
  }

  // Runs `operation` on the writer, which is opened first where need be. A writer that failed is given up.
  template <typename Operation>
  void Write(Operation operation) {
    if (!lock_.has_value()) lock_.emplace(path_);
    if (!writer_.has_value()) {
      CheckCommit();
      writer_.emplace(path_, *lock_, settings_.compound_files, LibraryWriter::Start::kExistingIndex);
    }
    try {
      operation(*writer_);
    } catch (...) {
      writer_.reset();
      throw;
    }
  }

  // Decodes the newest commit within bounds: the library, which trusts its bytes, reads it next.
  void CheckCommit() const {
    format::UseNewestCommit(format::DiskFolder(path_), [](const format::Commit&) {});
  }

 private:
  std::string path_;
  IndexSettings settings_;
  DocumentBuilder builder_;
  std::optional<WriteLock> lock_;
  std::optional<LibraryWriter> writer_;  // after the lock: it must go first
};

std::shared_ptr<Index> Index::Create(const std::string& path, const IndexSettings& settings) {
  PrepareIndexLibrary();
  CheckPath(path);
  CheckSettings(path, settings);
  MakeFolder(path);
  if (HoldsIndexFiles(path)) throw IndexExistsError(path);
  WriteLock lock(path);
  // Once more, now that nobody else can be creating one. An index is there when its first commit is: settings
  // alone are what an attempt left that was cut short.
  if (HoldsIndexFiles(path)) throw IndexExistsError(path);
  WriteSettings(path, settings);
  auto impl = std::make_unique<Impl>(path, settings);
  impl->StartWriting(std::move(lock), LibraryWriter::Start::kEmptyIndex);
  return std::shared_ptr<Index>(new Index(std::move(impl)));
}

std::shared_ptr<Index> Index::Open(const std::string& path) {
  PrepareIndexLibrary();
  CheckPath(path);
  format::UseNewestCommit(format::DiskFolder(path), [](const format::Commit&) {});
  return std::shared_ptr<Index>(new Index(std::make_unique<Impl>(path, ReadSettings(path))));
}

Index::Index(std::unique_ptr<Impl> impl) : impl_(std::move(impl)) {}

Index::~Index() = default;

const std::string& Index::path() const { return impl_->path(); }

const IndexSettings& Index::settings() const { return impl_->settings(); }

void Index::Add(const Document& document) {
  const Lucene::DocumentPtr built = impl_->builder().Build(document);
  impl_->Write([&](LibraryWriter& writer) { writer.Add(built); });
}

void Index::Delete(std::string_view field, std::string_view value) {
  const Lucene::TermPtr term = impl_->builder().BuildTerm(field, value);
  impl_->Write([&](LibraryWriter& writer) { writer.Delete(term); });
}

void Index::Optimize() {
  impl_->Write([](LibraryWriter& writer) { writer.Optimize(); });
}

void Index::Commit() {
  if (impl_->is_writing()) impl_->Write([](LibraryWriter& writer) { writer.Commit(); });
}

DocumentCounts Index::CountDocuments() const {
  DocumentCounts counts;
  const format::DiskFolder folder(impl_->path());
  format::UseNewestCommit(folder, [&](format::Commit commit) {
    counts = {};
    for (format::SegmentInfo& segment : commit.segments) {
      const auto documents = static_cast<uint64_t>(segment.document_count);
      const format::SegmentFiles files = format::OpenSegment(folder, std::move(segment));
      uint64_t deleted = 0;
      if (files.deletions != nullptr) {
        const format::Deletions deletions(files.deletions, files.info.document_count);
        deleted = static_cast<uint64_t>(deletions.count());
      }
      counts.live += documents - deleted;
      counts.deleted += deleted;
    }
  });
  return counts;
}

}  // namespace vantrel::elastic
