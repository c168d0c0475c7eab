#include "elastic/search/pattern_query.h"

#include <utility>

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;

class PatternTerms : public Lucene::FilteredTermEnum {
 public:
  PatternTerms(Lucene::IndexReaderPtr reader, const Lucene::TermPtr& pattern)
      : reader_(std::move(reader)), field_(pattern->field()), pattern_(pattern->text()) {
    start_ = pattern_.substr(0, pattern_.find_first_of(L"*?"));
  }

  // Looks for the first term; not in the constructor, as that calls the operations below.
  void initialize() override { setEnum(reader_->terms(newLucene<Lucene::Term>(field_, start_))); }

  double difference() override { return 1.0; }

 protected:
  bool termCompare(const Lucene::TermPtr& term) override {
    const Lucene::String text = term->text();
    past_end_ = term->field() != field_ || !text.starts_with(start_);
    return !past_end_ && MatchesPattern(pattern_, text);
  }

  bool endEnum() override { return past_end_; }

 private:
  Lucene::IndexReaderPtr reader_;
  std::wstring field_;
  std::wstring pattern_;
  std::wstring start_;  // what every match begins with
  bool past_end_ = false;
};

}  // namespace

bool MatchesPattern(std::wstring_view pattern, std::wstring_view text) {
  constexpr size_t kNone = std::wstring_view::npos;
  size_t p = 0;
  size_t t = 0;
  size_t last_star = kNone;
  size_t star_end = 0;  // where the run ends that the last asterisk stands for
  while (t < text.size()) {
    if (p < pattern.size() && pattern[p] == L'*') {
      last_star = p++;
      star_end = t;
    } else if (p < pattern.size() && (pattern[p] == L'?' || pattern[p] == text[t])) {
      ++p;
      ++t;
    } else if (last_star != kNone) {
      // Only the last asterisk needs to be tried longer: what those before it took is enough.
      p = last_star + 1;
      t = ++star_end;
    } else {
      return false;
    }
  }
  return pattern.find_first_not_of(L'*', p) == kNone;
}

PatternQuery::PatternQuery(const Lucene::TermPtr& pattern) : WildcardQuery(pattern) {}

Lucene::LuceneObjectPtr PatternQuery::clone(const Lucene::LuceneObjectPtr& other) {
  return WildcardQuery::clone(other ? other : newLucene<PatternQuery>(term));
}

Lucene::FilteredTermEnumPtr PatternQuery::getEnum(const Lucene::IndexReaderPtr& reader) {
  return newLucene<PatternTerms>(reader, term);
}

}  // namespace vantrel::elastic
