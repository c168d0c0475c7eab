#include "inspect/document_terms.h"

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/TermFreqVector.h>

#include <iostream>

#include "error/report_lucene_errors.h"
#include "inspect/index_reader.h"

namespace {

using Lucene::StringUtils;

// The index library reads outside its tables for a negative document number and for any document of an index
// without segments: neither has a vector.
Lucene::TermFreqVectorPtr FindTermVector(const Lucene::IndexReaderPtr& reader, int32_t document,
                                         const std::string& field) {
  if (document < 0 || reader->maxDoc() == 0) return {};
  return reader->getTermFreqVector(document, StringUtils::toUnicode(field));
}

void PrintTerms(const std::string& index_path, const std::string& field, int32_t document) {
  const Lucene::IndexReaderPtr reader = OpenIndexReader(index_path);
  if (!reader) {
    std::cout << "No reader!!" << std::endl;
    return;
  }
  const Lucene::TermFreqVectorPtr vector = FindTermVector(reader, document, field);
  if (!vector) {
    std::cout << "Failed to get term vector" << std::endl;
    return;
  }
  for (const Lucene::String& term : vector->getTerms()) {
    std::cout << field << ": " << StringUtils::toUTF8(term) << std::endl;
  }
}

}  // namespace

void ShowDocTerms(const std::string& index_path, const std::string& field, int32_t document) {
  if (index_path.empty() || field.empty()) {
    // A warning, not a stop: the lookup shows what comes of it.
    std::cout << "Bad parameter, must give db path and field name (use -d and -n)" << std::endl;
  }
  ReportLuceneErrors([&] { PrintTerms(index_path, field, document); });
}
