#include "inspect/index_reader.h"

#include <lucene++/LuceneHeaders.h>

#include <exception>
#include <iostream>

#include "vantrel/elastic/library_setup.h"

Lucene::IndexReaderPtr OpenIndexReader(const std::string& path) {
  vantrel::elastic::PrepareIndexLibrary();
  constexpr bool kReadOnly = true;
  constexpr int32_t kTermInfosIndexDivisor = 1;
  return Lucene::IndexReader::open(Lucene::FSDirectory::open(Lucene::StringUtils::toUnicode(path)),
                                   Lucene::IndexDeletionPolicyPtr(), kReadOnly, kTermInfosIndexDivisor);
}

void ReportLuceneErrors(const std::function<void()>& body) {
  try {
    body();
  } catch (const Lucene::LuceneException& error) {
    std::wcout << L"LuceneException: " << error.getError() << std::endl;
  } catch (const std::exception& error) {
    std::cout << "Exception:" << error.what() << std::endl;
  }
}
