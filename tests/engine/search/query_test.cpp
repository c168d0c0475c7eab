// What the query string means.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "search_fixture.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::Ids;
using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Request;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

class QueryTest : public ::testing::Test {
 protected:
  QueryTest()
      : index_({{.name = "title"},
                {.name = "body"},
                {.name = "counts", .frequencies = false},
                {.name = "kind", .type = FieldType::kKeyword}}) {
    index_.Add({"id=fox", "title=Red Fox", "body=the quick brown fox jumps high", "kind=pdf"});
    index_.Add({"id=gruß", "title=Grüße aus KÖLN", "body=ein brauner Fuchs", "kind=JPG"});
    index_.Add({"id=dog", "title=Lazy dog", "body=quick lazy dog; foxes run", "kind=txt"});
    index_.Add({"id=number", "body=ten 10 twenty", "counts=one two three", "kind=New York"});
  }

  std::vector<std::string> Find(const std::string& query) const { return index_.Find(query); }
  SearchResult Search(const std::string& query) const { return index_->Search(Request(query)); }

  OwnIndex index_;
};

// Frees memory that holds nothing but this number, in pieces of many sizes, for what comes next to be made in.
void LeaveInMemory(int32_t number) {
  std::vector<std::vector<int32_t>> pieces;
  for (size_t bytes = 16; bytes <= 512; bytes += 16) {
    for (int i = 0; i < 20; ++i) pieces.emplace_back(bytes / sizeof number, number);
  }
}

TEST_F(QueryTest, AQueryMeansTheSameWhateverStoodInMemoryBefore) {
  for (int32_t number = 0; number < 50; ++number) {
    SCOPED_TRACE(number);
    LeaveInMemory(number);
    EXPECT_THAT(Find("title:red"), ElementsAre("fox"));
    LeaveInMemory(number);
    EXPECT_THAT(Find("+quick -laz* \"brown fox\"~2"), ElementsAre("fox"));
  }
}

TEST_F(QueryTest, AWordIsLookedForInEveryText) {
  EXPECT_THAT(Find("red"), ElementsAre("fox"));
  EXPECT_THAT(Find("jumps"), ElementsAre("fox"));
  EXPECT_THAT(Find("three"), ElementsAre("number"));
  EXPECT_THAT(Find("pdf"), IsEmpty());
}

TEST_F(QueryTest, WithoutTextFieldsEveryKeywordIsLookedAt) {
  OwnIndex keywords({{.name = "kind", .type = FieldType::kKeyword}});
  keywords.Add({"id=a", "kind=B"});
  keywords.Add({"id=B", "kind=c"});
  EXPECT_THAT(keywords.Find("B"), ElementsAre("B", "a"));
}

TEST_F(QueryTest, WordsSideBySideAreAlternativesAndMoreOfThemScoreBetter) {
  EXPECT_THAT(Find("jumps lazy ein"), ElementsAre("dog", "fox", "gruß"));
  EXPECT_THAT(Ids(Search("quick jumps")), ElementsAre("fox", "dog"));
}

TEST_F(QueryTest, AFieldNarrowsItDown) {
  EXPECT_THAT(Find("title:fox"), ElementsAre("fox"));
  EXPECT_THAT(Find("body:dog"), ElementsAre("dog"));
  EXPECT_THAT(Find("title:quick"), IsEmpty());
  EXPECT_THAT(Find("title:(fox dog)"), ElementsAre("dog", "fox"));
}

TEST_F(QueryTest, TextsAreAnalysedInTheQueryAsInTheIndex) {
  EXPECT_THAT(Find("GRÜSSE"), IsEmpty());
  EXPECT_THAT(Find("GRÜßE"), ElementsAre("gruß"));
  EXPECT_THAT(Find("köln"), ElementsAre("gruß"));
  EXPECT_THAT(Find("quick-brown"), ElementsAre("fox"));  // a phrase of two words
  EXPECT_THAT(Find("brown-quick"), IsEmpty());
}

