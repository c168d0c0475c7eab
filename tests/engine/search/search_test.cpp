// What a search sees, and what it hands back.

#include "vantrel/elastic/search.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <string>
#include <thread>

#include "search_fixture.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::Ids;
using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Pieces;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::Request;
using ::quorelastic::testing::SortedIds;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Thrown;
using ::quorelastic::testing::Values;
using ::quorelastic::testing::WriteFile;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::SizeIs;

OwnIndex BodyIndex() { return OwnIndex({{.name = "body"}}); }

TEST(SearchTest, AnEmptyIndexHoldsNothing) {
  const OwnIndex index = BodyIndex();
  const SearchResult result = index->Search(Request("word"));
  EXPECT_EQ(result.total, 0U);
  EXPECT_EQ(result.max_score, 0);
  EXPECT_THAT(result.hits, IsEmpty());
  EXPECT_THAT(result.warnings, IsEmpty());
}

TEST(SearchTest, WhatIsNotCommittedIsNotSeenAndWhatIsIs) {
  const OwnIndex index = BodyIndex();
  index->Add(Pieces({"id=a", "body=word"}));
  EXPECT_THAT(index.Find("word"), IsEmpty());
  index->Commit();
  EXPECT_THAT(index.Find("word"), ElementsAre("a"));
  index->DeleteById("a");
  EXPECT_THAT(index.Find("word"), ElementsAre("a"));
  index->Commit();
  EXPECT_THAT(index.Find("word"), IsEmpty());
}

TEST(SearchTest, EveryCommitIsSeenHoweverSoonItFollowsTheOneBefore) {
  OwnIndex index = BodyIndex();
  for (size_t i = 1; i <= 60; ++i) {
    index.Add({"id=" + std::to_string(i), "body=word"});
    ASSERT_EQ(index->Search(Request("word")).total, i);
  }
}

TEST(SearchTest, ACommitOfAnotherWriterIsSeen) {
  OwnIndex index = BodyIndex();
  const auto reader = Index::Open(index.path());
  EXPECT_EQ(reader->Search(Request("word")).total, 0U);
  for (size_t i = 1; i <= 20; ++i) {
    index.Add({"id=" + std::to_string(i), "body=word"});
    ASSERT_EQ(reader->Search(Request("word")).total, i);
  }
  index->Optimize();
  index->Commit();
  EXPECT_EQ(reader->Search(Request("word")).total, 20U);
}

TEST(SearchTest, AnotherIndexPutInTheFoldersPlaceIsSeen) {
  const TemporaryFolder folder;
  IndexSettings settings;
  settings.fields = {{.name = "body"}};
  const auto make = [&](const std::string& name, const std::string& id) {
    const auto index = Index::Create(folder / name, settings);
    index->Add(Pieces({"id=" + id, "body=word"}));
    index->Commit();
  };
  make("one", "a");
  make("two", "b");
  const auto index = Index::Open(folder / "one");
  ASSERT_THAT(SortedIds(index->Search(Request("word"))), ElementsAre("a"));
  std::filesystem::rename(folder / "one", folder / "away");
  std::filesystem::rename(folder / "two", folder / "one");
  EXPECT_THAT(SortedIds(index->Search(Request("word"))), ElementsAre("b"));
}

TEST(SearchTest, PagesPutTogetherAreTheWholeOrder) {
  const OwnIndex index = BodyIndex();
  for (int i = 0; i < 57; ++i) {
    std::string body = "word";
    for (int j = 0; j < i % 7; ++j) body += " other";
    index->Add(Pieces({"id=" + std::to_string(i), "body=" + body}));
    if (i % 10 == 0) index->Commit();
  }
  index->Commit();
  const SearchResult whole = index->Search(Request("word"));
  ASSERT_THAT(whole.hits, SizeIs(57));
  EXPECT_EQ(whole.max_score, whole.hits.front().score);
  for (const uint64_t size : {1u, 5u, 13u, 100u}) {
    std::vector<std::string> pages;
    for (uint64_t from = 0; from < 60; from += size) {
      SearchRequest request = Request("word");
      request.from = from;
      request.size = size;
      const SearchResult page = index->Search(request);
      EXPECT_EQ(page.total, 57U);
      EXPECT_EQ(page.max_score, whole.max_score);
      EXPECT_LE(page.hits.size(), size);
      for (const std::string& id : Ids(page)) pages.push_back(id);
    }
    EXPECT_EQ(pages, Ids(whole)) << size;
  }
}

