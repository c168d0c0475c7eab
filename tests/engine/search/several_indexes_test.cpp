// Searches over several indexes at once.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <string>
#include <vector>

#include "search_fixture.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::Filter;
using ::quorelastic::testing::Ids;
using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Pieces;
using ::quorelastic::testing::Request;
using ::quorelastic::testing::Thrown;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;

std::vector<FieldSettings> Fields() {
  return {{.name = "title"}, {.name = "body"}, {.name = "kind", .type = FieldType::kKeyword}};
}

// The same random documents in one index and, in runs one after another, in three.
class SplitIndexTest : public ::testing::Test {
 protected:
  SplitIndexTest() {
    std::mt19937 random(7);
    constexpr int kDocuments = 300;
    for (int i = 0; i < kDocuments; ++i) {
      const std::string title = Words(random, 3);
      const std::string body = Words(random, 12);
      const Document document = Pieces({"id=" + std::to_string(i), "title=" + title, "body=" + body,
                                        "kind=k" + std::to_string(random() % 5)});
      whole_->Add(document);
      (*parts_[static_cast<size_t>(i * 3 / kDocuments)])->Add(document);
    }
    whole_->Commit();
    for (const auto& part : parts_) (*part)->Commit();
  }

  static std::string Words(std::mt19937& random, unsigned most) {
    std::string text;
    for (auto i = random() % most; i < most; ++i) {
      text.append("w").append(std::to_string(random() % 10 * (random() % 10))).append(" ");
    }
    return text;
  }

  std::vector<std::shared_ptr<Index>> parts() const {
    std::vector<std::shared_ptr<Index>> parts;
    for (const auto& part : parts_) parts.push_back(part->shared());
    return parts;
  }

  OwnIndex whole_{Fields()};
  std::vector<std::unique_ptr<OwnIndex>> parts_ = [] {
    std::vector<std::unique_ptr<OwnIndex>> parts;
    parts.reserve(3);
    for (int i = 0; i < 3; ++i) parts.push_back(std::make_unique<OwnIndex>(Fields()));
    return parts;
  }();
};

TEST_F(SplitIndexTest, IsSearchedAsIfItWereWhole) {
  for (const char* query : {"w0", "w1 w63", "title:w12 body:w12", "+w3 -w4", "\"w0 w0\"", "w3* -w36",
                            "kind:k3 w7", "w8^3 w9", "body:[w2 TO w4]", "*:*", "(w1 AND w2) (w5 OR w72)"}) {
    SearchRequest request = Request(query);
    request.filters = {Filter("term", R"({"field":"kind","values":["k1","k2","k3"]})")};
    const SearchResult whole = whole_->Search(request);
    const SearchResult split = SearchIndexes(parts(), request);
    EXPECT_GT(whole.total, 0U) << query;
    EXPECT_EQ(split.total, whole.total) << query;
    EXPECT_EQ(Ids(split), Ids(whole)) << query;
    EXPECT_DOUBLE_EQ(split.max_score, whole.max_score) << query;
    ASSERT_EQ(split.hits.size(), whole.hits.size()) << query;
    for (size_t i = 0; i < whole.hits.size(); ++i) {
      EXPECT_DOUBLE_EQ(split.hits[i].score, whole.hits[i].score) << query;
      EXPECT_EQ(split.hits[i].index, static_cast<size_t>(std::stoi(whole.hits[i].id)) / 100) << query;
    }
  }
}

TEST_F(SplitIndexTest, IsPagedAsIfItWereWhole) {
  for (uint64_t from = 0; from < 300; from += 31) {
    SearchRequest request = Request("w0 w1 w2");
    request.from = from;
    request.size = 31;
    EXPECT_EQ(Ids(SearchIndexes(parts(), request)), Ids(whole_->Search(request))) << from;
  }
}

TEST(SeveralIndexesTest, EachUnderstandsTheQueryByItsOwnSettings) {
  OwnIndex words({{.name = "name"}});
  OwnIndex names({{.name = "name", .type = FieldType::kKeyword}});
  words.Add({"id=word", "name=New York"});
  names.Add({"id=name", "name=New York"});
  const SearchResult by_word = SearchIndexes({words.shared(), names.shared()}, Request("name:york"));
  ASSERT_THAT(Ids(by_word), ElementsAre("word"));
  EXPECT_EQ(by_word.hits[0].index, 0U);
  const SearchResult by_name = SearchIndexes({names.shared(), words.shared()}, Request("name:\"New York\""));
  EXPECT_THAT(by_name.hits, SizeIs(2));
  EXPECT_EQ(by_name.query, "name:New York");
}

TEST(SeveralIndexesTest, AFieldThatOneOfThemLacksIsToldOnce) {
  OwnIndex with({{.name = "body"}});
  OwnIndex without({{.name = "text"}});
  with.Add({"id=a", "body=word"});
  const SearchResult result =
      SearchIndexes({without.shared(), with.shared(), without.shared()}, Request("body:word"));
  EXPECT_THAT(Ids(result), ElementsAre("a"));
  EXPECT_EQ(result.hits.at(0).index, 1U);
  EXPECT_THAT(result.warnings, ElementsAre("there is no field \"body\""));
}

TEST(SeveralIndexesTest, AnEmptyOneBesideOthersChangesNothing) {
  OwnIndex full({{.name = "body"}});
  const OwnIndex empty({{.name = "body"}});
  full.Add({"id=a", "body=one word"});
  full.Add({"id=b", "body=word"});
  const SearchResult alone = full->Search(Request("word"));
  const SearchResult beside = SearchIndexes({empty.shared(), full.shared()}, Request("word"));
  EXPECT_EQ(Ids(beside), Ids(alone));
  EXPECT_DOUBLE_EQ(beside.max_score, alone.max_score);
}

TEST(SeveralIndexesTest, NoneAtAllHoldNothingAndTooManyAreRefused) {
  const SearchResult nothing = SearchIndexes({}, Request("word"));
  EXPECT_EQ(nothing.total, 0U);
  EXPECT_THAT(nothing.hits, IsEmpty());
  const OwnIndex index({{.name = "body"}});
  const std::vector<std::shared_ptr<Index>> many(SearchLimits().indexes + 1, index.shared());
  EXPECT_EQ(Thrown<LimitExceededError>([&] { SearchIndexes(many, Request("word")); }).limit(), "indexes");
}

}  // namespace
}  // namespace vantrel::elastic
