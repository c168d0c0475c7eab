#pragma once

#include <memory>
#include <string>
#include <vector>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/term_dict.h"

namespace vantrel::elastic {

namespace format {
struct SegmentFiles;
}

// Looks into the index in a folder: its segments and their term dictionaries, as of the newest commit when it
// was initialised. Nothing in the folder is created, locked or changed, and a writer may go on beside it: the
// files are held open. For one thread at a time. Created by vantrel::newClassInit<IndexInfo>(path).
class VANTREL_ELASTIC_EXPORT IndexInfo {
 public:
  // `path` is used byte for byte.
  explicit IndexInfo(const std::string& path);
  IndexInfo(const IndexInfo&) = delete;
  IndexInfo& operator=(const IndexInfo&) = delete;
  ~IndexInfo();

  // Reads the commit and opens the files; to be called once, before anything else. Throws IndexError: no such
  // folder, no index in it, a file missing, unreadable or damaged. A missing file that just live_only needs is
  // reported by GetTermDict.
  void initialize();

  // The number of segments, 0 or more.
  int GetSegmentNum() const;

  // A cursor before the first term of a segment, counted from 0. With `live_only` it walks just the terms
  // that at least one document holds that is not deleted: what a search can still find. Throws IndexError,
  // and std::out_of_range for a segment that does not exist.
  std::shared_ptr<TermDict> GetTermDict(int segment, bool live_only) const;

  // The term-index divisor for suggestions from index terms that are held in memory: the smallest power of two
  // that keeps those of all segments together under 64 MiB; 1 for an index without segments. What a loaded term
  // takes is estimated from the headers and sizes of the term-index files; none is walked. SuggestTerms() itself
  // holds none of them.
  int GetSuggestDivisor() const;

 private:
  std::string path_;
  std::vector<format::SegmentFiles> segments_;
};

}  // namespace vantrel::elastic
