#include "inspect/term_dump.h"

#include <lucene++/LuceneHeaders.h>

#include <cstdint>
#include <iostream>
#include <memory>

#include "option_set.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index_info.h"

namespace {

using Lucene::StringUtils;
using vantrel::elastic::IndexInfo;
using vantrel::elastic::TermDict;

// A field's name in UTF-8. Terms come field by field, so that few names need converting.
class FieldName {
 public:
  const std::string& ToUtf8(const Lucene::String& name) {
    if (name != wide_ || utf8_.empty()) {
      wide_ = name;
      utf8_ = StringUtils::toUTF8(name);
    }
    return utf8_;
  }

 private:
  Lucene::String wide_;
  std::string utf8_;
};

void ListTerms(TermDict& dictionary) {
  FieldName field_name;
  std::string line;
  int32_t listed = 0;
  while (dictionary.Next()) {
    if (listed >= OptionSet::max) break;  // one past the last listed, as it has always been
    const Lucene::TermPtr term = dictionary.Term();
    if (!term) continue;
    const std::string& field = field_name.ToUtf8(term->_field);
    if (!OptionSet::field.empty() && field != OptionSet::field) continue;
    // One insertion a line: what goes out is the same, and a long listing takes half the time.
    line.assign("field: ").append(field).append(" text: ").append(StringUtils::toUTF8(term->_text));
    std::cout << line << std::endl;
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
