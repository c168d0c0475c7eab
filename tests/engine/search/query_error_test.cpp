// Queries that are refused, and how far a query may go.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "search_fixture.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Request;
using ::quorelastic::testing::Thrown;
using ::testing::HasSubstr;

std::string Repeated(const std::string& piece, size_t times) {
  std::string text;
  text.reserve(piece.size() * times);
  for (size_t i = 0; i < times; ++i) text += piece;
  return text;
}

class QueryErrorTest : public ::testing::Test {
 protected:
  QueryErrorTest() : index_({{.name = "body"}, {.name = "kind", .type = FieldType::kKeyword}}) {
    index_.Add({"id=a", "body=one", "kind=k"});
  }

  SearchResult Search(const std::string& query, const SearchLimits& limits = SearchLimits()) const {
    return index_->Search(Request(query), SearchPluginRegistry::BuiltIn(), limits);
  }

  QuerySyntaxError SyntaxError(const std::string& query) const {
    return Thrown<QuerySyntaxError>([&] { Search(query); });
  }

  LimitExceededError LimitError(const std::string& query, const SearchLimits& limits = SearchLimits()) const {
    return Thrown<LimitExceededError>([&] { Search(query, limits); });
  }

  OwnIndex index_;
};

struct BadQuery {
  const char* query;
  uint64_t position;
  const char* problem;
};

// Names the instances.
std::ostream& operator<<(std::ostream& stream, const BadQuery& bad) {
  return stream << ::testing::PrintToString(bad.query);
}

class BadQueryTest : public QueryErrorTest, public ::testing::WithParamInterface<BadQuery> {};

TEST_P(BadQueryTest, IsRefusedWithThePlaceAndTheReason) {
  const QuerySyntaxError error = SyntaxError(GetParam().query);
  EXPECT_EQ(error.position(), GetParam().position) << error.what();
  EXPECT_THAT(error.what(), HasSubstr(GetParam().problem));
  EXPECT_THAT(error.what(),
              ::testing::StartsWith("the query, at character " + std::to_string(GetParam().position) + ": "));
}

INSTANTIATE_TEST_SUITE_P(
    Queries, BadQueryTest,
    ::testing::Values(
        BadQuery{"", 0, "nothing to search for"}, BadQuery{"  \t ", 0, "nothing to search for"},
        BadQuery{"one AND", 7, "the query ends where"}, BadQuery{"AND one", 0, "\"AND\" where a word"},
        BadQuery{"one AND OR two", 8, "\"OR\" where a word"}, BadQuery{"+ +one", 2, "\"+\" where a word"},
        BadQuery{"one -", 5, "the query ends where a word"}, BadQuery{"(one", 0, "not closed"},
        BadQuery{"one (two (three)", 4, "not closed"}, BadQuery{"one)", 3, "not opened"},
        BadQuery{"()", 1, "\")\" where a word"}, BadQuery{"(one))(", 5, "not opened"},
        BadQuery{"one \"two", 4, "a quote that is not closed"}, BadQuery{"größe \"", 6, "a quote"},
        BadQuery{"one two\\", 7, "an escape without a character"}, BadQuery{"body:", 5, "the query ends"},
        BadQuery{":one", 0, "\":\" where a word"}, BadQuery{"body:one:two", 8, "\":\" where a word"},
        BadQuery{"one^", 4, "the query ends where a number"}, BadQuery{"one^x", 4, "a number is expected"},
        BadQuery{"one^-1", 4, "a number is expected"},
        BadQuery{"one^1000001", 4, "a boost is a number up to"},
        BadQuery{"(one)^9999999", 6, "a boost is a number up to"}, BadQuery{"one~1", 3, "below 1"},
        BadQuery{"one~1.0", 3, "below 1"}, BadQuery{"one^2~7", 5, "below 1"},
        BadQuery{"\"one two\"~1000001", 9, "a distance is a number up to"},
        BadQuery{"one~~", 4, "\"~\" where a word"}, BadQuery{"[one TO two", 11, "the end of the range"},
        BadQuery{"[one TO]", 7, "a bound of the range"}, BadQuery{"{one TO two]", 12, "the end of the range"},
        BadQuery{"[one two three]", 9, "the end of the range"}, BadQuery{"body:[", 6, "a bound of the range"},
        BadQuery{"one \\u12 x", 4, "four hexadecimal digits"}, BadQuery{"\\u0000", 0, "no character"},
        BadQuery{"\\ud83d", 0, "no character"}, BadQuery{"\"a\\uffff\"", 0, "no character"},
        BadQuery{"one\xff", 0, "not valid UTF-8"}, BadQuery{"one \xef\xbf\xbf", 4, "U+FFFF"}));

TEST_F(QueryErrorTest, AZeroIsRefusedWhereItStands) {
  EXPECT_EQ(SyntaxError(std::string("one\0two", 7)).position(), 3U);
}

