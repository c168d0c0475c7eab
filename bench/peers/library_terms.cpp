// Prints what "allterm --info" prints of an index's terms by the index library's own enumerator.

#include <lucene++/LuceneHeaders.h>

#include <iostream>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_library_terms FOLDER\n";
    return 2;
  }
  using Lucene::StringUtils;
  const auto reader =
      Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(argv[1])), true);
  for (const Lucene::IndexReaderPtr& segment : reader->getSequentialSubReaders()) {
    const Lucene::TermEnumPtr terms = segment->terms();
    while (terms->next()) {
      const Lucene::TermPtr term = terms->term();
      std::cout << "field: " << StringUtils::toUTF8(term->field())
                << " text: " << StringUtils::toUTF8(term->text()) << std::endl;
    }
  }
  return 0;
}
