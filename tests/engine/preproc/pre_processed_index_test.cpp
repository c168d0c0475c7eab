#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <tuple>
#include <utility>

#include "engine/index/read_back.h"
#include "support/expect_damage.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/json_value.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::StoredValues;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Terms;
using ::quorelastic::testing::WriteFile;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Pair;

const std::vector<PreProcSettings> kLower = {{"tolower", ""}};
const std::vector<PreProcSettings> kBigrams = {{"ngram", "2"}};
const std::vector<PreProcSettings> kLowerBigrams = {{"tolower", ""}, {"ngram", "2"}};

FieldSettings Field(FieldType type, const std::vector<PreProcSettings>& steps) {
  FieldSettings field{.name = "f", .type = type};
  field.pre_processors = steps;
  return field;
}

class PreProcessedIndexTest : public ::testing::Test {
 protected:
  // An index with the field "f", and a document for each value; their ids are 0, 1, ...
  void Make(const FieldSettings& field, const std::vector<std::string>& values) {
    index_ = Index::Create(folder_.path(), {.fields = {field}});
    int number = 0;
    for (const std::string& value : values) index_->Add({{{"id", std::to_string(number++)}, {"f", value}}});
    index_->Commit();
  }

  // The ids of the documents that a query finds, sorted.
  std::vector<std::string> Find(const std::string& query) const {
    SearchRequest request;
    request.query = query;
    std::vector<std::string> ids;
    for (const SearchHit& hit : index_->Search(request).hits) ids.push_back(hit.id);
    std::sort(ids.begin(), ids.end());
    return ids;
  }

  std::vector<std::string> Analyze(const std::string& value) const {
    std::vector<std::string> texts;
    for (const AnalyzedToken& token : index_->Analyze("f", value)) texts.push_back(token.text);
    return texts;
  }

  TemporaryFolder folder_;
  std::shared_ptr<Index> index_;
};

TEST_F(PreProcessedIndexTest, ALoweredKeywordIsFoundInAnyCase) {
  Make(Field(FieldType::kKeyword, kLower), {"The Whole \xc3\x84ther", "other"});
  EXPECT_THAT(Terms(folder_.path(), "f"), ElementsAre("other", "the whole \xc3\xa4ther"));
  EXPECT_THAT(Find("f:\"THE whole \xc3\x84THER\""), ElementsAre("0"));
  EXPECT_THAT(Find("f:OTHER"), ElementsAre("1"));
  EXPECT_THAT(Find("f:whole"), IsEmpty());
}

TEST_F(PreProcessedIndexTest, PatternsAndRangesOverALoweredKeywordAreLoweredToo) {
  Make(Field(FieldType::kKeyword, kLower), {"Alpha", "Beta"});
  EXPECT_THAT(Find("f:ALP*"), ElementsAre("0"));
  EXPECT_THAT(Find("f:*ETA"), ElementsAre("1"));
  EXPECT_THAT(Find("f:BETO~0.5"), ElementsAre("1"));
  EXPECT_THAT(Find("f:[B TO C]"), ElementsAre("1"));
}

TEST_F(PreProcessedIndexTest, LettersThatUnicodeGotLaterAreFoundInAnyCaseByWordsAndPatterns) {
  Make(Field(FieldType::kKeyword, kLower), {"\xe1\xb2\x90\xe1\xb2\x91", "\xf0\x9e\xa4\x80\xf0\x9e\xa4\x81"});
  EXPECT_THAT(Find("f:\xe1\xb2\x90\xe1\xb2\x91"), ElementsAre("0"));
  EXPECT_THAT(Find("f:\xe1\x83\x90\xe1\x83\x91"), ElementsAre("0"));
  EXPECT_THAT(Find("f:\xe1\xb2\x90*"), ElementsAre("0"));
  EXPECT_THAT(Find("f:\xf0\x9e\xa4\x80*"), ElementsAre("1"));
}

