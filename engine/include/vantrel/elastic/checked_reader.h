#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/library_types.h"

namespace vantrel::elastic {

// A reader of the index library on the newest commit of an index, for one lookup. The library takes its files on
// trust; so all that it is going to read is checked first: while it opens the index, and before the lookup. It takes
// about as long as the library's own reading, whatever else is in the index.
//
// What the library could crash on, run astray on or take gigabytes for, and what contradicts itself on the way there,
// is thrown as Lucene::CorruptIndexException, with the file and the offset; what the library finds out itself it says
// in its own words. Nothing in the folder is created, locked or changed, and a writer may go on beside it. For one
// thread at a time.
class VANTREL_ELASTIC_EXPORT CheckedReader {
 public:
  // For positions of a term. `path` is used byte for byte. Throws what the library throws.
  CheckedReader(const std::string& path, const Lucene::TermPtr& term);
  // For term vectors.
  explicit CheckedReader(const std::string& path);
  CheckedReader(const CheckedReader&) = delete;
  CheckedReader& operator=(const CheckedReader&) = delete;
  ~CheckedReader();

  // The library's own, whose lookups are not checked but for those below.
  const Lucene::IndexReaderPtr& reader() const { return reader_; }

  // The positions of the term, to be moved with skipTo(document) at once and read for the document reached, but no
  // further. `document` is 0 or more. A reader that was opened for term vectors has no term: it throws
  // Lucene::IllegalStateException.
  Lucene::TermPositionsPtr Positions(int32_t document) const;

  // The term vector of a document's field; empty where there is none, and for a document below 0 or of an index
  // without any.
  Lucene::TermFreqVectorPtr TermVector(int32_t document, const Lucene::String& field) const;

 private:
  struct Opened;

  void Open(const std::string& path);

  Lucene::TermPtr term_;
  std::unique_ptr<Opened> opened_;
  Lucene::IndexReaderPtr reader_;
};

}  // namespace vantrel::elastic
