#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "vantrel/elastic/document.h"
#include "vantrel/elastic/export.h"
#include "vantrel/elastic/index_settings.h"
#include "vantrel/elastic/search.h"

namespace vantrel::elastic {

class Snapshot;

// Documents that searches find, and those that they no longer do.
struct DocumentCounts {
  uint64_t live = 0;
  uint64_t deleted = 0;  // still taking space until their segments are merged
};

// An index as of its newest commit.
struct IndexStatistics {
  DocumentCounts documents;
  uint64_t segments = 0;
  uint64_t bytes = 0;  // on disk, of every file in the folder, also those not yet committed or just replaced
  int64_t generation = 0;  // of the commit; grows with each
};

// A word of a text as it is indexed.
struct AnalyzedToken {
  std::string text;
  uint64_t position = 0;  // among the words of the value, from 0; phrases go by it
  uint64_t start = 0;     // where it stands in the value, in characters (code points)
  uint64_t end = 0;       // behind its last character
};

// An index in a folder of its own: the files of the index library and, beside them, the settings.
//
// Writing works in rounds: what Add, Delete and Optimize do is kept back, in memory and in files that no
// reader looks at, until Commit makes all of it visible and durable at once. What is not committed when the
// object goes is dropped.
//
// The first change takes the index's write lock and keeps it as long as the object lives; there is one writer
// at a time, over all processes. An Index that changes nothing leaves the folder alone.
//
// Searches see the newest commit, whoever made it. A search keeps to the commit it began with; the files of
// that are let go with the last search that is at them.
//
// Any number of threads may use an Index at once. Changes are made one after another: a thread that changes
// something waits for those before it, an Optimize or a Commit included. Searches do not wait for changes.
//
// Errors are IndexError (index_error.h), and in searches also SearchError (search_error.h):
//   IndexValueError   the argument cannot be taken; nothing happened, everything else still holds
//   IndexLockedError  somebody else is writing
//   IndexChangesLostError  of Commit: an earlier failure lost changes; those made since then still hold
//   any other         disk, memory or files failed; where a change was under way, every change since the last
//                     commit is lost, and the next one starts anew from that commit
//
// What is damaged when it is first read does not reach the index library, which could crash on it. Files that the
// commit's manifest knows are compared with it, each block of 1 MiB when it is first read; what differs is an error
// that names the file, and whatever does not read that block goes on. A commit without a manifest is checked as a whole
// when it is first searched or written to (CheckIndexHealth, about a second for each GB), which searches wait for, and
// refused where it is unsafe; for a minute at least it is then not checked again.
class VANTREL_ELASTIC_EXPORT Index {
 public:
  // Makes an empty index in the folder `path`, taken byte for byte, which is created where it is missing; its
  // parent must exist. The result holds the write lock. Throws also IndexExistsError. Where this fails, the
  // folder may stay behind; nothing in it hinders another attempt.
  static std::shared_ptr<Index> Create(const std::string& path, const IndexSettings& settings);

  // Opens the index in a folder. Nothing is created, locked or changed.
  static std::shared_ptr<Index> Open(const std::string& path);

  // The same, but the folder is not looked at before something is first asked of the index; what Open would throw
  // is thrown by each such operation until one succeeds. Only path() needs nothing.
  static std::shared_ptr<Index> OpenLater(const std::string& path);

  Index(const Index&) = delete;
  Index& operator=(const Index&) = delete;
  ~Index();

  // What the index was opened or made with; valid for as long as it is.
  const std::string& path() const;
  const IndexSettings& settings() const;

  // Adds a document, wholly or not at all. Refused are: a field without settings, a value that is not valid
  // UTF-8 or holds a character that the files cannot keep (U+FFFE, U+FFFF, U+1FFFF; in a text also U+0000), a
  // keyword or a word of a text above 16383 characters, and values of more than 256 MiB in all. The document
  // need not have an id, and nothing is done about others of the same one: that is what Update is for.
  void Add(const Document& document);

  // Puts the document in the place of every other of the same id, wholly or not at all; where there is none,
  // it is just added. Refused is what Add refuses, and a document that has not exactly one id.
  void Update(const Document& document);

  // Deletes the documents of this id, also of this round.
  void DeleteById(std::string_view id);

  // Deletes every document, also of this round, that holds exactly this term: a keyword's value, or one word
  // of a text in the form it is indexed in.
  void Delete(std::string_view field, std::string_view value);

  // Merges all segments into one and leaves the deleted documents out. Takes long, and for a while twice the
  // disk space, up to the next commit.
  void Optimize();

  // Whether a commit may go on to merge segments.
  enum class Merging { kAllowed, kNone };

  // Makes every change durable and visible: once this has returned, a crash or a loss of power does not undo
  // it. Then merges segments where that is due and `merging` allows it, which may take long; what fails of that, or
  // is not allowed, is left to a later commit, and told nobody.
  // Without changes it does nothing. Where an earlier failure has lost changes, it commits nothing and throws
  // IndexChangesLostError once; what was changed since then is committed by the next call.
  void Commit(Merging merging = Merging::kAllowed);

  // The documents of the newest commit, whoever made it.
  DocumentCounts CountDocuments() const;

  // The newest commit, whoever made it, and what the folder takes on disk. Throws IndexError.
  IndexStatistics Statistics() const;

  // What becomes of a value of a field: the terms that are indexed. A keyword is one. Throws IndexValueError for
  // what Add refuses, and where the terms may have more than 4 Mi characters in all.
  std::vector<AnalyzedToken> Analyze(std::string_view field, std::string_view value) const;

  // Searches this index alone; see SearchIndexes.
  SearchResult Search(const SearchRequest& request,
                      const SearchPluginRegistry& plugins = SearchPluginRegistry::BuiltIn(),
                      const SearchLimits& limits = SearchLimits()) const;

 private:
  class Impl;
  friend SearchResult SearchIndexes(const std::vector<std::shared_ptr<Index>>&, const SearchRequest&,
                                    const SearchPluginRegistry&, const SearchLimits&);

  explicit Index(std::unique_ptr<Impl> impl);

  std::shared_ptr<const Snapshot> NewestSnapshot() const;

  std::unique_ptr<Impl> impl_;
};

}  // namespace vantrel::elastic
