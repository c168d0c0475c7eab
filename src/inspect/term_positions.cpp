#include "inspect/term_positions.h"

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/TermPositions.h>

#include <algorithm>
#include <iostream>

#include "error/report_lucene_errors.h"
#include "vantrel/elastic/checked_reader.h"

namespace {

using Lucene::StringUtils;
using vantrel::elastic::CheckedReader;

void PrintPositions(const std::string& index_path, const std::string& field, const std::string& token,
                    int32_t document) {
  const auto term =
      Lucene::newLucene<Lucene::Term>(StringUtils::toUnicode(field), StringUtils::toUnicode(token));
  const CheckedReader reader(index_path, term);
  if (!reader.reader()) {
    std::cout << "No reader!!" << std::endl;
    return;
  }
  // No document is below 0, and the library subtracts from the number that it is given.
  document = std::max(document, 0);
  const Lucene::TermPositionsPtr positions = reader.Positions(document);
  if (!positions) {
    std::cout << "No position found!!" << std::endl;
    return;
  }
  if (!positions->skipTo(document)) {
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