TEST_F(PreProcessedIndexTest, GramsOfAKeywordFindAnyPartOfIt) {
  Make(Field(FieldType::kKeyword, kLowerBigrams), {"Quorelastic", "elation", "tic elas"});
  EXPECT_THAT(Find("f:ELAS"), ElementsAre("0", "2"));
  EXPECT_THAT(Find("f:la"), ElementsAre("0", "1", "2"));
  EXPECT_THAT(Find("f:\"astic\""), ElementsAre("0"));
  EXPECT_THAT(Find("f:\"c e\""), ElementsAre("2")) << "a blank is a character of a keyword like any other";
  EXPECT_THAT(Find("f:lasso"), IsEmpty());
}

TEST_F(PreProcessedIndexTest, GramsOfATextStayWithinItsWords) {
  Make(Field(FieldType::kText, kBigrams), {"Abc d Efg"});
  EXPECT_THAT(Terms(folder_.path(), "f"), ElementsAre("ab", "bc", "ef", "fg"));
  EXPECT_THAT(Find("f:BC"), ElementsAre("0"));
  EXPECT_THAT(Find("f:\"abc efg\""), ElementsAre("0")) << "a word too short for a gram leaves no gap";
  EXPECT_THAT(Find("f:bce"), IsEmpty());
}

TEST_F(PreProcessedIndexTest, GramsOfSeveralLengthsFindTheSame) {
  Make(Field(FieldType::kText, {{"ngram", "2,3"}}), {"abcd", "bcx"});
  EXPECT_THAT(Terms(folder_.path(), "f"), ElementsAre("ab", "abc", "bc", "bcd", "bcx", "cd", "cx"));
  EXPECT_THAT(Find("f:bc"), ElementsAre("0", "1"));
  EXPECT_THAT(Find("f:bcd"), ElementsAre("0"));
  EXPECT_THAT(Find("f:abcd"), ElementsAre("0"));
  EXPECT_THAT(Find("f:abcx"), IsEmpty());
}

TEST_F(PreProcessedIndexTest, GramsOfNonLatinTextAreOfWholeCharacters) {
  Make(Field(FieldType::kKeyword, kBigrams),
       {"\xe4\xb8\xad\xe6\x96\x87\xe5\xad\x97", "\xf0\x9f\x98\x80\xc3\xa4z"});
  EXPECT_THAT(Find("f:\xe6\x96\x87\xe5\xad\x97"), ElementsAre("0"));
  EXPECT_THAT(Find("f:\xf0\x9f\x98\x80\xc3\xa4"), ElementsAre("1"));
}

TEST_F(PreProcessedIndexTest, NoPartSpansTwoValues) {
  index_ = Index::Create(folder_.path(), {.fields = {Field(FieldType::kKeyword, kBigrams)}});
  index_->Add({{{"id", "0"}, {"f", "ab"}, {"f", "bc"}}});
  index_->Commit();
  EXPECT_THAT(Find("f:ab"), ElementsAre("0"));
  EXPECT_THAT(Find("f:abc"), IsEmpty());
}

TEST_F(PreProcessedIndexTest, AnalyzeShowsWhatIsIndexed) {
  Make(Field(FieldType::kText, kBigrams), {});
  EXPECT_THAT(Analyze("Abc de"), ElementsAre("ab", "bc", "de"));
  const std::vector<AnalyzedToken> tokens = index_->Analyze("f", "Abc de");
  EXPECT_EQ(tokens.at(1).position, 1U);
  EXPECT_EQ(tokens.at(1).start, 1U);
  EXPECT_EQ(tokens.at(1).end, 3U);
  EXPECT_EQ(tokens.at(2).position, 2U);
  EXPECT_EQ(tokens.at(2).start, 4U);
  EXPECT_EQ(tokens.at(2).end, 6U);
}

TEST_F(PreProcessedIndexTest, GramsThatBeginTogetherAreIndexedAtOnePosition) {
  Make(Field(FieldType::kText, {{"ngram", "2,3"}}), {});
  std::vector<std::pair<std::string, uint64_t>> found;
  for (const AnalyzedToken& token : index_->Analyze("f", "abc xy"))
    found.emplace_back(token.text, token.position);
  EXPECT_THAT(found, ElementsAre(Pair("ab", 0), Pair("abc", 0), Pair("bc", 1), Pair("xy", 2)));
}

