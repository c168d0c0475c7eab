// Writes an index of one segment with a given number of different terms, by the index library alone.

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

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: make_terms FOLDER COUNT\n";
    return 2;
  }
  const int count = std::atoi(argv[2]);
  const auto writer = newLucene<Lucene::IndexWriter>(
      Lucene::FSDirectory::open(StringUtils::toUnicode(argv[1])), newLucene<Lucene::WhitespaceAnalyzer>(),
      true, Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
  writer->setUseCompoundFile(false);
  writer->setRAMBufferSizeMB(512);
  for (int first = 0; first < count; first += kTermsPerDocument) {
    writer->addDocument(MakeDocument(first, std::min(first + kTermsPerDocument, count)));
  }
  writer->close();
  return 0;
}
