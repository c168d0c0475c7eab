#include "elastic/search/query_scan.h"

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/FastCharStream.h>
#include <lucene++/QueryParserConstants.h>
#include <lucene++/QueryParserToken.h>
#include <lucene++/QueryParserTokenManager.h>
#include <lucene++/StringReader.h>

#include <charconv>
#include <cmath>
#include <initializer_list>
#include <limits>
#include <string_view>
#include <utility>
#include <vector>

#include "elastic/common/quoted.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using Kind = Lucene::QueryParserConstants::RegularExpressionId;
using Constants = Lucene::QueryParserConstants;

// Beyond these, scores leave the range of their type, and near words take too long to find.
constexpr double kLargestBoost = 1'000'000;
constexpr double kLargestSlop = 1000;

struct Token {
  Kind kind = Constants::_EOF;
  uint64_t begin = 0;
  std::wstring image;
};

// The library's tokens, one ahead.
class Tokens {
 public:
  explicit Tokens(const std::wstring& query)
      : length_(query.size()),
        stream_(Lucene::newLucene<Lucene::FastCharStream>(Lucene::newLucene<Lucene::StringReader>(query))),
        manager_(Lucene::newLucene<Lucene::QueryParserTokenManager>(stream_)) {
    // Its constructor leaves the lexer's marks as the memory happens to be; only this sets them.
    manager_->ReInit(stream_);
    Advance();
  }

  const Token& current() const { return current_; }
  bool Is(std::initializer_list<Kind> kinds) const {
    for (const Kind kind : kinds) {
      if (current_.kind == kind) return true;
    }
    return false;
  }

  Token Take() {
    Token taken = std::move(current_);
    Advance();
    return taken;
  }

 private:
  void Advance() {
    try {
      const Lucene::QueryParserTokenPtr token = manager_->getNextToken();
      current_ = {static_cast<Kind>(token->kind), static_cast<uint64_t>(token->beginColumn), token->image};
      if (current_.kind == Constants::_EOF) current_.begin = length_;
    } catch (const Lucene::QueryParserError&) {
      RefuseCharacters(static_cast<uint64_t>(stream_->getBeginColumn()));
    }
  }

  // The lexer found no token that begins here.
  [[noreturn]] void RefuseCharacters(uint64_t begin) const {
    switch (current_.kind) {
      case Constants::CARAT:
        throw QuerySyntaxError(begin, "a number is expected after ^");
      case Constants::RANGEIN_START:
      case Constants::RANGEIN_GOOP:
      case Constants::RANGEIN_QUOTED:
      case Constants::RANGEIN_TO:
      case Constants::RANGEEX_START:
      case Constants::RANGEEX_GOOP:
      case Constants::RANGEEX_QUOTED:
      case Constants::RANGEEX_TO:
        throw QuerySyntaxError(begin, "a range is not closed");
      default:
        throw QuerySyntaxError(begin, "a quote that is not closed, or an escape without a character");
    }
  }

  uint64_t length_;
  boost::shared_ptr<Lucene::FastCharStream> stream_;
  Lucene::QueryParserTokenManagerPtr manager_;
  Token current_;
};

int HexDigit(wchar_t character) {
  if (character >= L'0' && character <= L'9') return character - L'0';
  if (character >= L'a' && character <= L'f') return character - L'a' + 10;
  if (character >= L'A' && character <= L'F') return character - L'A' + 10;
  return -1;
}

// The number in an image, such as "~0.5" behind its mark; infinite where it is too large for its type.
double NumberIn(std::wstring_view digits) {
  const std::string text(digits.begin(), digits.end());
  double number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  return error == std::errc() ? number : std::numeric_limits<double>::infinity();
}

class Scan {
 public:
  Scan(const std::wstring& query, const SearchLimits& limits) : limits_(limits), tokens_(query) {}

  void Run() {
    if (tokens_.Is({Constants::_EOF})) throw QuerySyntaxError(0, "there is nothing to search for");
    for (;;) {
      if (tokens_.Is({Constants::PLUS, Constants::MINUS, Constants::NOT})) tokens_.Take();
      if (!TakeClause()) continue;
      TakeClosings();
      if (tokens_.Is({Constants::_EOF})) break;
      if (tokens_.Is({Constants::AND, Constants::OR})) tokens_.Take();
    }
    if (!open_.empty()) throw QuerySyntaxError(open_.back(), "a parenthesis is not closed");
  }

 private:
  // False where just a parenthesis was opened: a clause comes next.
  bool TakeClause() {
    if (tokens_.Is({Constants::TERM, Constants::STAR})) {
      const Token word = tokens_.Take();
      CheckEscapes(word, word.image);
      if (!tokens_.Is({Constants::COLON})) {
        TakeWordEnd(word);
        return true;
      }
      tokens_.Take();
    }
    if (tokens_.Is({Constants::LPAREN})) {
      open_.push_back(tokens_.Take().begin);
      if (open_.size() > limits_.query_depth) {
        throw LimitExceededError("query_depth", limits_.query_depth, "the query nests parentheses too deep");
      }
      return false;
    }
    TakeTerm();
    return true;
  }

  void TakeClosings() {
    while (tokens_.Is({Constants::RPAREN})) {
      const Token closing = tokens_.Take();
      if (open_.empty()) throw QuerySyntaxError(closing.begin, "a parenthesis is closed that was not opened");
      open_.pop_back();
      TakeBoost();
    }
  }

