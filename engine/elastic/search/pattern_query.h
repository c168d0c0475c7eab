#pragma once

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/FilteredTermEnum.h>

#include <string>
#include <string_view>

namespace vantrel::elastic {

// Whether a text is what a pattern stands for: * for any run of characters, ? for any one. Takes at most as
// many steps as the product of the two lengths.
bool MatchesPattern(std::wstring_view pattern, std::wstring_view text);

// The index library's wildcard query with a matching of our own: the library's tries every way of dividing a
// term between the asterisks, which with some of them, and a long term, takes for ever.
class PatternQuery : public Lucene::WildcardQuery {
 public:
  explicit PatternQuery(const Lucene::TermPtr& pattern);

  Lucene::LuceneObjectPtr clone(const Lucene::LuceneObjectPtr& other = Lucene::LuceneObjectPtr()) override;

 protected:
  Lucene::FilteredTermEnumPtr getEnum(const Lucene::IndexReaderPtr& reader) override;
};

}  // namespace vantrel::elastic
