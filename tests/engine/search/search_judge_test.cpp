// Random queries over random documents, judged by the documents themselves and by the index library.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <algorithm>
#include <map>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "search_fixture.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search.h"

namespace vantrel::elastic {
namespace {

using ::Lucene::newLucene;
using ::Lucene::StringUtils;
using ::quorelastic::testing::Filter;
using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Pieces;
using ::quorelastic::testing::Request;

constexpr int kWords = 12;

// Documents of words w0 to w11, some of them replaced and deleted again.
class SearchJudgeTest : public ::testing::TestWithParam<unsigned> {
 protected:
  void SetUp() override {
    for (int round = 0; round < 6; ++round) {
      for (int i = 0; i < 25; ++i) Put(std::to_string(Pick(80)));
      for (int i = 0; i < 4; ++i) Remove(std::to_string(Pick(80)));
      index_->Commit();
    }
    ASSERT_EQ(index_->CountDocuments().live, documents_.size());
  }

  int Pick(int below) { return static_cast<int>(random_() % static_cast<unsigned>(below)); }
  std::string PickWord() { return "w" + std::to_string(Pick(kWords)); }

  void Put(const std::string& id) {
    std::vector<std::string> words;
    for (int i = Pick(10) + 1; i > 0; --i) words.push_back(PickWord());
    std::string body;
    for (const std::string& word : words) body += word + " ";
    const int number = Pick(200) - 100;
    index_->Update(Pieces({"id=" + id, "body=" + body, "number=" + std::to_string(number)}));
    documents_[id] = {words, number};
  }

  void Remove(const std::string& id) {
    index_->DeleteById(id);
    documents_.erase(id);
  }

  struct Known {
    std::vector<std::string> words;
    int number = 0;

    bool Has(const std::string& word) const {
      return std::find(words.begin(), words.end(), word) != words.end();
    }
    bool HasPhrase(const std::string& a, const std::string& b) const {
      for (size_t i = 1; i < words.size(); ++i) {
        if (words[i - 1] == a && words[i] == b) return true;
      }
      return false;
    }
  };

  template <typename Judge>
  std::vector<std::string> Judged(Judge judge) const {
    std::vector<std::string> ids;
    for (const auto& [id, document] : documents_) {
      if (judge(document)) ids.push_back(id);
    }
    return ids;
  }

  std::mt19937 random_{GetParam()};
  OwnIndex index_{{{.name = "body"}, {.name = "number", .type = FieldType::kKeyword}}};
  std::map<std::string, Known> documents_;
};

TEST_P(SearchJudgeTest, FindsWhatTheDocumentsSay) {
  for (int i = 0; i < 30; ++i) {
    const std::string a = PickWord();
    const std::string b = PickWord();
    const std::string c = PickWord();
    const std::map<std::string, std::vector<std::string>> expected = {
        {a, Judged([&](const Known& d) { return d.Has(a); })},
        {a + " " + b, Judged([&](const Known& d) { return d.Has(a) || d.Has(b); })},
        {"+" + a + " +" + b + " -" + c,
         Judged([&](const Known& d) { return d.Has(a) && d.Has(b) && !d.Has(c); })},
        {"(" + a + " OR " + b + ") AND NOT " + c,
         Judged([&](const Known& d) { return (d.Has(a) || d.Has(b)) && !d.Has(c); })},
        {"\"" + a + " " + b + "\"", Judged([&](const Known& d) { return d.HasPhrase(a, b); })},
        {"w1*", Judged([&](const Known& d) { return d.Has("w1") || d.Has("w10") || d.Has("w11"); })},
        {"w?", Judged([&](const Known& d) {
           return std::any_of(d.words.begin(), d.words.end(),
                              [](const auto& word) { return word.size() == 2; });
         })},
    };
    for (const auto& [query, ids] : expected) EXPECT_EQ(index_.Find(query), ids) << query;
  }
}

TEST_P(SearchJudgeTest, FiltersKeepWhatTheDocumentsSay) {
  for (int i = 0; i < 20; ++i) {
    const std::string word = PickWord();
    const int from = Pick(200) - 100;
    const int to = from + Pick(100);
    const std::string numeric = R"({"field":"number","from":)" + std::to_string(from) + R"(,"to":")" +
                                std::to_string(to) + R"(","include_upper":false,"numeric":true})";
    EXPECT_EQ(index_.Find(word, {Filter("range", numeric)}),
              Judged([&](const Known& d) { return d.Has(word) && d.number >= from && d.number < to; }))
        << numeric;
    const std::string lower = std::to_string(from);
    const std::string upper = std::to_string(to);
    const std::string lexical =
        R"({"field":"number","from":")" + lower + R"(","include_lower":false,"to":")" + upper + R"("})";
    EXPECT_EQ(index_.Find("*:*", {Filter("range", lexical)}), Judged([&](const Known& d) {
                const std::string text = std::to_string(d.number);
                return text > lower && text <= upper;
              }))
        << lexical;
    const std::string other = PickWord();
    EXPECT_EQ(index_.Find("*", {Filter("term", R"({"field":"body","values":[")" + word + R"("]})"),
                                Filter("term", R"({"field":"body","values":[")" + other + R"(","none"]})"),
                                Filter("", "null")}),
              Judged([&](const Known& d) { return d.Has(word) && d.Has(other); }));
  }
}

