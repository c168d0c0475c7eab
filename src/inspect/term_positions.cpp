#include "inspect/term_positions.h"

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/TermPositions.h>

#include <algorithm>
#include <iostream>

#include "error/report_lucene_errors.h"
#include "inspect/index_reader.h"

namespace {

using Lucene::StringUtils;

void PrintPositions(const std::string& index_path, const std::string& field, const std::string& token,
                    int32_t document) {
  const auto term =
      Lucene::newLucene<Lucene::Term>(StringUtils::toUnicode(field), StringUtils::toUnicode(token));
  const Lucene::IndexReaderPtr reader = OpenIndexReader(index_path);
  if (!reader) {
    std::cout << "No reader!!" << std::endl;
    return;
  }
  const Lucene::TermPositionsPtr positions = reader->termPositions(term);
  if (!positions) {
    std::cout << "No position found!!" << std::endl;
    return;
  }
  // No document is below 0, and the library subtracts from the number that it is given.
  if (!positions->skipTo(std::max(document, 0))) {
    std::cout << "No entry!!" << std::endl;
    return;
  }
  const int32_t reached = positions->doc();
  const int32_t frequency = positions->freq();
  for (int32_t i = 0; i < frequency; ++i) std::cout << "pos: " << positions->nextPosition() << std::endl;
  std::cout << "doc: " << reached << " freq: " << frequency << std::endl;
}

}  // namespace

void ShowTermPositions(const std::string& index_path, const std::string& field, const std::string& token,
                       int32_t document) {
  if (field.empty() || token.empty()) {
    std::cout << "Bad Parameter" << std::endl;
    return;
  }
  ReportLuceneErrors([&] { PrintPositions(index_path, field, token, document); });
}
