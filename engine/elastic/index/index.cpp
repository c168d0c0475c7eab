#include "vantrel/elastic/index.h"
#include "elastic/common/path.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <mutex>
#include <optional>
#include <utility>

#include "elastic/common/durable_file.h"
#include "elastic/common/quoted.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/folder.h"
#include "elastic/index/document_builder.h"
#include "elastic/index/index_statistics.h"
#include "elastic/index/index_text.h"
#include "elastic/index/library_guard.h"
#include "elastic/index/library_warm_up.h"
#include "elastic/index/library_writer.h"
#include "elastic/index/settings_file.h"
#include "elastic/index/value_analysis.h"
#include "elastic/search/search_run.h"
#include "elastic/search/snapshot.h"
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
  if (mkdir(path.c_str(), 0777) == 0) return SyncFolder(JoinPath(path, ".."));
  if (errno != EEXIST) throw IndexIoError(path, "cannot create index folder", errno);
}

// Whether a first commit was cut short, so that it never became one.
bool IsCutShort(const format::Folder& folder, const std::string& commit_name) {
  try {
    format::ReadCommit(folder.Open(commit_name), 1);
    return false;
  } catch (const IndexDamagedError&) {
    return true;
  }
}

// Whether the folder holds what the library would take for files of an index, and might delete. The first commit
// of an attempt that was cut short is none: it refers to nothing.
bool HoldsIndexFiles(const std::string& path) {
  const format::DiskFolder folder(path);
  const std::vector<std::string> names = folder.List();
  return std::any_of(names.begin(), names.end(), [&](const std::string& name) {
    if (name.starts_with('_')) return true;
    if (!name.starts_with(format::kSegments) || name == format::kSegmentsGen) return false;
    return name != format::CommitFileName(1) || !IsCutShort(folder, name);
  });
}

// Makes way for the first commit, where HoldsIndexFiles has found nothing but what may go.
void RemoveCutShortCommit(const std::string& path) {
  for (const std::string& name : {format::CommitFileName(1), std::string(format::kSegmentsGen)}) {
    const std::string file = JoinPath(path, name);
    if (unlink(file.c_str()) != 0 && errno != ENOENT) throw IndexIoError(file, "cannot remove file", errno);
  }
}

// The settings of an index to be, complete.
IndexSettings WithIdField(IndexSettings settings) {
  const auto is_id = [&](const FieldSettings& field) { return field.name == settings.id_field; };
  if (!settings.fields.empty() && std::none_of(settings.fields.begin(), settings.fields.end(), is_id)) {
    const FieldSettings id{
        .name = settings.id_field, .type = FieldType::kKeyword, .norms = false, .frequencies = false};
    settings.fields.insert(settings.fields.begin(), id);
  }
  return settings;
}

}  // namespace

class Index::Impl {
 public:
  explicit Impl(std::string path) : path_(std::move(path)), snapshots_(path_, guard_) {}

  const std::string& path() const { return path_; }
  const IndexSettings& settings() { return Opened().settings; }
  const DocumentBuilder& builder() { return Opened().builder; }

  // Opens the index, unless it is open.
  void Open() { Opened(); }

  // With settings that are known already.
  void Open(const IndexSettings& settings) { open_.emplace(path_, settings); }

  std::shared_ptr<const Snapshot> NewestSnapshot() {
    Open();
    return snapshots_.Newest();
  }

  void StartWriting(WriteLock lock, LibraryWriter::Start start) {
    lock_ = std::move(lock);
    writer_.emplace(path_, *lock_, settings(), start, guard_);
  }

  // Runs `operation` on the writer, which is opened first where need be. A writer that failed is given up. One
  // thread at a time gets here.
  template <typename Operation>
  void Write(Operation operation) {
    Open();
    const std::lock_guard guard(write_mutex_);
    if (!lock_.has_value()) lock_.emplace(path_);
    if (!writer_.has_value()) {
      guard_->AdmitNewestCommit();
      writer_.emplace(path_, *lock_, settings(), LibraryWriter::Start::kExistingIndex, guard_);
    }
    RunWriter(operation);
  }

  // Writes what only a commit makes visible.
  template <typename Operation>
  void Change(Operation operation) {
    Write([&](LibraryWriter& writer) {
      operation(writer);
      has_changes_ = true;
    });
  }

  // Commits, unless changes of this round are lost already: that is told once, then what came since counts.
  void Commit(Merging merging) {
    const std::lock_guard guard(write_mutex_);
    if (std::exchange(changes_are_lost_, false)) throw IndexChangesLostError(path_);
    if (!writer_.has_value()) return;
    try {
      RunWriter([](LibraryWriter& writer) { writer.Commit(); });
    } catch (...) {
      changes_are_lost_ = false;  // told by this very exception
      throw;
    }
    has_changes_ = false;
    if (merging == Merging::kAllowed) MergeSegments();
  }

 private:
  struct OpenedIndex {
    OpenedIndex(const std::string& path, const IndexSettings& read)
        : settings(read), builder(path, settings) {}

    const IndexSettings settings;
    const DocumentBuilder builder;
  };

