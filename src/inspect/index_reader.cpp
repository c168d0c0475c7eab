#include "inspect/index_reader.h"

#include <lucene++/LuceneHeaders.h>

#include "vantrel/elastic/library_setup.h"

Lucene::IndexReaderPtr OpenIndexReader(const std::string& path) {
  vantrel::elastic::PrepareIndexLibrary();
  constexpr bool kReadOnly = true;
  constexpr int32_t kTermInfosIndexDivisor = 1;
  return Lucene::IndexReader::open(Lucene::FSDirectory::open(Lucene::StringUtils::toUnicode(path)),
                                   Lucene::IndexDeletionPolicyPtr(), kReadOnly, kTermInfosIndexDivisor);
}
