#include "inspect/index_reader.h"

#include <lucene++/LuceneHeaders.h>

#include "vantrel/elastic/library_setup.h"

Lucene::IndexReaderPtr OpenIndexReader(const std::string& path) {
  vantrel::elastic::PrepareIndexLibrary();
  constexpr bool kReadOnly = true;
  constexpr int32_t kTermInfosIndexDivisor = 1;
  const Lucene::DirectoryPtr directory = Lucene::FSDirectory::open(Lucene::StringUtils::toUnicode(path));
  // A writer may drop a commit while it is being opened, and the library passes over a term vector file that
  // is gone. What is still the newest commit once it is open was opened whole.
  constexpr int kAttempts = 20;
  for (int attempt = 1;; ++attempt) {
    const Lucene::IndexReaderPtr reader = Lucene::IndexReader::open(
        directory, Lucene::IndexDeletionPolicyPtr(), kReadOnly, kTermInfosIndexDivisor);
    if (attempt == kAttempts || reader->isCurrent()) return reader;
  }
}
