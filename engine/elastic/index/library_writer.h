#pragma once

#include <lucene++/LuceneHeaders.h>

#include <functional>
#include <memory>
#include <string>

#include "elastic/index/disk_directory.h"
#include "elastic/index/library_guard.h"
#include "elastic/index/manifest_keeper.h"
#include "vantrel/elastic/index_settings.h"
#include "vantrel/elastic/write_lock.h"

namespace vantrel::elastic {

class DeferrableMerges;

// The index library's writer, in two steps from changes to a commit, with its failures turned into ours. Once
// an operation has thrown, the writer is of no more use: every change since the last commit is lost. What is
// not committed is dropped on destruction. For one thread at a time.
class LibraryWriter {
 public:
  enum class Start { kEmptyIndex, kExistingIndex };

  // `lock` stands on `folder` as long as the writer lives. With kEmptyIndex, an empty commit is made at once. Every
  // commit is given a manifest, if the system lets it have one. What an existing index holds is read through `guard`,
  // which is told of what is written.
  // Throws IndexError.
  LibraryWriter(std::string folder, const WriteLock& lock, const IndexSettings& settings, Start start,
                std::shared_ptr<LibraryGuard> guard);
  LibraryWriter(const LibraryWriter&) = delete;
  LibraryWriter& operator=(const LibraryWriter&) = delete;
  ~LibraryWriter();

  void Add(const Lucene::DocumentPtr& document);
  void Update(const Lucene::TermPtr& term, const Lucene::DocumentPtr& document);
  void Delete(const Lucene::TermPtr& term);
  void Optimize();

  // Leaves the merges that are due to MergeSegments(), so that no failure of theirs undoes what is committed.
  void Commit();

  // Does the merges that are due, and commits them. To be called when nothing else waits for a commit.
  void MergeSegments();

 private:
  // Runs an operation of the library; `purpose` says what cannot be done where it fails.
  void Run(const char* purpose, const std::function<void()>& operation);
  void Open(const IndexSettings& settings, Start start);
  void UpdateManifest();
  void RollBack();

  std::string folder_;
  std::shared_ptr<LibraryGuard> guard_;
  boost::shared_ptr<DiskDirectory> directory_;
  boost::shared_ptr<DeferrableMerges> merges_;
  Lucene::IndexWriterPtr writer_;
  ManifestKeeper manifest_;
};

}  // namespace vantrel::elastic
