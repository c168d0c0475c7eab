#pragma once

#include <memory>
#include <string>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/library_types.h"

namespace vantrel::elastic {

class TermWalk;

// A cursor over the term dictionary of one segment, in the dictionary's own order. Obtained from IndexInfo,
// which it may outlive. It reads from disk as it goes and keeps a constant amount of memory. For one thread
// at a time. Every operation may throw IndexError where the files turn out damaged or unreadable.
class VANTREL_ELASTIC_EXPORT TermDict {
 public:
  explicit TermDict(std::unique_ptr<TermWalk> walk);
  TermDict(const TermDict&) = delete;
  TermDict& operator=(const TermDict&) = delete;
  ~TermDict();

  // The name of the segment, such as "_0".
  std::string GetName() const;

  // How many terms the cursor walks from first to last. Where only live terms are walked and the segment has
  // deleted documents, the first call reads the whole dictionary; otherwise the number stands in its header.
  int GetTermsCount() const;

  // Moves to the next term, at first to the first one; false when there is none.
  bool Next();

  // The term at the cursor; an empty pointer before the first Next() and after the last. It is the caller's to
  // keep: a term that is still held is not touched by later calls.
  Lucene::TermPtr Term() const;

 private:
  std::unique_ptr<TermWalk> walk_;
};

}  // namespace vantrel::elastic
