#include "support/library_terms.h"

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/SegmentReader.h>

namespace quorelastic::testing {
namespace {

using Lucene::StringUtils;

LibrarySegment ReadSegment(const Lucene::SegmentReaderPtr& reader) {
  LibrarySegment segment;
  segment.name = StringUtils::toUTF8(reader->getSegmentName());
  const Lucene::TermEnumPtr terms = reader->terms();
  while (terms->next()) {
    const Lucene::TermPtr term = terms->term();
    segment.all.push_back({term->field(), term->text()});
    if (reader->termDocs(term)->next()) segment.live.push_back(segment.all.back());
  }
  return segment;
}

}  // namespace

std::vector<LibrarySegment> ReadLibraryTerms(const std::string& index_path) {
  const auto directory = Lucene::FSDirectory::open(StringUtils::toUnicode(index_path));
  const Lucene::IndexReaderPtr reader = Lucene::IndexReader::open(directory, true);
  std::vector<LibrarySegment> segments;
  for (const Lucene::IndexReaderPtr& part : reader->getSequentialSubReaders()) {
    segments.push_back(ReadSegment(boost::dynamic_pointer_cast<Lucene::SegmentReader>(part)));
  }
  reader->close();
  return segments;
}

}  // namespace quorelastic::testing
