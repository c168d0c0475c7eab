#pragma once

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/SerialMergeScheduler.h>

#include <cstdint>
#include <functional>
#include <string>

#include "support/folder_size.h"

namespace quorelastic::bench {

// Writes an index by the index library alone, merged as its defaults have it, until its files take so many bytes;
// `make` makes the document of each number from 0.
inline void WriteSizedIndex(const std::string& folder, uint64_t bytes,
                            const std::function<Lucene::DocumentPtr(int number)>& make) {
  using Lucene::newLucene;
  const auto writer = newLucene<Lucene::IndexWriter>(
      Lucene::FSDirectory::open(Lucene::StringUtils::toUnicode(folder)),
      newLucene<Lucene::WhitespaceAnalyzer>(), true, Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
  writer->setMergeScheduler(newLucene<Lucene::SerialMergeScheduler>());
  writer->setUseCompoundFile(false);
  writer->setRAMBufferSizeMB(128);
  for (int number = 0; number % 10000 != 0 || FolderSize(folder) < bytes; ++number) {
    writer->addDocument(make(number));
  }
  writer->close();
}

}  // namespace quorelastic::bench