  const OpenedIndex& Opened() {
    const std::lock_guard guard(open_mutex_);
    if (!open_.has_value()) {
      PrepareIndexLibrary();
      WarmUpIndexLibrary();
      CheckPath(path_);
      format::ReadNewestCommit(format::DiskFolder(path_));  // is there
      open_.emplace(path_, ReadSettings(path_));
    }
    return *open_;
  }

  // Everything is committed: a failure loses nobody anything. The segments stay as they are, and the next commit
  // tries again, with another writer.
  void MergeSegments() {
    try {
      writer_->MergeSegments();
    } catch (...) {
      writer_.reset();
    }
  }

  template <typename Operation>
  void RunWriter(Operation operation) {
    try {
      operation(*writer_);
    } catch (...) {
      writer_.reset();
      if (std::exchange(has_changes_, false)) changes_are_lost_ = true;
      throw;
    }
  }

  const std::string path_;
  const std::shared_ptr<LibraryGuard> guard_ = std::make_shared<LibraryGuard>(path_);
  SnapshotKeeper snapshots_;
  std::mutex open_mutex_;
  std::optional<OpenedIndex> open_;  // once it is there, it stays
  std::mutex write_mutex_;           // for what follows
  std::optional<WriteLock> lock_;
  std::optional<LibraryWriter> writer_;  // after the lock: it must go first
  bool has_changes_ = false;             // that are not committed
  bool changes_are_lost_ = false;        // that a caller takes for made
};

std::shared_ptr<Index> Index::Create(const std::string& path, const IndexSettings& wanted_settings) {
  PrepareIndexLibrary();
  WarmUpIndexLibrary();
  CheckPath(path);
  const IndexSettings settings = WithIdField(wanted_settings);
  CheckSettings(path, settings);
  MakeFolder(path);
  if (HoldsIndexFiles(path)) throw IndexExistsError(path);
  WriteLock lock(path);
  // Once more, now that nobody else can be creating one. An index is there when its first commit is: settings
  // alone are what an attempt left that was cut short.
  if (HoldsIndexFiles(path)) throw IndexExistsError(path);
  RemoveCutShortCommit(path);
  WriteSettings(path, settings);
  auto impl = std::make_unique<Impl>(path);
  impl->Open(settings);
  impl->StartWriting(std::move(lock), LibraryWriter::Start::kEmptyIndex);
  return std::shared_ptr<Index>(new Index(std::move(impl)));
}

std::shared_ptr<Index> Index::Open(const std::string& path) {
  std::shared_ptr<Index> index = OpenLater(path);
  index->impl_->Open();
  return index;
}

std::shared_ptr<Index> Index::OpenLater(const std::string& path) {
  return std::shared_ptr<Index>(new Index(std::make_unique<Impl>(path)));
}

Index::Index(std::unique_ptr<Impl> impl) : impl_(std::move(impl)) {}

Index::~Index() = default;

const std::string& Index::path() const { return impl_->path(); }

const IndexSettings& Index::settings() const { return impl_->settings(); }

void Index::Add(const Document& document) {
  const Lucene::DocumentPtr built = impl_->builder().Build(document);
  impl_->Change([&](LibraryWriter& writer) { writer.Add(built); });
}

void Index::Update(const Document& document) {
  const Lucene::TermPtr id = impl_->builder().BuildId(document);
  const Lucene::DocumentPtr built = impl_->builder().Build(document);
  impl_->Change([&](LibraryWriter& writer) { writer.Update(id, built); });
}

void Index::Delete(std::string_view field, std::string_view value) {
  const Lucene::TermPtr term = impl_->builder().BuildTerm(field, value);
  impl_->Change([&](LibraryWriter& writer) { writer.Delete(term); });
}

void Index::DeleteById(std::string_view id) { Delete(settings().id_field, id); }

void Index::Optimize() {
  impl_->Write([](LibraryWriter& writer) { writer.Optimize(); });
}

void Index::Commit(Merging merging) { impl_->Commit(merging); }

DocumentCounts Index::CountDocuments() const { return Statistics().documents; }

IndexStatistics Index::Statistics() const { return ReadStatistics(format::DiskFolder(impl_->path())); }

std::vector<AnalyzedToken> Index::Analyze(std::string_view field, std::string_view value) const {
  const std::wstring checked = impl_->builder().CheckValue(field, value);
  constexpr uint64_t kMostShown = uint64_t{4} << 20;
  if (checked.size() * impl_->builder().MostGrowthOf(field) > kMostShown) {
    throw IndexValueError(path(), "field " + Quoted(field) + ": the value may become more than " +
                                      std::to_string(kMostShown) + " characters of terms, too many to show");
  }
  return AnalyzeValue(settings(), field, checked);
}

SearchResult Index::Search(const SearchRequest& request, const SearchPluginRegistry& plugins,
                           const SearchLimits& limits) const {
  return RunSearch(
      [this] {
        return std::vector<SearchedIndex>{{path(), settings(), NewestSnapshot()}};
      },
      request, plugins, limits);
}

std::shared_ptr<const Snapshot> Index::NewestSnapshot() const { return impl_->NewestSnapshot(); }

}  // namespace vantrel::elastic
