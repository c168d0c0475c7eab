// Many threads at one index: searches beside writers, and writers beside each other.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <filesystem>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "search_fixture.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::Filter;
using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Pieces;
using ::quorelastic::testing::Request;
using ::quorelastic::testing::Values;

// Starts threads, and waits for all of them at the end.
class Threads {
 public:
  Threads() = default;
  Threads(const Threads&) = delete;
  Threads& operator=(const Threads&) = delete;
  ~Threads() { Join(); }

  template <typename Work>
  void Start(Work work) {
    threads_.emplace_back(work);
  }

  void Join() {
    for (std::thread& thread : threads_) thread.join();
    threads_.clear();
  }

 private:
  std::vector<std::thread> threads_;
};

// The open files of this process that are deleted already.
size_t DeletedButOpen(const std::string& folder) {
  size_t count = 0;
  for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
    std::error_code gone;
    const std::string target = std::filesystem::read_symlink(entry.path(), gone).string();
    if (target.starts_with(folder) && target.ends_with(" (deleted)")) ++count;
  }
  return count;
}

std::vector<FieldSettings> Fields() {
  return {{.name = "body"}, {.name = "round", .type = FieldType::kKeyword}};
}

TEST(ConcurrentSearchTest, EverySearchSeesOneCommitAndNothingInBetween) {
  constexpr int kDocuments = 8;
  constexpr int kRounds = 40;
  const OwnIndex index(Fields());
  const auto write_round = [&](int round) {
    for (int i = 0; i < kDocuments; ++i) {
      index->Update(Pieces({"id=" + std::to_string(i), "round=" + std::to_string(round),
                            "body=some words of document w" + std::to_string(i)}));
    }
    if (round % 10 == 9) index->Optimize();
    index->Commit();
  };
  write_round(0);
  std::atomic<bool> done = false;
  std::atomic<int> searches = 0;
  Threads threads;
  for (int reader = 0; reader < 4; ++reader) {
    threads.Start([&, reader] {
      int newest = 0;
      while (!done || searches < 100) {
        SearchRequest request = Request(reader % 2 == 0 ? "words" : "\"some words\" w* documnt~");
        request.filters = {Filter("range", R"({"field":"round","from":0,"numeric":true})")};
        const SearchResult result = index->Search(request);
        ASSERT_EQ(result.total, static_cast<uint64_t>(kDocuments));
        std::set<std::string> rounds;
        for (const SearchHit& hit : result.hits) rounds.insert(Values(hit, "round").at(0));
        ASSERT_EQ(rounds.size(), 1U);
        const int round = std::stoi(*rounds.begin());
        ASSERT_GE(round, newest) << "a commit was seen and is gone";
        newest = round;
        ++searches;
      }
    });
  }
  for (int round = 1; round < kRounds; ++round) write_round(round);
  done = true;
  threads.Join();
  EXPECT_EQ(index->Search(Request("round:" + std::to_string(kRounds - 1))).total,
            static_cast<uint64_t>(kDocuments));
  EXPECT_EQ(DeletedButOpen(index.path()), 0U);
}

TEST(ConcurrentSearchTest, WritersBesideEachOtherLoseNothing) {
  constexpr int kWriters = 4;
  constexpr int kDocuments = 60;
  const OwnIndex index(Fields());
  Threads threads;
  for (int writer = 0; writer < kWriters; ++writer) {
    threads.Start([&, writer] {
      for (int i = 0; i < kDocuments; ++i) {
        const std::string id = std::to_string(writer) + "-" + std::to_string(i);
        index->Update(Pieces({"id=" + id, "body=first"}));
        index->Update(Pieces({"id=" + id, "body=second"}));
        if (i % 3 == 0) index->DeleteById(id);
        if (i % 20 == 19) {
          index->Commit();
          ASSERT_GT(index->Search(Request("second")).total, 0U);
        }
        if (i % 30 == 29) index->Statistics();
      }
    });
  }
  threads.Join();
  index->Commit();
  EXPECT_EQ(index->Search(Request("first")).total, 0U);
  EXPECT_EQ(index->Search(Request("second")).total, uint64_t{kWriters * kDocuments * 2 / 3});
  EXPECT_EQ(index->CountDocuments().live, uint64_t{kWriters * kDocuments * 2 / 3});
}

TEST(ConcurrentSearchTest, ASearchBegunBeforeACommitKeepsItsFiles) {
  const OwnIndex index(Fields());
  index->Update(Pieces({"id=a", "body=word", "round=old"}));
  index->Commit();
  // Changes everything while the search is making its filter, after it took hold of the index.
  class Changer : public SearchPlugin {
   public:
    explicit Changer(const OwnIndex& changed) : changed_(changed) {}
    std::string name() const override { return "changer"; }
    std::string summary() const override { return "changes the index"; }
    Lucene::FilterPtr MakeFilter(const SearchPluginContext& context, const Json::Value&) const override {
      changed_->Update(Pieces({"id=a", "body=word", "round=new"}));
      changed_->Optimize();
      changed_->Commit();
      EXPECT_EQ(Values(changed_->Search(Request("word")).hits.at(0), "round").at(0), "new");
      return SearchPluginRegistry::BuiltIn().Find("ids")->MakeFilter(context,
                                                                     Filter("", R"({"values":["a"]})").data);
    }

   private:
    const OwnIndex& changed_;
  };
  SearchPluginRegistry plugins;
  plugins.Add(std::make_shared<Changer>(index));
  SearchRequest request = Request("word");
  request.filters = {Filter("changer", "null")};
  const SearchResult result = index->Search(request, plugins);
  ASSERT_EQ(result.hits.size(), 1U);
  EXPECT_EQ(Values(result.hits[0], "round").at(0), "old");
  EXPECT_EQ(DeletedButOpen(index.path()), 0U);
}

TEST(ConcurrentSearchTest, ManyIndexesAreSearchedTogetherWhileEachIsWritten) {
  const OwnIndex one(Fields());
  const OwnIndex two(Fields());
  for (const OwnIndex* index : {&one, &two}) {
    (*index)->Update(Pieces({"id=first", "body=word"}));
    (*index)->Commit();
  }
  std::atomic<bool> done = false;
  Threads threads;
  for (int reader = 0; reader < 2; ++reader) {
    threads.Start([&] {
      uint64_t before = 2;
      do {
        const uint64_t total = SearchIndexes({one.shared(), two.shared()}, Request("word")).total;
        ASSERT_GE(total, before);
        before = total;
      } while (!done);
    });
  }
  for (int i = 0; i < 20; ++i) {
    for (const OwnIndex* index : {&one, &two}) {
      (*index)->Add(Pieces({"body=word"}));
      (*index)->Commit();
    }
  }
  done = true;
  threads.Join();
  EXPECT_EQ(SearchIndexes({one.shared(), two.shared()}, Request("word")).total, 42U);
}

}  // namespace
}  // namespace vantrel::elastic
