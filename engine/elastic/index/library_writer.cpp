#include "elastic/index/library_writer.h"

// Not without the index library's main header.
#include <lucene++/LogByteSizeMergePolicy.h>
#include <lucene++/SerialMergeScheduler.h>

#include <exception>
#include <new>
#include <utility>

#include "elastic/index/field_analyzer.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;
using Lucene::StringUtils;

// Changes are kept in memory up to this size before they go to a segment of their own.
constexpr double kBufferMegabytes = 64;

}  // namespace

// Merges on the caller's thread, as the library's background merges report failures to nobody; or not for now.
class DeferrableMerges : public Lucene::SerialMergeScheduler {
 public:
  void set_deferred(bool deferred) { deferred_ = deferred; }

  void merge(const Lucene::IndexWriterPtr& writer) override {
    if (!deferred_) SerialMergeScheduler::merge(writer);
  }

 private:
  bool deferred_ = false;
};

LibraryWriter::LibraryWriter(std::string folder, const WriteLock& /*lock*/, const IndexSettings& settings,
                             Start start, std::shared_ptr<LibraryGuard> guard)
    : folder_(std::move(folder)), guard_(std::move(guard)), manifest_(folder_) {
  Run("cannot open the index for writing", [&] { Open(settings, start); });
  if (start == Start::kEmptyIndex) UpdateManifest();
}

LibraryWriter::~LibraryWriter() { RollBack(); }

void LibraryWriter::Open(const IndexSettings& settings, Start start) {
  directory_ = newLucene<DiskDirectory>(folder_, guard_);
  writer_ =
      newLucene<Lucene::IndexWriter>(directory_, NewFieldAnalyzer(settings), start == Start::kEmptyIndex,
                                     Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
  const auto policy = newLucene<Lucene::LogByteSizeMergePolicy>(writer_);
  policy->setUseCompoundFile(settings.compound_files);
  policy->setUseCompoundDocStore(settings.compound_files);
  policy->setNoCFSRatio(1.0);  // also for segments that make up most of the index
  writer_->setMergePolicy(policy);
  merges_ = newLucene<DeferrableMerges>();
  writer_->setMergeScheduler(merges_);
  writer_->setRAMBufferSizeMB(kBufferMegabytes);
}

void LibraryWriter::Add(const Lucene::DocumentPtr& document) {
  Run("cannot add a document", [&] { writer_->addDocument(document); });
}

void LibraryWriter::Update(const Lucene::TermPtr& term, const Lucene::DocumentPtr& document) {
  Run("cannot replace a document", [&] { writer_->updateDocument(term, document); });
}

void LibraryWriter::Delete(const Lucene::TermPtr& term) {
  Run("cannot delete documents", [&] { writer_->deleteDocuments(term); });
}

void LibraryWriter::Optimize() {
  Run("cannot optimize", [&] { writer_->optimize(); });
}

void LibraryWriter::Commit() {
  merges_->set_deferred(true);
  Run("cannot commit", [&] { writer_->commit(); });
  merges_->set_deferred(false);
  UpdateManifest();
}

void LibraryWriter::MergeSegments() {
  Run("cannot merge segments", [&] {
    writer_->maybeMerge();
    writer_->commit();
  });
  UpdateManifest();
}

void LibraryWriter::UpdateManifest() {
  if (!manifest_.Update()) return;
  try {
    guard_->Take(*manifest_.manifest());
  } catch (const std::bad_alloc&) {
    // What was written here stays known without digests.
  }
}

void LibraryWriter::Run(const char* purpose, const std::function<void()>& operation) {
  std::string reason;
  try {
    operation();
    if (!directory_->failure().has_value()) return;
  } catch (const Lucene::LuceneException& error) {
    reason = StringUtils::toUTF8(error.getError());
    RollBack();
    if (error.getType() == Lucene::LuceneException::OutOfMemory) throw std::bad_alloc();
  } catch (const std::bad_alloc&) {
    writer_.reset();
    throw;
  } catch (const std::exception& error) {
    // The library tidies up after its own exceptions only: a roll-back might now wait for ever.
    reason = error.what();
    writer_.reset();
  }
  if (directory_ && directory_->failure().has_value()) throw IndexIoError(*directory_->failure());
  if (directory_) directory_->ThrowFailure(purpose, reason);
  throw IndexError(folder_, std::string(purpose) + ": " + reason);
}

void LibraryWriter::RollBack() {
  if (!writer_) return;
  try {
    writer_->rollback();
  } catch (...) {
    // Whatever it leaves behind no commit refers to; the next writer removes it.
  }
  writer_.reset();
}

}  // namespace vantrel::elastic
