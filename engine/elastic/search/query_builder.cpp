#include "elastic/search/query_builder.h"

// Not without the index library's main header.
#include <lucene++/CharFolder.h>
#include <lucene++/MultiPhraseQuery.h>

#include <algorithm>
#include <functional>
#include <map>
#include <utility>

#include "elastic/common/quoted.h"
#include "elastic/common/text.h"
#include "elastic/index/field_analyzer.h"
#include "elastic/index/index_text.h"
#include "elastic/preproc/lower_case.h"
#include "elastic/preproc/pre_proc_chain.h"
#include "elastic/search/pattern_query.h"
#include "elastic/search/query_scan.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;
using Lucene::QueryPtr;
using Lucene::String;
using Lucene::StringUtils;

const String kAnyField = L"*";
const String kNoField;  // of a clause that names none

// The library's parser, with each field's own way of making terms.
class FieldwiseParser : public Lucene::QueryParser {
 public:
  FieldwiseParser(const IndexSettings& settings, const SearchLimits& limits)
      : QueryParser(Lucene::LuceneVersion::LUCENE_30, kNoField, NewFieldAnalyzer(settings)), limits_(limits) {
    for (const FieldSettings& known : settings.fields) {
      fields_.emplace(StringUtils::toUnicode(known.name), &known);
    }
    for (const FieldType type : {FieldType::kText, FieldType::kKeyword}) {
      if (!default_fields_.empty()) break;
      for (const FieldSettings& known : settings.fields) {
        if (known.type == type) default_fields_.push_back(StringUtils::toUnicode(known.name));
      }
    }
  }

  std::vector<std::string> TakeWarnings() { return std::move(warnings_); }

 protected:
  using Lucene::QueryParser::getBooleanQuery;

  QueryPtr getFieldQuery(const String& name, const String& text) override {
    return getFieldQuery(name, text, 0);
  }

  QueryPtr getFieldQuery(const String& name, const String& text, int32_t slop) override {
    return ForFields(name, [&](const String& target, const FieldSettings& settings) -> QueryPtr {
      if (!IsAnalyzed(settings)) return Counted(newTermQuery(newLucene<Lucene::Term>(target, text)));
      CheckGrowth(text, settings);
      const QueryPtr query = QueryParser::getFieldQuery(target, text);
      if (slop > 0) CheckNearWords(query);
      if (const auto phrase = boost::dynamic_pointer_cast<Lucene::PhraseQuery>(query)) phrase->setSlop(slop);
      if (const auto phrase = boost::dynamic_pointer_cast<Lucene::MultiPhraseQuery>(query))
        phrase->setSlop(slop);
      if (!query) Warn("nothing of " + Quoted(StringUtils::toUTF8(text)) + " is left to search for");
      return Counted(WithPositions(target, query));
    });
  }

  QueryPtr getWildcardQuery(const String& name, const String& text) override {
    if (text == L"*" && (name == kNoField || name == kAnyField)) return Counted(newMatchAllDocsQuery());
    return ForFields(name, [&](const String& target, const FieldSettings& settings) -> QueryPtr {
      CountExpansion();
      const auto query = newLucene<PatternQuery>(newLucene<Lucene::Term>(target, Folded(text, settings)));
      query->setRewriteMethod(multiTermRewriteMethod);
      return query;
    });
  }

  QueryPtr getPrefixQuery(const String& name, const String& text) override {
    return ForFields(name, [&](const String& target, const FieldSettings& settings) {
      CountExpansion();
      return newPrefixQuery(newLucene<Lucene::Term>(target, Folded(text, settings)));
    });
  }

  QueryPtr getFuzzyQuery(const String& name, const String& text, double similarity) override {
    return ForFields(name, [&](const String& target, const FieldSettings& settings) {
      CountExpansion();
      return newFuzzyQuery(newLucene<Lucene::Term>(target, Folded(text, settings)), similarity,
                           fuzzyPrefixLength);
    });
  }

  QueryPtr getRangeQuery(const String& name, const String& from, const String& to, bool inclusive) override {
    return ForFields(name, [&](const String& target, const FieldSettings& settings) -> QueryPtr {
      CountExpansion();
      const auto query = newLucene<Lucene::TermRangeQuery>(target, Bound(from, settings), Bound(to, settings),
                                                           inclusive, inclusive);
      query->setRewriteMethod(multiTermRewriteMethod);
      return query;
    });
  }

 private:
  // What a clause means: the query for its field or, where it names none, for any of the default fields. No
  // query is left where the analysis leaves nothing.
  QueryPtr ForFields(const String& name,
                     const std::function<QueryPtr(const String&, const FieldSettings&)>& make) {
    if (name != kNoField && name != kAnyField) {
      const auto known = fields_.find(name);
      if (known == fields_.end()) return UnknownField(name);
      return make(name, *known->second);
    }
    auto clauses = Lucene::Collection<Lucene::BooleanClausePtr>::newInstance();
    for (const String& target : default_fields_) {
      const QueryPtr query = make(target, *fields_.at(target));
      if (query) clauses.add(newBooleanClause(query, Lucene::BooleanClause::SHOULD));
    }
    if (clauses.size() == 1) return clauses[0]->getQuery();
    return getBooleanQuery(clauses, true);
  }

  QueryPtr UnknownField(const String& name) {
    Warn("there is no field " + Quoted(StringUtils::toUTF8(name)));
    return newBooleanQuery(true);  // without a clause, it finds nothing
  }

