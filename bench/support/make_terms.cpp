// Writes an index with a given number of different terms, by the index library alone: of one segment, or of several
// of which each shares half of its terms with the next, and one document in ten is deleted.

#include <lucene++/LuceneHeaders.h>

#include <cstdlib>
#include <iostream>
#include <string>

namespace {

using Lucene::newLucene;
using Lucene::String;
using Lucene::StringUtils;

constexpr int kTermsPerDocument = 100;

// Words of uneven length that share beginnings, as words do.
String Word(int number) {
  return L"t" + StringUtils::toString(static_cast<int64_t>(number) * 7919 % 10000019, 36);
}

Lucene::DocumentPtr MakeDocument(int first, int last) {
  String text;
  for (int i = first; i < last; ++i) text += Word(i) + L" ";
  const auto document = newLucene<Lucene::Document>();
  document->add(newLucene<Lucene::Field>(L"body", text, Lucene::AbstractField::STORE_NO,
                                         Lucene::AbstractField::INDEX_ANALYZED));
  return document;
}

void AddTerms(const Lucene::IndexWriterPtr& writer, int first, int last) {
  for (; first < last; first += kTermsPerDocument) {
    writer->addDocument(MakeDocument(first, std::min(first + kTermsPerDocument, last)));
  }
}

void DeleteOneInTen(const Lucene::FSDirectoryPtr& folder) {
  const auto reader = Lucene::IndexReader::open(folder, false);
  for (int32_t document = 0; document < reader->maxDoc(); document += 10) reader->deleteDocument(document);
  reader->close();
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3 && argc != 4) {
    std::cerr << "usage: make_terms FOLDER COUNT [SEGMENTS]\n";
    return 2;
  }
  const int count = std::atoi(argv[2]);
  const int segments = argc == 4 ? std::atoi(argv[3]) : 1;
  const auto folder = Lucene::FSDirectory::open(StringUtils::toUnicode(argv[1]));
  const auto writer = newLucene<Lucene::IndexWriter>(folder, newLucene<Lucene::WhitespaceAnalyzer>(), true,
                                                     Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
  writer->setUseCompoundFile(false);
  writer->setRAMBufferSizeMB(512);
  if (segments == 1) {
    AddTerms(writer, 0, count);
  } else {
    writer->setMergeFactor(1000);
    const int step = count / (segments + 1);
    for (int segment = 0; segment < segments; ++segment) {
      AddTerms(writer, segment * step, (segment + 2) * step);
      writer->commit();
    }
  }
  writer->close();
  if (segments > 1) DeleteOneInTen(folder);
  return 0;
}