TEST_F(PreProcessedIndexTest, AnalyzeShowsAKeywordWithItsCharacters) {
  Make(Field(FieldType::kKeyword, kLower), {});
  EXPECT_THAT(Analyze("\xc3\x84 B"), ElementsAre("\xc3\xa4 b"));
  EXPECT_EQ(index_->Analyze("f", "\xc3\x84 B").at(0).end, 3U);
}

TEST_F(PreProcessedIndexTest, WhatIsStoredIsNotTouched) {
  Make(Field(FieldType::kKeyword, kLowerBigrams), {"As It Is"});
  EXPECT_THAT(StoredValues(folder_.path(), 0, "f"), ElementsAre("As It Is"));
}

TEST_F(PreProcessedIndexTest, ADocumentIsDeletedByATermInTheFormItIsIndexedIn) {
  Make(Field(FieldType::kKeyword, kLowerBigrams), {"Abc", "xyz"});
  index_->Delete("f", "bc");
  index_->Commit();
  EXPECT_EQ(index_->CountDocuments().live, 1U);
}

TEST_F(PreProcessedIndexTest, AWordTooShortForAnyGramIsToldAbout) {
  Make(Field(FieldType::kText, kBigrams), {"abc"});
  SearchRequest request;
  request.query = "f:a";
  const SearchResult result = index_->Search(request);
  EXPECT_EQ(result.total, 0U);
  EXPECT_THAT(result.warnings, ElementsAre("nothing of \"a\" is left to search for"));
}

TEST_F(PreProcessedIndexTest, EachGramOfAQueryCountsAsAClause) {
  SearchLimits limits;
  limits.query_clauses = 10;
  for (const auto& [lengths, fits, exceeds] :
       {std::tuple{"2", "abcdefghijk", "abcdefghijkl"}, {"2,3", "abcdef", "abcdefg"}}) {
    const auto index =
        Index::Create(folder_ / lengths, {.fields = {Field(FieldType::kText, {{"ngram", lengths}})}});
    index->Commit();
    SearchRequest request;
    request.query = std::string("f:").append(fits);
    EXPECT_NO_THROW(index->Search(request, SearchPluginRegistry::BuiltIn(), limits)) << lengths;
    request.query = std::string("f:").append(exceeds);
    EXPECT_THROW(index->Search(request, SearchPluginRegistry::BuiltIn(), limits), LimitExceededError)
        << lengths;
  }
}

TEST_F(PreProcessedIndexTest, TheStepsAreKeptWithTheIndex) {
  Make(Field(FieldType::kKeyword, kLowerBigrams), {"Abc"});
  index_ = nullptr;
  index_ = Index::Open(folder_.path());
  EXPECT_EQ(index_->settings().fields.back().pre_processors, kLowerBigrams);
  index_->Add({{{"id", "1"}, {"f", "xABC"}}});
  index_->Commit();
  EXPECT_THAT(Find("f:Abc"), ElementsAre("0", "1"));
}

TEST_F(PreProcessedIndexTest, SettingsFilesOfBeforeThereWereStepsAreRead) {
  Make(Field(FieldType::kKeyword, {}), {"Abc"});
  JsonValue settings;
  ASSERT_TRUE(settings.fromFile(folder_ / "quorelastic.json"));
  EXPECT_FALSE(settings["fields"][1].isMember("pre_processors"));
  EXPECT_THAT(Index::Open(folder_.path())->settings().fields.back().pre_processors, IsEmpty());
}

TEST_F(PreProcessedIndexTest, StepsInASettingsFileThatMakeNoSenseAreRefused) {
  Make(Field(FieldType::kKeyword, kLower), {});
  const std::string file = folder_ / "quorelastic.json";
  JsonValue settings;
  ASSERT_TRUE(settings.fromFile(file));
  Json::Value& steps = settings["fields"][1]["pre_processors"];
  const auto refused = [&](const std::string& problem) {
    WriteFile(file, settings.toString());
    ExpectIndexError(file + ": " + problem, [&] { Index::Open(folder_.path()); });
  };
  steps[0]["name"] = "stem";
  refused("field \"f\": there is no pre-processor \"stem\"");
  steps[0]["name"] = 1;
  refused("pre-processor of field 2 member \"name\" is no string");
  steps[0].removeMember("name");
  refused("pre-processor of field 2 lacks the member \"name\"");
  steps[0]["name"] = "tolower";
  steps[0]["boost"] = 1;
  refused("pre-processor of field 2 has the unknown member \"boost\"");
  steps = "tolower";
  refused("field 2 member \"pre_processors\" is no array");
}

