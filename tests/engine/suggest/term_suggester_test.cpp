#include "vantrel/elastic/term_suggester.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <stdexcept>
#include <type_traits>

#include "support/expect_damage.h"
#include "support/library_index.h"
#include "support/numbered.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_container.h"
#include "vantrel/elastic/prefix_term_suggester.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::Numbered;
using ::quorelastic::testing::TemporaryFolder;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;

// Programs that were built earlier make these objects themselves.
static_assert(std::is_polymorphic_v<TermSuggester> && std::is_polymorphic_v<Suggestion>);
static_assert(std::is_abstract_v<TermSuggesterImpl> &&
              std::is_base_of_v<TermSuggesterImpl, PrefixTermSuggester>);
static_assert(sizeof(TermSuggesterImpl) == sizeof(void*));
static_assert(sizeof(TermSuggester) ==
              sizeof(void*) + sizeof(std::vector<std::shared_ptr<TermSuggesterImpl>>));
static_assert(sizeof(PrefixTermSuggester) == sizeof(void*) + 8 + sizeof(std::vector<std::shared_ptr<Index>>));
static_assert(sizeof(Suggestion) == sizeof(void*) + sizeof(std::string) + sizeof(Json::Value));

static_assert(std::is_nothrow_move_constructible_v<Suggestion> &&
              std::is_nothrow_move_assignable_v<Suggestion>);

std::vector<std::string> Rendered(const std::vector<Suggestion>& suggestions) {
  std::vector<std::string> lines;
  lines.reserve(suggestions.size());
  for (const Suggestion& suggestion : suggestions) {
    lines.push_back(suggestion.type() + " " + suggestion.payload().toString());
  }
  return lines;
}

// Offers what it is told to, and remembers how much it was asked for.
class FakeBackEnd : public TermSuggesterImpl {
 public:
  explicit FakeBackEnd(std::vector<Suggestion> offered) : offered_(std::move(offered)) {}

  std::vector<Suggestion> Suggest(const std::string& /*field*/, const std::string& /*prefix*/,
                                  uint64_t most) const override {
    asked_for_ = most;
    return offered_;
  }

  uint64_t asked_for() const { return asked_for_; }

 private:
  std::vector<Suggestion> offered_;
  mutable uint64_t asked_for_ = 0;
};

Suggestion MakeSuggestion(const std::string& type, const Json::Value& frequency, const std::string& term) {
  JsonValue payload;
  payload["doc_freq"] = frequency;
  payload["term"] = term;
  return {type, payload};
}

class TermSuggesterTest : public ::testing::Test {
 protected:
  TermSuggesterTest() {
    for (int i = 0; i < 30; ++i) index_.Add({{.name = "f", .value = i < 3 ? "tea team" : Numbered("t", i)}});
    index_.Commit();
  }

  std::shared_ptr<Index> Get() const { return IndexContainer::Instance()->IndexGet(folder_ / ""); }

  std::vector<std::string> Ask(int most_offered, unsigned int skip, int limit) const {
    TermSuggester suggester;
    suggester.AddBackEnd(
        std::make_shared<PrefixTermSuggester>(std::vector<std::shared_ptr<Index>>{Get()}, most_offered));
    return Rendered(suggester.GetSuggest("f", "t", skip, limit));
  }

  TemporaryFolder folder_;
  LibraryIndex index_{folder_.path()};
};

TEST_F(TermSuggesterTest, WithoutBackEndsNothingIsSuggested) {
  EXPECT_THAT(TermSuggester().GetSuggest("f", "t", 0, 10), IsEmpty());
}

TEST_F(TermSuggesterTest, APrefixSuggestionTellsTheTermAndItsDocuments) {
  EXPECT_THAT(Ask(10, 0, 3),
              ElementsAre(R"(prefix {"doc_freq":3,"term":"tea"})", R"(prefix {"doc_freq":3,"term":"team"})",
                          R"(prefix {"doc_freq":1,"term":"t10"})"));
}

TEST_F(TermSuggesterTest, ABackEndOffersNoMoreThanItsNumber) {
  EXPECT_THAT(Ask(10, 0, 100), SizeIs(10));
  EXPECT_THAT(Ask(1, 0, 100), SizeIs(1));
  EXPECT_THAT(Ask(0, 0, 100), IsEmpty());
  EXPECT_THAT(Ask(-1, 0, 100), IsEmpty());
  EXPECT_THAT(Ask(std::numeric_limits<int32_t>::max(), 0, 100), SizeIs(29));
}

TEST_F(TermSuggesterTest, SkipsFromTheFrontAndStopsAtTheLimit) {
  EXPECT_THAT(Ask(10, 1, 2),
              ElementsAre(R"(prefix {"doc_freq":3,"term":"team"})", R"(prefix {"doc_freq":1,"term":"t10"})"));
  EXPECT_THAT(Ask(10, 8, 10), SizeIs(2)) << "only ten are offered";
  EXPECT_THAT(Ask(10, 10, 10), IsEmpty());
  EXPECT_THAT(Ask(10, std::numeric_limits<unsigned int>::max(), std::numeric_limits<int>::max()), IsEmpty());
}

TEST_F(TermSuggesterTest, ALimitOfNothingOrLessAsksNobody) {
  EXPECT_THAT(Ask(10, 0, 0), IsEmpty());
  EXPECT_THAT(Ask(10, 0, -1), IsEmpty());
  EXPECT_THAT(Ask(10, 0, std::numeric_limits<int>::min()), IsEmpty());
}