// The same search through the index library alone.
struct LibraryHit {
  std::string id;
  double score;
};

std::vector<LibraryHit> LibrarySearch(const std::string& path, const Lucene::QueryPtr& query) {
  const auto reader =
      Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(path)), true);
  const auto searcher = newLucene<Lucene::IndexSearcher>(reader);
  std::vector<LibraryHit> hits;
  const Lucene::TopDocsPtr found = searcher->search(query, 1000);
  for (const Lucene::ScoreDocPtr& hit : found->scoreDocs) {
    hits.push_back({StringUtils::toUTF8(reader->document(hit->doc)->get(L"id")), hit->score});
  }
  return hits;
}

Lucene::QueryPtr Term(const std::string& word) {
  return newLucene<Lucene::TermQuery>(newLucene<Lucene::Term>(L"body", StringUtils::toUnicode(word)));
}

TEST_P(SearchJudgeTest, ScoresAsTheIndexLibraryDoes) {
  for (int i = 0; i < 20; ++i) {
    const std::string a = PickWord();
    const std::string b = PickWord();
    const std::string c = PickWord();
    const auto query = newLucene<Lucene::BooleanQuery>();
    const Lucene::QueryPtr boosted = Term(a);
    boosted->setBoost(2.5);
    const auto phrase = newLucene<Lucene::PhraseQuery>();
    phrase->add(newLucene<Lucene::Term>(L"body", StringUtils::toUnicode(b)));
    phrase->add(newLucene<Lucene::Term>(L"body", StringUtils::toUnicode(c)));
    query->add(boosted, Lucene::BooleanClause::SHOULD);
    query->add(phrase, Lucene::BooleanClause::SHOULD);
    query->add(Term(c), Lucene::BooleanClause::SHOULD);
    const SearchResult result = index_->Search(Request(a + "^2.5 \"" + b + " " + c + "\" " + c));
    const std::vector<LibraryHit> expected = LibrarySearch(index_.path(), query);
    ASSERT_EQ(result.total, expected.size());
    ASSERT_EQ(result.hits.size(), expected.size());
    for (size_t j = 0; j < expected.size(); ++j) {
      EXPECT_EQ(result.hits[j].id, expected[j].id);
      EXPECT_DOUBLE_EQ(result.hits[j].score, expected[j].score);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Seeds, SearchJudgeTest, ::testing::Values(1U, 2U, 3U, 4U),
                         [](const auto& test) { return "seed" + std::to_string(test.param); });

}  // namespace
}  // namespace vantrel::elastic