TEST(SearchTest, EqualScoresComeInTheOrderOfAdding) {
  OwnIndex index = BodyIndex();
  for (const char* id : {"z", "m", "a", "k"}) index.Add({std::string("id=") + id, "body=same word"});
  EXPECT_THAT(Ids(index->Search(Request("word"))), ElementsAre("z", "m", "a", "k"));
  EXPECT_THAT(Ids(index->Search(Request("*:*"))), ElementsAre("z", "m", "a", "k"));
}

TEST(SearchTest, NoHitsCanBeAskedForAndPagesPastTheEndAreEmpty) {
  OwnIndex index = BodyIndex();
  index.Add({"id=a", "body=word"});
  SearchRequest request = Request("word");
  request.size = 0;
  EXPECT_EQ(index->Search(request).total, 1U);
  EXPECT_GT(index->Search(request).max_score, 0);
  EXPECT_THAT(index->Search(request).hits, IsEmpty());
  request.from = 1;
  request.size = 10;
  EXPECT_EQ(index->Search(request).total, 1U);
  EXPECT_THAT(index->Search(request).hits, IsEmpty());
}

TEST(SearchTest, TheWindowEndsWhereItsLimitIs) {
  OwnIndex index = BodyIndex();
  index.Add({"id=a", "body=word"});
  SearchRequest request = Request("word");
  const uint64_t most = SearchLimits().window;
  const auto refused = [&](uint64_t from, uint64_t size) {
    request.from = from;
    request.size = size;
    try {
      index->Search(request);
      return false;
    } catch (const LimitExceededError& error) {
      EXPECT_EQ(error.limit(), "window");
      EXPECT_EQ(error.most(), most);
      return true;
    }
  };
  EXPECT_FALSE(refused(0, most));
  EXPECT_FALSE(refused(most, 0));
  EXPECT_TRUE(refused(1, most));
  EXPECT_TRUE(refused(UINT64_MAX, 1));
  EXPECT_TRUE(refused(1, UINT64_MAX));
}

TEST(SearchTest, StoredFieldsComeInTheSettingsOrderWithAllTheirValues) {
  OwnIndex index({{.name = "title"},
                  {.name = "hidden", .stored = false},
                  {.name = "tag", .type = FieldType::kKeyword},
                  {.name = "unused"}});
  index.Add({"tag=x", "hidden=word", "title=Ein Wort 😀", "id=a", "tag=y", "tag=x"});
  SearchRequest request = Request("hidden:word");
  const auto all = index->Search(request).hits;
  ASSERT_THAT(all, SizeIs(1));
  ASSERT_THAT(all[0].fields, SizeIs(3));
  EXPECT_EQ(all[0].id, "a");
  EXPECT_EQ(all[0].fields[0].name, "id");
  EXPECT_EQ(all[0].fields[1].name, "title");
  EXPECT_EQ(all[0].fields[2].name, "tag");
  EXPECT_THAT(Values(all[0], "title"), ElementsAre("Ein Wort 😀"));
  EXPECT_THAT(Values(all[0], "tag"), ElementsAre("x", "y", "x"));
}

TEST(SearchTest, OnlyTheFieldsAskedForAreLoadedAndAMissingOneIsTold) {
  OwnIndex index({{.name = "title"}, {.name = "body"}, {.name = "hidden", .stored = false}});
  index.Add({"id=a", "title=one", "body=two", "hidden=three"});
  SearchRequest request = Request("two");
  request.load_fields = std::vector<std::string>{"body", "colour", "hidden"};
  const SearchResult result = index->Search(request);
  ASSERT_THAT(result.hits, SizeIs(1));
  EXPECT_EQ(result.hits[0].id, "a");
  ASSERT_THAT(result.hits[0].fields, SizeIs(1));
  EXPECT_EQ(result.hits[0].fields[0].name, "body");
  EXPECT_THAT(result.warnings, ElementsAre("there is no stored field \"colour\" to load",
                                           "there is no stored field \"hidden\" to load"));
  request.load_fields->clear();
  EXPECT_THAT(index->Search(request).hits[0].fields, IsEmpty());
  EXPECT_EQ(index->Search(request).hits[0].id, "a");
}