TEST_F(QueryTest, AKeywordIsTakenAsItIs) {
  EXPECT_THAT(Find("kind:pdf"), ElementsAre("fox"));
  EXPECT_THAT(Find("kind:PDF"), IsEmpty());
  EXPECT_THAT(Find("kind:JPG"), ElementsAre("gruß"));
  EXPECT_THAT(Find("kind:\"New York\""), ElementsAre("number"));
  EXPECT_THAT(Find("kind:New\\ York"), ElementsAre("number"));
  EXPECT_THAT(Find("kind:N\\u0065w\\ York"), ElementsAre("number"));
  EXPECT_THAT(Find("id:gruß"), ElementsAre("gruß"));
  EXPECT_THAT(Find("kind:York"), IsEmpty());
}

TEST_F(QueryTest, PhrasesAreFoundInOrderAndNearWordsWithinADistance) {
  EXPECT_THAT(Find("\"quick brown\""), ElementsAre("fox"));
  EXPECT_THAT(Find("\"brown quick\""), IsEmpty());
  EXPECT_THAT(Find("\"quick fox\""), IsEmpty());
  EXPECT_THAT(Find("\"quick fox\"~1"), ElementsAre("fox"));
  EXPECT_THAT(Find("body:\"quick lazy dog\""), ElementsAre("dog"));
}

TEST_F(QueryTest, APhraseOverAFieldWithoutPositionsFindsNothingAndWarns) {
  EXPECT_THAT(Find("counts:two"), ElementsAre("number"));
  const SearchResult result = Search("counts:\"one two\"");
  EXPECT_EQ(result.total, 0U);
  EXPECT_THAT(result.warnings,
              ElementsAre("field \"counts\" keeps no positions: phrases are not found in it"));
}

TEST_F(QueryTest, OperatorsRequireExcludeAndCombine) {
  EXPECT_THAT(Find("+quick +dog"), ElementsAre("dog"));
  EXPECT_THAT(Find("quick -dog"), ElementsAre("fox"));
  EXPECT_THAT(Find("quick NOT dog"), ElementsAre("fox"));
  EXPECT_THAT(Find("quick AND dog"), ElementsAre("dog"));
  EXPECT_THAT(Find("quick && dog"), ElementsAre("dog"));
  EXPECT_THAT(Find("jumps OR ein"), ElementsAre("fox", "gruß"));
  EXPECT_THAT(Find("(jumps || ein) AND brown*"), ElementsAre("fox"));
  EXPECT_THAT(Find("+(jumps ein ten) -(red 10)"), ElementsAre("gruß"));
}

TEST_F(QueryTest, AQueryThatOnlyExcludesFindsNothingAndWarns) {
  const SearchResult result = Search("-quick");
  EXPECT_EQ(result.total, 0U);
  EXPECT_THAT(result.warnings, ElementsAre("a query that only excludes finds nothing; begin it with *:*"));
  EXPECT_THAT(Find("*:* -quick"), ElementsAre("gruß", "number"));
}

TEST_F(QueryTest, PatternsStandForWords) {
  EXPECT_THAT(Find("fo*"), ElementsAre("dog", "fox"));
  EXPECT_THAT(Find("FOX*"), ElementsAre("dog", "fox"));
  EXPECT_THAT(Find("GRÜ*"), ElementsAre("gruß"));
  EXPECT_THAT(Find("f?x"), ElementsAre("fox"));
  EXPECT_THAT(Find("f?x*"), ElementsAre("dog", "fox"));
  EXPECT_THAT(Find("*uchs"), ElementsAre("gruß"));
  EXPECT_THAT(Find("?umps"), ElementsAre("fox"));
  EXPECT_THAT(Find("body:b*w*n"), ElementsAre("fox"));
  EXPECT_THAT(Find("b*x"), IsEmpty());
}