TEST_F(PreProcessedIndexTest, ChainsThatCannotBeBuiltAreRefusedBeforeAnythingIsMade) {
  const auto refusal = [&](const std::vector<PreProcSettings>& steps) -> std::string {
    try {
      Index::Create(folder_ / "index", {.fields = {Field(FieldType::kText, steps)}});
    } catch (const IndexValueError& error) {
      return error.what();
    }
    return "";
  };
  const std::string start = folder_ / "index: field \"f\": ";
  EXPECT_EQ(refusal({{"ToLower", ""}}), start + "there is no pre-processor \"ToLower\"");
  EXPECT_EQ(refusal({{"", ""}}), start + "there is no pre-processor \"\"");
  EXPECT_EQ(refusal({{"tolower", "x"}}), start + "\"tolower\" takes no argument, but got \"x\"");
  EXPECT_THAT(refusal({{"tolower", ""}, {"ngram", "0"}}),
              HasSubstr(start + "\"ngram\" takes lengths from 1 to 255"));
  EXPECT_EQ(refusal(std::vector<PreProcSettings>(9, {"tolower", ""})),
            start + "9 pre-processors are more than 8");
  EXPECT_THAT(ListFolder(folder_.path()), IsEmpty());
}

TEST_F(PreProcessedIndexTest, GramsInAFieldWithoutFrequenciesAreRefused) {
  for (const auto& steps : {kBigrams, kLowerBigrams}) {
    FieldSettings field = Field(FieldType::kText, steps);
    field.frequencies = false;
    ExpectIndexError("field \"f\": \"ngram\" needs frequencies: a word is found as a phrase of its grams",
                     [&] { Index::Create(folder_ / "index", {.fields = {field}}); });
  }
  EXPECT_THAT(ListFolder(folder_.path()), IsEmpty());
  FieldSettings lower = Field(FieldType::kText, kLower);
  lower.frequencies = false;
  Make(lower, {"Alpha"});
  EXPECT_THAT(Find("f:ALPHA"), ElementsAre("0")) << "other steps need none";
}

TEST_F(PreProcessedIndexTest, TheIdIsTakenAsItIs) {
  FieldSettings id = Field(FieldType::kKeyword, kLower);
  id.name = "id";
  EXPECT_THROW(Index::Create(folder_ / "index", {.fields = {id}}), IndexValueError);
  EXPECT_THAT(ListFolder(folder_.path()), IsEmpty());
}

TEST_F(PreProcessedIndexTest, ADocumentThatStepsWouldBlowUpIsRefused) {
  Make(Field(FieldType::kText, {{"ngram", "255"}, {"ngram", "255"}}), {});
  ExpectIndexError("a document whose pre-processors may make of it", [&] {
    index_->Add({{{"id", "0"}, {"f", std::string(5000, 'x')}}});
  });
  index_->Add({{{"id", "1"}, {"f", std::string(300, 'x')}}});
  index_->Commit();
  EXPECT_EQ(index_->CountDocuments().live, 1U);
}

TEST_F(PreProcessedIndexTest, AKeywordThatIsCutHoldsNoZero) {
  Make(Field(FieldType::kKeyword, kLower), {});
  ExpectIndexError("U+0000", [&] { index_->Add({{{"id", "0"}, {"f", std::string("a\0b", 3)}}}); });
}

TEST_F(PreProcessedIndexTest, LongValuesAreCutInFull) {
  std::string value;
  for (int i = 0; i < 5000; ++i) value += std::to_string(i % 10);
  Make(Field(FieldType::kKeyword, {{"ngram", "3"}}), {value + "end"});
  EXPECT_THAT(Find("f:9end"), ElementsAre("0"));
  EXPECT_EQ(index_->Analyze("f", value).size(), value.size() - 2);
}

}  // namespace
}  // namespace vantrel::elastic