TEST(SearchTest, ADocumentWithoutAnIdIsFoundWithoutOne) {
  OwnIndex index = BodyIndex();
  index.Add({"body=word"});
  EXPECT_THAT(index.Find("word"), ElementsAre(""));
}

TEST(SearchTest, StoredValuesTogetherHaveALimit) {
  OwnIndex index = BodyIndex();
  for (const char* id : {"a", "b", "c"})
    index.Add({std::string("id=") + id, "body=word " + std::string(1000, '.')});
  SearchLimits limits;
  limits.result_bytes = 3500;
  EXPECT_EQ(index->Search(Request("word"), SearchPluginRegistry::BuiltIn(), limits).hits.size(), 3U);
  limits.result_bytes = 2500;
  EXPECT_EQ(Thrown<LimitExceededError>([&] {
              index->Search(Request("word"), SearchPluginRegistry::BuiltIn(), limits);
            }).limit(),
            "result_bytes");
}

TEST(SearchTest, ASearchThatTakesTooLongIsGivenUp) {
  const OwnIndex index = BodyIndex();
  for (int i = 0; i < 5000; ++i) index->Add(Pieces({"body=word"}));
  index->Commit();
  SearchRequest request = Request("word");
  request.time_limit = std::chrono::milliseconds::max();
  EXPECT_EQ(index->Search(request).total, 5000U);
  request.time_limit = std::chrono::hours(1);
  EXPECT_EQ(index->Search(request).total, 5000U);
  // A filter that dawdles: the library asks it for the documents of each segment.
  class Dawdler : public SearchPlugin {
   public:
    std::string name() const override { return "dawdler"; }
    std::string summary() const override { return "takes its time"; }
    Lucene::FilterPtr MakeFilter(const SearchPluginContext& context, const Json::Value& data) const override {
      std::this_thread::sleep_for(std::chrono::milliseconds(20));
      return SearchPluginRegistry::BuiltIn().Find("range")->MakeFilter(context, data);
    }
  };
  SearchPluginRegistry plugins;
  plugins.Add(std::make_shared<Dawdler>());
  request.filters = {::quorelastic::testing::Filter("dawdler", R"({"field":"body","from":""})")};
  EXPECT_EQ(index->Search(request, plugins).total, 5000U);
  request.time_limit = std::chrono::milliseconds(1);
  EXPECT_THROW(index->Search(request, plugins), SearchTimeoutError);
  EXPECT_EQ(index->Search(Request("word")).total, 5000U);
}

TEST(SearchTest, ADamagedCommitIsReportedAndTheIndexIsUsableOnceItIsWhole) {
  OwnIndex index = BodyIndex();
  index.Add({"id=a", "body=word"});
  const auto reader = Index::Open(index.path());
  const std::string whole = ReadFile(index.path() + "/segments_2");
  std::string damaged = whole;
  damaged[12] = static_cast<char>(damaged[12] ^ 0x20);
  WriteFile(index.path() + "/segments_2", damaged);
  const IndexDamagedError error = Thrown<IndexDamagedError>([&] { reader->Search(Request("word")); });
  EXPECT_THAT(error.what(), HasSubstr("segments_2"));
  WriteFile(index.path() + "/segments_2", whole);
  EXPECT_EQ(reader->Search(Request("word")).total, 1U);
}

TEST(SearchTest, AMissingFileIsNamed) {
  OwnIndex index = BodyIndex();
  index.Add({"id=a", "body=word"});
  const auto reader = Index::Open(index.path());
  std::filesystem::remove(index.path() + "/_0.cfs");
  EXPECT_THAT(Thrown<IndexError>([&] { reader->Search(Request("word")); }).what(), HasSubstr("_0.cfs"));
  std::filesystem::remove_all(index.path());
  EXPECT_THROW(reader->Search(Request("word")), IndexIoError);
  std::filesystem::create_directory(index.path());
}

}  // namespace
}  // namespace vantrel::elastic