  void TakeTerm() {
    switch (tokens_.current().kind) {
      case Constants::TERM:
      case Constants::STAR:
      case Constants::PREFIXTERM:
      case Constants::WILDTERM:
      case Constants::NUMBER: {
        const Token word = tokens_.Take();
        CheckEscapes(word, word.image);
        return TakeWordEnd(word);
      }
      case Constants::QUOTED: {
        const Token phrase = tokens_.Take();
        CheckEscapes(phrase, std::wstring_view(phrase.image).substr(1, phrase.image.size() - 2));
        CountClause(false);
        TakeMeasure(kLargestSlop, "a distance is a number up to 1000");
        return TakeBoost();
      }
      case Constants::RANGEIN_START:
        return TakeRange({Constants::RANGEIN_GOOP, Constants::RANGEIN_QUOTED}, Constants::RANGEIN_TO,
                         Constants::RANGEIN_END);
      case Constants::RANGEEX_START:
        return TakeRange({Constants::RANGEEX_GOOP, Constants::RANGEEX_QUOTED}, Constants::RANGEEX_TO,
                         Constants::RANGEEX_END);
      default:
        RefuseToken("a word, a phrase, a range or a parenthesis");
    }
  }

  // What may follow a word or a pattern.
  void TakeWordEnd(const Token& word) {
    constexpr const char* kSimilarity = "a similarity is a number from 0 to below 1";
    bool is_pattern = word.kind != Constants::TERM && word.kind != Constants::NUMBER;
    const double below_one = std::nextafter(1.0, 0.0);
    is_pattern |= TakeMeasure(below_one, kSimilarity);
    if (tokens_.Is({Constants::CARAT})) {
      TakeBoost();
      is_pattern |= TakeMeasure(below_one, kSimilarity);
    }
    CountClause(is_pattern);
    if (is_pattern && word.image.size() > limits_.pattern_characters) {
      throw LimitExceededError(
          "pattern_characters", limits_.pattern_characters,
          "a pattern of the query is of " + std::to_string(word.image.size()) + " characters");
    }
  }

  void TakeRange(std::initializer_list<Kind> bounds, Kind to, Kind end) {
    tokens_.Take();
    TakeBound(bounds);
    if (tokens_.Is({to})) tokens_.Take();
    TakeBound(bounds);
    if (!tokens_.Is({end})) RefuseToken("the end of the range");
    tokens_.Take();
    CountClause(true);
    TakeBoost();
  }

  void TakeBound(std::initializer_list<Kind> bounds) {
    if (!tokens_.Is(bounds)) RefuseToken("a bound of the range");
    const Token bound = tokens_.Take();
    const bool quoted = bound.kind == Constants::RANGEIN_QUOTED || bound.kind == Constants::RANGEEX_QUOTED;
    const std::wstring_view image = bound.image;
    CheckEscapes(bound, quoted ? image.substr(1, image.size() - 2) : image);
  }

  void TakeBoost() {
    if (!tokens_.Is({Constants::CARAT})) return;
    tokens_.Take();
    if (!tokens_.Is({Constants::NUMBER})) RefuseToken("a number");
    const Token number = tokens_.Take();
    if (NumberIn(number.image) > kLargestBoost) {
      throw QuerySyntaxError(number.begin, "a boost is a number up to 1000000");
    }
  }

  // Takes "~", with a number or without; false where there is none.
  bool TakeMeasure(double largest, const char* problem) {
    if (!tokens_.Is({Constants::FUZZY_SLOP})) return false;
    const Token measure = tokens_.Take();
    if (measure.image.size() > 1 && NumberIn(std::wstring_view(measure.image).substr(1)) > largest) {
      throw QuerySyntaxError(measure.begin, problem);
    }
    return true;
  }

  void CheckEscapes(const Token& token, std::wstring_view text) const {
    for (size_t i = 0; i < text.size(); ++i) {
      if (text[i] != L'\\') continue;
      if (++i == text.size()) throw QuerySyntaxError(token.begin, "an escape without a character");
      if (text[i] != L'u') continue;
      const std::wstring_view digits = text.substr(i + 1, 4);
      wchar_t character = 0;
      bool is_number = digits.size() == 4;
      for (const wchar_t digit : digits) {
        is_number &= HexDigit(digit) >= 0;
        character = character * 16 + HexDigit(digit);
      }
      if (!is_number) throw QuerySyntaxError(token.begin, "\\u is followed by four hexadecimal digits");
      const bool is_character =
          character != 0 && (character < 0xd800 || character > 0xdfff) && character < 0xfffe;
      if (!is_character) throw QuerySyntaxError(token.begin, "\\u stands for no character");
      i += 4;
    }
  }

  void CountClause(bool is_expansion) {
    if (++clauses_ > limits_.query_clauses) {
      throw LimitExceededError("query_clauses", limits_.query_clauses, "the query has too many terms");
    }
    if (is_expansion && ++expansions_ > limits_.query_expansions) {
      throw LimitExceededError("query_expansions", limits_.query_expansions,
                               "the query has too many prefixes, wildcards, ranges and similar words");
    }
  }

  [[noreturn]] void RefuseToken(const char* expected) const {
    const Token& token = tokens_.current();
    const std::string found =
        token.kind == Constants::_EOF ? "the query ends" : Quoted(Lucene::StringUtils::toUTF8(token.image));
    throw QuerySyntaxError(token.begin, found + " where " + expected + " is expected");
  }

  const SearchLimits& limits_;
  Tokens tokens_;
  std::vector<uint64_t> open_;  // where the parentheses stand that are not closed yet
  size_t clauses_ = 0;
  size_t expansions_ = 0;
};

}  // namespace

void ScanQuery(const std::wstring& query, const SearchLimits& limits) { Scan(query, limits).Run(); }

}  // namespace vantrel::elastic
