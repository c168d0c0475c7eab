// What "position" and "doc_term" print, by the index library alone and without any check.

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/TermFreqVector.h>
#include <lucene++/TermPositions.h>

#include <cstdlib>
#include <iostream>
#include <string>

#include "vantrel/elastic/library_setup.h"

namespace {

using Lucene::IndexReaderPtr;
using Lucene::StringUtils;

void PrintPositions(const IndexReaderPtr& reader, const char* field, const char* text, int32_t document) {
  const auto positions = reader->termPositions(
      Lucene::newLucene<Lucene::Term>(StringUtils::toUnicode(field), StringUtils::toUnicode(text)));
  if (!positions->skipTo(document)) {
    std::cout << "No entry!!" << std::endl;
    return;
  }
  const int32_t frequency = positions->freq();
  for (int32_t i = 0; i < frequency; ++i) std::cout << "pos: " << positions->nextPosition() << std::endl;
  std::cout << "doc: " << positions->doc() << " freq: " << frequency << std::endl;
}

void PrintVector(const IndexReaderPtr& reader, const char* field, int32_t document) {
  const auto vector = reader->getTermFreqVector(document, StringUtils::toUnicode(field));
  for (const Lucene::String& term : vector->getTerms()) {
    std::cout << field << ": " << StringUtils::toUTF8(term) << std::endl;
  }
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 4 && argc != 5) {
    std::cerr << "usage: peer_library_lookup FOLDER DOCUMENT FIELD [TERM]\n";
    return 2;
  }
  vantrel::elastic::PrepareIndexLibrary();
  const auto reader =
      Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(argv[1])), true);
  // The tool asks so, too.
  if (!reader->isCurrent()) return 1;
  const auto document = static_cast<int32_t>(std::strtol(argv[2], nullptr, 10));
  if (argc == 5) {
    PrintPositions(reader, argv[3], argv[4], document);
  } else {
    PrintVector(reader, argv[3], document);
  }
  return 0;
}