TEST_F(QueryTest, PatternsOverKeywordsMindTheCase) {
  EXPECT_THAT(Find("kind:J*"), ElementsAre("gruß"));
  EXPECT_THAT(Find("kind:j*"), IsEmpty());
  EXPECT_THAT(Find("kind:N?w*k"), ElementsAre("number"));
}

TEST_F(QueryTest, SimilarWordsAreFound) {
  EXPECT_THAT(Find("quik~"), ElementsAre("dog", "fox"));
  EXPECT_THAT(Find("QUIK~0.6"), ElementsAre("dog", "fox"));
  EXPECT_THAT(Find("quik~0.9"), IsEmpty());
}

TEST_F(QueryTest, RangesGoByTheOrderOfTerms) {
  EXPECT_THAT(Find("kind:[pdf TO txt]"), ElementsAre("dog", "fox"));
  EXPECT_THAT(Find("kind:{pdf TO txt}"), IsEmpty());
  EXPECT_THAT(Find("kind:{pdf TO txu}"), ElementsAre("dog"));
  EXPECT_THAT(Find("kind:[* TO \"New York\"]"), ElementsAre("gruß", "number"));
  EXPECT_THAT(Find("kind:[\"New York\" TO *]"), ElementsAre("dog", "fox", "number"));
  EXPECT_THAT(Find("body:[JUMP TO LAZY]"), ElementsAre("dog", "fox"));
}

TEST_F(QueryTest, WhatLooksLikeADateIsATermLikeAnyOther) {
  OwnIndex days({{.name = "day", .type = FieldType::kKeyword}});
  for (const char* day : {"20230101", "20230615", "20231231"})
    days.Add({std::string("id=") + day, std::string("day=") + day});
  EXPECT_THAT(days.Find("day:[20230102 TO 20231230]"), ElementsAre("20230615"));
}

TEST_F(QueryTest, EveryDocumentCanBeAskedForAndEveryOneThatHasAField) {
  EXPECT_THAT(Find("*:*"), ElementsAre("dog", "fox", "gruß", "number"));
  EXPECT_THAT(Find("*"), ElementsAre("dog", "fox", "gruß", "number"));
  EXPECT_THAT(Find("counts:*"), ElementsAre("number"));
  EXPECT_THAT(Find("title:*"), ElementsAre("dog", "fox", "gruß"));
}

TEST_F(QueryTest, ABoostMovesAHitUp) {
  EXPECT_THAT(Ids(Search("jumps^5 ein")), ElementsAre("fox", "gruß"));
  EXPECT_THAT(Ids(Search("jumps ein^5")), ElementsAre("gruß", "fox"));
  EXPECT_THAT(Ids(Search("(jumps)^0.1 (ein)^2")), ElementsAre("gruß", "fox"));
}

TEST_F(QueryTest, AnUnknownFieldFindsNothingAndWarns) {
  const SearchResult result = Search("colour:red fox Colour:x colour:blue");
  EXPECT_THAT(Ids(result), ElementsAre("fox"));
  EXPECT_THAT(result.warnings, ElementsAre("there is no field \"colour\"", "there is no field \"Colour\""));
}

TEST_F(QueryTest, AWordOfWhichTheAnalysisLeavesNothingIsPassedOverWithAWarning) {
  const SearchResult result = Search("... fox");
  EXPECT_THAT(Ids(result), ElementsAre("fox"));
  EXPECT_THAT(result.warnings, ElementsAre("nothing of \"...\" is left to search for"));
  EXPECT_THAT(Search("\"\"").hits, IsEmpty());
}

TEST_F(QueryTest, TheQueryIsToldAsItWasUnderstood) {
  EXPECT_EQ(Search("title:FOX").query, "title:fox");
  EXPECT_EQ(Search("+kind:FOX -title:\"Two Words\"~3").query, "+kind:FOX -title:\"two words\"~3");
  EXPECT_EQ(Search("title:fox AND title:dog^2").query, "+title:fox +title:dog^2.0");
}

}  // namespace
}  // namespace vantrel::elastic
