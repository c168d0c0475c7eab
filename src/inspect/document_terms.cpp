#include "inspect/document_terms.h"

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/TermFreqVector.h>

#include <iostream>

#include "error/report_lucene_errors.h"
#include "vantrel/elastic/checked_reader.h"

namespace {

using Lucene::StringUtils;

void PrintTerms(const std::string& index_path, const std::string& field, int32_t document) {
  const vantrel::elastic::CheckedReader reader(index_path);
  if (!reader.reader()) {
    std::cout << "No reader!!" << std::endl;
    return;
  }
  const Lucene::TermFreqVectorPtr vector = reader.TermVector(document, StringUtils::toUnicode(field));
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
