// Searches that walk far and find nothing: the time limit holds for them as well.

#include <gmock/gmock.h>

#include <chrono>
#include <string>
#include <vector>

#include "search_fixture.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search_error.h"

namespace quorelastic::testing {
namespace {

using std::chrono::milliseconds;
using namespace vantrel::elastic;

class TimeLimitTest : public ::testing::Test {
 protected:
  // Words that are everywhere and never side by side, and a word of its own in every document.
  static void SetUpTestSuite() {
    index_ = new OwnIndex({{.name = "body"}});
    for (int i = 0; i < kDocuments; ++i) {
      (*index_)->Add(Pieces({"body=left between right own" + std::to_string(i)}));
    }
    (*index_)->Commit();
  }

  static void TearDownTestSuite() { delete index_; }

  // The search finds nothing and takes much longer than the limit, on any machine. The clock is not looked at after
  // a search: where it is given up, that was under way.
  static void ExpectGivenUp(SearchRequest request) {
    EXPECT_EQ((*index_)->Search(request).total, 0U);
    request.time_limit = milliseconds(1);
    EXPECT_THROW((*index_)->Search(request), SearchTimeoutError);
  }

  static constexpr int kDocuments = 60000;
  static OwnIndex* index_;
};

OwnIndex* TimeLimitTest::index_ = nullptr;

TEST_F(TimeLimitTest, HoldsForAPhraseWhoseWordsNeverMeet) { ExpectGivenUp(Request("\"left right\"")); }

TEST_F(TimeLimitTest, HoldsForAPatternThatNoTermFits) { ExpectGivenUp(Request("*nowhere*")); }

TEST_F(TimeLimitTest, HoldsForAWordThatNoTermIsLike) { ExpectGivenUp(Request("elsewhere~0.6")); }

TEST_F(TimeLimitTest, HoldsForARangeThatIsLeftOut) { ExpectGivenUp(Request("+own* -[own TO p]")); }

TEST_F(TimeLimitTest, HoldsForWordsThatExcludeEachOther) {
  std::string query;
  for (int i = 0; i < 30; ++i) query += "(+left -right) ";
  ExpectGivenUp(Request(query));
}

TEST_F(TimeLimitTest, HoldsWhereEveryDocumentIsPassedOver) {
  std::string query;
  for (int i = 0; i < 15; ++i) query += "(+*:* -*:*) ";
  ExpectGivenUp(Request(query));
}

TEST_F(TimeLimitTest, HoldsForAFilterOfManyValues) {
  std::string values;
  for (int i = 0; i < 65000; ++i) values += R"("own)" + std::to_string(i) + R"(x",)";
  values.back() = ']';
  SearchRequest request = Request("left");
  request.filters = {Filter("term", R"({"field":"body","values":[)" + values + "}")};
  ExpectGivenUp(request);
}

TEST_F(TimeLimitTest, HoldsForAFilterThatLooksAtEveryValue) {
  SearchRequest request = Request("left");
  request.filters = {Filter("range", R"({"field":"body","from":1,"numeric":true})")};
  ExpectGivenUp(request);
}

TEST_F(TimeLimitTest, ThatIsNotReachedChangesNothing) {
  for (const char* query :
       {"left", "\"left between\"", "\"between right\" own12", "own1*", "*7", "left -own5", "own123~",
        "own12 own13", "+left +own77", "[own12 TO own13]", "*:*"}) {
    SearchRequest request = Request(query);
    const SearchResult plain = (*index_)->Search(request);
    request.time_limit = std::chrono::hours(1);
    const SearchResult timed = (*index_)->Search(request);
    EXPECT_GT(timed.total, 0U) << query;
    EXPECT_EQ(timed.total, plain.total) << query;
    EXPECT_EQ(timed.max_score, plain.max_score) << query;
    EXPECT_EQ(Ids(timed), Ids(plain)) << query;
  }
}

}  // namespace
}  // namespace quorelastic::testing
