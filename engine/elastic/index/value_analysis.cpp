#include "elastic/index/value_analysis.h"

#include "elastic/index/field_analyzer.h"

// Not without the index library's main header.
#include <lucene++/OffsetAttribute.h>
#include <lucene++/PositionIncrementAttribute.h>
#include <lucene++/TermAttribute.h>

#include <algorithm>

namespace vantrel::elastic {

using Lucene::newLucene;
using Lucene::StringUtils;

std::vector<AnalyzedToken> AnalyzeValue(const IndexSettings& settings, std::string_view field,
                                        const std::wstring& value) {
  const auto known = std::find_if(settings.fields.begin(), settings.fields.end(),
                                  [&](const FieldSettings& candidate) { return candidate.name == field; });
  if (known == settings.fields.end()) return {};
  if (!IsAnalyzed(*known)) return {{StringUtils::toUTF8(value), 0, 0, value.size()}};
  const Lucene::TokenStreamPtr words = NewFieldAnalyzer(settings)->tokenStream(
      StringUtils::toUnicode(known->name), newLucene<Lucene::StringReader>(value));
  const auto term = words->getAttribute<Lucene::TermAttribute>();
  const auto offsets = words->getAttribute<Lucene::OffsetAttribute>();
  const auto step = words->getAttribute<Lucene::PositionIncrementAttribute>();
  std::vector<AnalyzedToken> tokens;
  uint64_t next_position = 0;
  while (words->incrementToken()) {
    next_position += static_cast<uint64_t>(step->getPositionIncrement());
    tokens.push_back({StringUtils::toUTF8(term->term()), next_position - 1,
                      static_cast<uint64_t>(offsets->startOffset()),
                      static_cast<uint64_t>(offsets->endOffset())});
  }
  return tokens;
}

}  // namespace vantrel::elastic
