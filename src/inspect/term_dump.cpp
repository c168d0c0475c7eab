#include "inspect/term_dump.h"

#include <lucene++/LuceneHeaders.h>

#include <cstdint>
#include <iostream>
#include <memory>

#include "inspect/utf8_text.h"
#include "option_set.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index_info.h"

namespace {

using vantrel::elastic::IndexInfo;
using vantrel::elastic::TermDict;

void ListTerms(TermDict& dictionary) {
  std::string field;
  std::string line;
  int32_t listed = 0;
  while (dictionary.Next()) {
    if (listed >= OptionSet::max) break;  // the cursor is one past the last listed then
    const Lucene::TermPtr term = dictionary.Term();
    if (!term) continue;
    field.clear();
    AppendUtf8(term->_field, field);
    if (!OptionSet::field.empty() && field != OptionSet::field) continue;
    line.assign("field: ").append(field).append(" text: ");
    AppendUtf8(term->_text, line);
    // One insertion, newline included: each costs, and a dictionary has millions of lines.
    std::cout << line.append("\n") << std::flush;
    ++listed;
  }
}

// 32-bit addition that wraps.
int32_t AddWrapping(int32_t left, int32_t right) {
  return static_cast<int32_t>(static_cast<uint32_t>(left) + static_cast<uint32_t>(right));
}

}  // namespace

void DumpTermDict(const std::string& index_path, bool live_only) {
  const auto index = vantrel::newClassInit<IndexInfo>(index_path);
  int32_t total = 0;
  for (int32_t segment = 0; segment < index->GetSegmentNum(); ++segment) {
    const std::shared_ptr<TermDict> dictionary = index->GetTermDict(segment, live_only);
    std::cout << "segment: " << dictionary->GetName() << ", terms count: " << dictionary->GetTermsCount()
              << std::endl;
    if (OptionSet::info) ListTerms(*dictionary);
    total = AddWrapping(total, dictionary->GetTermsCount());
  }
  std::cout << "total terms: " << total << std::endl;
  std::cout << "suggest divisor:" << index->GetSuggestDivisor() << std::endl;
}