TEST_F(QueryErrorTest, ParenthesesMayNestUpToTheLimit) {
  const size_t depth = SearchLimits().query_depth;
  const auto nested = [](size_t levels) { return Repeated("(one ", levels) + "one" + Repeated(")", levels); };
  EXPECT_EQ(Search(nested(depth)).total, 1U);
  EXPECT_EQ(LimitError(nested(depth + 1)).limit(), "query_depth");
  EXPECT_EQ(LimitError(nested(depth + 1)).most(), depth);
}

TEST_F(QueryErrorTest, TwentyThousandParenthesesNeverReachTheParser) {
  SearchLimits limits;
  limits.query_bytes = 1'000'000;
  limits.query_clauses = 1'000'000;
  limits.query_expansions = 1'000'000;
  EXPECT_EQ(LimitError(std::string(20'000, '(') + "one" + std::string(20'000, ')'), limits).limit(),
            "query_depth");
  EXPECT_EQ(LimitError(Repeated("+(", 20'000), limits).limit(), "query_depth");
  EXPECT_EQ(LimitError(Repeated("body:(", 20'000), limits).limit(), "query_depth");
  // Parentheses that close nothing, in quotes and ranges, do not hide those that open.
  EXPECT_EQ(LimitError(Repeated("(\")\" [) TO )] ", 20'000), limits).limit(), "query_depth");
}

TEST_F(QueryErrorTest, ParenthesesInQuotesRangesAndEscapesDoNotNest) {
  EXPECT_EQ(Search(Repeated("kind:\"(((\" ", 30) + "one").total, 1U);
  EXPECT_EQ(Search(Repeated("kind:[((( TO (((] ", 30) + "one").total, 1U);
  EXPECT_EQ(Search(Repeated("kind:\\(\\(\\( ", 30) + "one").total, 1U);
}

TEST_F(QueryErrorTest, ALongQueryIsRefused) {
  const size_t most = SearchLimits().query_bytes;
  const std::string longest = "one " + std::string(most - 4, 'x');
  EXPECT_EQ(Search(longest).total, 1U);
  EXPECT_EQ(LimitError(longest + "x").limit(), "query_bytes");
  EXPECT_EQ(LimitError(std::string(5'000'000, '"')).limit(), "query_bytes");
}

TEST_F(QueryErrorTest, TermsAreCountedOverTheFieldsTheyAreLookedForIn) {
  const size_t most = SearchLimits().query_clauses;
  EXPECT_EQ(Search(Repeated("a ", most - 1) + "one").total, 1U);
  EXPECT_EQ(LimitError(Repeated("a ", most) + "one").limit(), "query_clauses");
  EXPECT_EQ(LimitError("\"" + Repeated("a ", most + 1) + "\"").limit(), "query_clauses");
  const OwnIndex wide({{.name = "x"}, {.name = "y"}, {.name = "z"}, {.name = "t"}});
  EXPECT_EQ(Thrown<LimitExceededError>([&] { wide->Search(Request(Repeated("a ", most / 4 + 1))); }).limit(),
            "query_clauses");
}

TEST_F(QueryErrorTest, WhatWalksADictionaryIsCountedToo) {
  const size_t most = SearchLimits().query_expansions;
  for (const char* piece : {"o* ", "?ne ", "one~ ", "[a TO z] ", "{a TO z} ", "body:* ", "*x "}) {
    EXPECT_EQ(Search(Repeated(piece, most)).total, piece == std::string("*x ") ? 0U : 1U) << piece;
    EXPECT_EQ(LimitError(Repeated(piece, most + 1)).limit(), "query_expansions") << piece;
  }
  const OwnIndex wide({{.name = "x"}, {.name = "y"}});
  EXPECT_EQ(Thrown<LimitExceededError>([&] { wide->Search(Request(Repeated("a* ", most / 2 + 1))); }).limit(),
            "query_expansions");
}

TEST_F(QueryErrorTest, ALongPatternIsRefused) {
  const size_t most = SearchLimits().pattern_characters;
  EXPECT_EQ(Search(std::string(most - 1, 'x') + "*").total, 0U);
  EXPECT_EQ(LimitError(std::string(most, 'x') + "*").limit(), "pattern_characters");
  EXPECT_EQ(LimitError(std::string(most, 'x') + "?").limit(), "pattern_characters");
  EXPECT_EQ(LimitError(std::string(most + 1, 'x') + "~").limit(), "pattern_characters");
  EXPECT_EQ(Search(std::string(most + 1, 'x')).total, 0U);
}

TEST_F(QueryErrorTest, APatternOfManyAsterisksTakesNoLonger) {
  index_.Add({"id=b", "body=" + std::string(5000, 'a')});
  const auto begin = std::chrono::steady_clock::now();
  EXPECT_EQ(Search(Repeated("a*", 100) + "b").total, 0U);
  EXPECT_EQ(Search(Repeated("*a", 100)).total, 1U);
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(5));
}

}  // namespace
}  // namespace vantrel::elastic
