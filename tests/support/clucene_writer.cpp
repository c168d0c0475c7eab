// Writes an index with CLucene, in the layout of its time: commits of format -4 without a checksum, field infos
// without a format number, dictionaries of format -2 whose text is counted in characters. A program of its own,
// since that library and the one that the engine uses cannot be seen by one compiler run.
//
//   clucene_writer FOLDER plain|compound DOCUMENTS DELETIONS

#include <CLucene.h>

#include <cstdlib>
#include <cstring>
#include <iostream>
#include <memory>
#include <string>

namespace {

using lucene::document::Document;
using lucene::document::Field;

constexpr int kStored = Field::STORE_YES;
constexpr int kText = kStored | Field::INDEX_TOKENIZED;
constexpr int kKeyword = kStored | Field::INDEX_UNTOKENIZED;
constexpr int kBareText = Field::INDEX_TOKENIZED | int{Field::INDEX_NONORMS};

// Repeats itself every 7, 11 and 13 documents, so that frequent and rare terms come up.
std::wstring BodyOf(int number) {
  const wchar_t* const words[] = {L"plain",
                                  L"gr\u00fc\u00dfe",
                                  L"\u03bb\u03cc\u03b3\u03bf\u03c2",
                                  L"\u0436\u0443\u043a",
                                  L"\u4e2d\u6587",
                                  L"\uffee",
                                  L"zz"};
  std::wstring body = words[number % 7];
  body += L" every ";
  body += words[number % 5];
  body += L"-" + std::to_wstring(number % 11) + L" common" + std::to_wstring(number % 13);
  return body;
}

void AddDocument(lucene::index::IndexWriter& writer, int number) {
  Document document;
  document.add(*new Field(L"id", std::to_wstring(number).c_str(), kKeyword));
  document.add(*new Field(L"body", BodyOf(number).c_str(), kText | Field::TERMVECTOR_YES));
  document.add(*new Field(L"k\u00f6rper", BodyOf(number * 3).c_str(), kText));
  document.add(*new Field(L"\u4e2d", L"\u4e2d \u6587", Field::STORE_NO | kBareText));
  writer.addDocument(&document);
}

void Write(const char* folder, bool compound, int documents) {
  lucene::analysis::WhitespaceAnalyzer analyzer;
  lucene::index::IndexWriter writer(folder, &analyzer, true);
  writer.setUseCompoundFile(compound);
  writer.setMaxBufferedDocs(100);
  writer.setMergeFactor(1000);
  for (int number = 0; number < documents; ++number) AddDocument(writer, number);
  writer.close();
}

void DeleteDocument(lucene::index::IndexReader& reader, int number) {
  auto* term = new lucene::index::Term(L"id", std::to_wstring(number).c_str());
  reader.deleteDocuments(term);
  _CLDECDELETE(term);
}

void Delete(const char* folder, int documents, int deletions) {
  lucene::index::IndexReader* reader = lucene::index::IndexReader::open(folder);
  for (int i = 0; i < deletions; ++i) DeleteDocument(*reader, i * 7 % documents);
  reader->close();
  _CLDELETE(reader);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "clucene_writer FOLDER plain|compound DOCUMENTS DELETIONS\n";
    return 2;
  }
  const int documents = std::atoi(argv[3]);
  const int deletions = std::atoi(argv[4]);
  try {
    Write(argv[1], std::strcmp(argv[2], "compound") == 0, documents);
    if (deletions > 0) Delete(argv[1], documents, deletions);
  } catch (CLuceneError& error) {
    std::cerr << error.what() << "\n";
    return 1;
  }
  _lucene_shutdown();
  return 0;
}