  // The library would answer a phrase over a field without positions at random.
  QueryPtr WithPositions(const String& target, const QueryPtr& query) {
    const bool is_phrase = boost::dynamic_pointer_cast<Lucene::PhraseQuery>(query) ||
                           boost::dynamic_pointer_cast<Lucene::MultiPhraseQuery>(query);
    const FieldSettings& settings = *fields_.at(target);
    if (!is_phrase || settings.frequencies) return query;
    Warn("field " + Quoted(settings.name) + " keeps no positions: phrases are not found in it");
    return newBooleanQuery(true);
  }

  QueryPtr Counted(const QueryPtr& query) {
    const auto phrase = boost::dynamic_pointer_cast<Lucene::PhraseQuery>(query);
    const auto alternatives = boost::dynamic_pointer_cast<Lucene::MultiPhraseQuery>(query);
    size_t terms = phrase ? static_cast<size_t>(phrase->getTerms().size()) : 1;
    if (alternatives) {
      terms = 0;
      for (const auto& place : alternatives->getTermArrays()) terms += static_cast<size_t>(place.size());
    }
    CountClauses(terms);
    return query;
  }

  // Before a chain of pre-processors makes more of a text than could be looked for anyway.
  void CheckGrowth(const String& text, const FieldSettings& settings) const {
    constexpr uint64_t kMostCharacters = uint64_t{4} << 20;
    if (text.size() * MostGrowth(settings.pre_processors) <= kMostCharacters) return;
    throw LimitExceededError(
        "query_clauses", limits_.query_clauses,
        "the pre-processors of field " + Quoted(settings.name) + " may make too many terms of the query");
  }

  void CheckNearWords(const QueryPtr& query) const {
    int32_t words = 0;
    if (const auto phrase = boost::dynamic_pointer_cast<Lucene::PhraseQuery>(query))
      words = phrase->getTerms().size();
    if (const auto phrase = boost::dynamic_pointer_cast<Lucene::MultiPhraseQuery>(query)) {
      words = phrase->getTermArrays().size();
    }
    if (static_cast<size_t>(words) <= limits_.near_words) return;
    throw LimitExceededError("near_words", limits_.near_words,
                             "a phrase with a distance has " + std::to_string(words) + " words");
  }

  void CountClauses(size_t count) {
    clauses_ += count;
    if (clauses_ <= limits_.query_clauses) return;
    throw LimitExceededError("query_clauses", limits_.query_clauses,
                             "the query looks for too many terms in too many fields");
  }

  void CountExpansion() {
    CountClauses(1);
    if (++expansions_ <= limits_.query_expansions) return;
    throw LimitExceededError(
        "query_expansions", limits_.query_expansions,
        "the query has too many prefixes, wildcards, ranges and similar words, over the fields it looks at");
  }

  // Lower-cased as the analysis of the field's values does.
  static String Folded(String text, const FieldSettings& settings) {
    if (settings.type == FieldType::kText) Lucene::CharFolder::toLower(text.begin(), text.end());
    if (LowersCase(settings.pre_processors)) {
      for (wchar_t& character : text) {
        character = static_cast<wchar_t>(LowerCase(static_cast<char32_t>(character)));
      }
    }
    return text;
  }

  static Lucene::StringValue Bound(const String& text, const FieldSettings& settings) {
    if (text == L"*") return Lucene::VariantNull();
    return Folded(text, settings);
  }

  void Warn(const std::string& warning) {
    if (std::find(warnings_.begin(), warnings_.end(), warning) == warnings_.end())
      warnings_.push_back(warning);
  }

  const SearchLimits& limits_;
  std::map<String, const FieldSettings*> fields_;
  std::vector<String> default_fields_;
  std::vector<std::string> warnings_;
  size_t clauses_ = 0;
  size_t expansions_ = 0;
};

std::wstring CheckedText(const std::string& query, const SearchLimits& limits) {
  if (query.size() > limits.query_bytes) {
    throw LimitExceededError("query_bytes", limits.query_bytes,
                             "the query is of " + std::to_string(query.size()) + " bytes");
  }
  std::wstring wide;
  if (!IsValidUtf8(query)) throw QuerySyntaxError(0, "the query is not valid UTF-8");
  if (const char* problem = ToIndexText(query, wide)) {
    const size_t position = wide.find_first_of(L"\ufffe\uffff\U0001ffff");
    throw QuerySyntaxError(position, std::string("the query ") + problem);
  }
  if (const size_t zero = wide.find(L'\0'); zero != std::wstring::npos) {
    throw QuerySyntaxError(zero, "the query holds U+0000, which no query can hold");
  }
  return wide;
}

bool IsNothingButExclusions(const QueryPtr& query) {
  const auto clauses = boost::dynamic_pointer_cast<Lucene::BooleanQuery>(query);
  if (!clauses || clauses->getClauses().empty()) return false;
  return std::all_of(clauses->begin(), clauses->end(),
                     [](const Lucene::BooleanClausePtr& clause) { return clause->isProhibited(); });
}

}  // namespace

UnderstoodQuery BuildQuery(const std::string& query, const IndexSettings& settings,
                           const SearchLimits& limits) {
  const std::wstring text = CheckedText(query, limits);
  ScanQuery(text, limits);
  const auto parser = newLucene<FieldwiseParser>(settings, limits);
  UnderstoodQuery understood;
  try {
    understood.query = parser->parse(text);
  } catch (const Lucene::LuceneException& error) {
    // Nothing is known that passes the scan and ends here.
    throw QuerySyntaxError(0, StringUtils::toUTF8(error.getError()));
  }
  understood.warnings = parser->TakeWarnings();
  if (IsNothingButExclusions(understood.query)) {
    understood.warnings.emplace_back("a query that only excludes finds nothing; begin it with *:*");
  }
  return understood;
}

}  // namespace vantrel::elastic