TEST_F(TermSuggesterTest, SeveralBackEndsArePutInOneOrder) {
  const auto one = std::make_shared<FakeBackEnd>(
      std::vector<Suggestion>{MakeSuggestion("one", 9, "z"), MakeSuggestion("one", 2, "b")});
  const auto two = std::make_shared<FakeBackEnd>(
      std::vector<Suggestion>{MakeSuggestion("two", 10, "y"), MakeSuggestion("two", 2, "a")});
  TermSuggester suggester;
  suggester.AddBackEnd(one);
  suggester.AddBackEnd(nullptr);
  suggester.AddBackEnd(two);
  EXPECT_THAT(Rendered(suggester.GetSuggest("f", "t", 1, 2)),
              ElementsAre(R"(one {"doc_freq":9,"term":"z"})", R"(two {"doc_freq":2,"term":"a"})"));
  EXPECT_EQ(one->asked_for(), 3U) << "what is skipped has to be known";
}

TEST_F(TermSuggesterTest, ComparesFrequenciesAsNumbersOfAnyType) {
  constexpr auto kMost = std::numeric_limits<uint64_t>::max();
  TermSuggester suggester;
  suggester.AddBackEnd(std::make_shared<FakeBackEnd>(std::vector<Suggestion>{
      MakeSuggestion("signed", Json::Int64{300}, "c"), MakeSuggestion("small", 2, "e"),
      MakeSuggestion("negative", -1, "f"), MakeSuggestion("text", "1000", "g")}));
  suggester.AddBackEnd(std::make_shared<FakeBackEnd>(std::vector<Suggestion>{
      MakeSuggestion("unsigned", Json::UInt64{kMost}, "z"),
      MakeSuggestion("unsigned", Json::UInt64{300}, "b"), MakeSuggestion("unsigned", 299U, "a"),
      MakeSuggestion("unsigned", Json::UInt64{2}, "d")}));
  std::vector<std::string> terms;
  for (const Suggestion& suggestion : suggester.GetSuggest("f", "t", 0, 100)) {
    terms.push_back(suggestion.payload()["term"].asString());
  }
  EXPECT_THAT(terms, ElementsAre("z", "b", "c", "a", "d", "e", "f", "g"));
}

TEST_F(TermSuggesterTest, SuggestionsMoveWithoutACopy) {
  const std::string term(1000, 't');
  Suggestion first = MakeSuggestion(std::string(100, 'x'), 1, term);
  const char* const type = first.type().data();
  Suggestion second = std::move(first);
  EXPECT_EQ(second.type().data(), type) << "the text was copied";
  EXPECT_EQ(second.payload()["term"].asString(), term);
  Suggestion third = MakeSuggestion("y", 2, "u");
  third = std::move(second);
  EXPECT_EQ(third.type().data(), type);
  const Suggestion copy = third;
  EXPECT_EQ(Rendered({copy}), Rendered({third}));
}

TEST_F(TermSuggesterTest, WhatABackEndThrowsPassesOn) {
  struct Failing : TermSuggesterImpl {
    std::vector<Suggestion> Suggest(const std::string&, const std::string&, uint64_t) const override {
      throw std::domain_error("no suggestions today");
    }
  };
  TermSuggester suggester;
  suggester.AddBackEnd(std::make_shared<Failing>());
  EXPECT_THROW(suggester.GetSuggest("f", "t", 0, 10), std::domain_error);
}

TEST_F(TermSuggesterTest, AnIndexIsOpenedWhenItIsAskedNotWhenItIsNamed) {
  const auto missing = IndexContainer::Instance()->IndexGet(folder_ / "missing");
  ASSERT_NE(missing, nullptr);
  TermSuggester suggester;
  suggester.AddBackEnd(
      std::make_shared<PrefixTermSuggester>(std::vector<std::shared_ptr<Index>>{missing}, 10));
  ExpectIndexError(folder_ / "missing: cannot open index folder",
                   [&] { suggester.GetSuggest("f", "t", 0, 10); });
}

TEST_F(TermSuggesterTest, SharesItsBackEnds) {
  const auto back_end = std::make_shared<FakeBackEnd>(std::vector<Suggestion>());
  {
    TermSuggester suggester;
    suggester.AddBackEnd(back_end);
    EXPECT_EQ(back_end.use_count(), 2);
  }
  EXPECT_EQ(back_end.use_count(), 1);
}

TEST_F(TermSuggesterTest, SharesItsIndexesAndPassesOverThoseThatAreNone) {
  const auto index = Get();
  const long before = index.use_count();
  const std::vector<std::shared_ptr<Index>> indexes = {index, nullptr};
  {
    const PrefixTermSuggester suggester(indexes, 10);
    EXPECT_EQ(index.use_count(), before + 2) << "the list and its copy";
    EXPECT_THAT(suggester.Suggest("f", "tea", 10), SizeIs(2));
  }
  EXPECT_EQ(index.use_count(), before + 1);
}

TEST_F(TermSuggesterTest, AnIndexThatIsNotThereIsAnErrorThatNamesIt) {
  const auto missing = IndexContainer::Instance()->IndexGet(folder_ / "missing");
  const PrefixTermSuggester suggester({Get(), missing}, 10);
  ExpectIndexError(folder_ / "missing: cannot open index folder", [&] { suggester.Suggest("f", "t", 10); });
}

}  // namespace
}  // namespace vantrel::elastic
