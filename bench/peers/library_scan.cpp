// Walks every term of an index by the index library's own enumerator and counts those of a field that begin with a
// prefix: the least that a search for completions takes without anything but that library.

#include <lucene++/LuceneHeaders.h>

#include <iostream>

int main(int argc, char** argv) {
  if (argc != 4) {
    std::cerr << "usage: peer_library_scan FOLDER FIELD PREFIX\n";
    return 2;
  }
  using Lucene::StringUtils;
  const Lucene::String field = StringUtils::toUnicode(argv[2]);
  const Lucene::String prefix = StringUtils::toUnicode(argv[3]);
  const auto reader =
      Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(argv[1])), true);
  int64_t count = 0;
  int64_t documents = 0;
  for (const Lucene::IndexReaderPtr& segment : reader->getSequentialSubReaders()) {
    const Lucene::TermEnumPtr terms = segment->terms();
    while (terms->next()) {
      const Lucene::TermPtr term = terms->term();
      if (term->field() != field || term->text().compare(0, prefix.size(), prefix) != 0) continue;
      ++count;
      documents += terms->docFreq();
    }
  }
  std::cout << count << " terms in " << documents << " documents\n";
  return 0;
}
