// Documents told apart by their ids; what an index says about itself and of a value.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "read_back.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::DocumentsWith;
using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Terms;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::SizeIs;

class IndexUpdateTest : public ::testing::Test {
 protected:
  const std::string& path() const { return folder_.path(); }
  Index& index() { return *index_; }

  uint64_t Live(const std::string& field, const std::string& term) {
    index_->Commit();
    return DocumentsWith(path(), field, term).size();
  }

  // Why an update is refused, without the path.
  std::string Refusal(const Document& document) {
    try {
      index_->Update(document);
    } catch (const IndexValueError& error) {
      return std::string(error.what()).substr(path().size() + 2);
    }
    return "";
  }

 private:
  TemporaryFolder folder_;
  std::shared_ptr<Index> index_ = Index::Create(folder_.path(), IdAndBody());
};

TEST_F(IndexUpdateTest, AnUpdateReplacesTheDocumentOfTheSameId) {
  index().Update(MakeDocument("a", "one"));
  index().Update(MakeDocument("b", "one"));
  index().Update(MakeDocument("a", "two"));
  EXPECT_EQ(Live("body", "one"), 1U);
  EXPECT_EQ(Live("body", "two"), 1U);
  index().Update(MakeDocument("a", "three"));
  EXPECT_EQ(Live("body", "two"), 0U);
  EXPECT_EQ(Live("id", "a"), 1U);
  EXPECT_EQ(index().CountDocuments().live, 2U);
}

TEST_F(IndexUpdateTest, AnUpdateReplacesAllThatWereAddedWithTheId) {
  index().Add(MakeDocument("a", "one"));
  index().Add(MakeDocument("a", "two"));
  EXPECT_EQ(Live("id", "a"), 2U);
  index().Update(MakeDocument("a", "three"));
  EXPECT_EQ(Live("id", "a"), 1U);
}

TEST_F(IndexUpdateTest, IdsAreToldApartByEveryCharacter) {
  const std::vector<std::string> ids = {"a", "A", "a ", " a", " ", "ä", "a\xcc\x88", std::string("a\0b", 3)};
  for (const std::string& id : ids) index().Update(MakeDocument(id, "word"));
  EXPECT_EQ(Live("body", "word"), ids.size());
  for (const std::string& id : ids) index().Update(MakeDocument(id, "again"));
  EXPECT_EQ(Live("body", "again"), ids.size());
  EXPECT_EQ(index().CountDocuments().live, ids.size());
}

TEST_F(IndexUpdateTest, ADocumentWithoutExactlyOneIdIsRefusedAndNothingIsReplaced) {
  index().Update(MakeDocument("a", "one"));
  EXPECT_EQ(Refusal({{{"body", "two"}}}), "field \"id\": the document has no id");
  EXPECT_EQ(Refusal({{{"id", ""}, {"body", "two"}}}), "field \"id\": the document has no id");
  EXPECT_EQ(Refusal({{{"id", "a"}, {"id", "b"}}}), "field \"id\": the document has more than one id");
  EXPECT_THAT(Refusal({{{"id", "a"}, {"body", "\xff"}}}), HasSubstr("not valid UTF-8"));
  EXPECT_THAT(Refusal({{{"id", "a"}, {"colour", "red"}}}), HasSubstr("no field \"colour\""));
  EXPECT_THAT(Refusal({{{"id", "\xff"}, {"body", "two"}}}), HasSubstr("not valid UTF-8"));
  EXPECT_EQ(Live("body", "one"), 1U);
}

TEST_F(IndexUpdateTest, DocumentsAreDeletedById) {
  for (const char* id : {"a", "b", "c"}) index().Update(MakeDocument(id, "word"));
  index().DeleteById("b");
  index().DeleteById("nobody");
  EXPECT_EQ(Live("body", "word"), 2U);
  EXPECT_THAT(DocumentsWith(path(), "id", "b"), IsEmpty());
  EXPECT_THROW(index().DeleteById("\xff"), IndexValueError);
}

TEST_F(IndexUpdateTest, StatisticsTellTheNewestCommit) {
  const IndexStatistics empty = index().Statistics();
  EXPECT_EQ(empty.documents.live, 0U);
  EXPECT_EQ(empty.segments, 0U);
  for (const char* id : {"a", "b", "c"}) {
    index().Update(MakeDocument(id, "word"));
    index().Commit();
  }
  index().DeleteById("a");
  index().Update(MakeDocument("d", "not committed"));
  EXPECT_EQ(index().Statistics().documents.live, 3U);
  index().Commit();
  const IndexStatistics statistics = index().Statistics();
  EXPECT_EQ(statistics.documents.live, 3U);
  EXPECT_EQ(statistics.documents.deleted, 1U);
  EXPECT_EQ(statistics.segments, 4U);
  EXPECT_GT(statistics.generation, empty.generation);
  uint64_t bytes = 0;
  for (const auto& entry : std::filesystem::directory_iterator(path())) bytes += entry.file_size();
  EXPECT_EQ(statistics.bytes, bytes);
}

TEST_F(IndexUpdateTest, AnalysingShowsTheTermsOfATextAndWhereTheyStand) {
  const auto tokens = index().Analyze("body", "Grüße, an 😀 Köln-Süd");
  ASSERT_THAT(tokens, SizeIs(5));
  EXPECT_EQ(tokens[0].text, "grüße");
  EXPECT_EQ(tokens[0].position, 0U);
  EXPECT_EQ(tokens[0].start, 0U);
  EXPECT_EQ(tokens[0].end, 5U);
  EXPECT_EQ(tokens[1].text, "an");
  EXPECT_EQ(tokens[1].position, 1U);
  EXPECT_EQ(tokens[2].text, "😀");
  EXPECT_EQ(tokens[2].end, 11U);
  EXPECT_EQ(tokens[3].text, "köln");
  EXPECT_EQ(tokens[3].start, 12U);
  EXPECT_EQ(tokens[4].text, "süd");
  EXPECT_EQ(tokens[4].position, 4U);
  EXPECT_EQ(tokens[4].end, 20U);
  index().Update(MakeDocument("a", "Grüße, an 😀 Köln-Süd"));
  index().Commit();
  EXPECT_THAT(Terms(path(), "body"), ElementsAre("an", "grüße", "köln", "süd", "😀"));
}

TEST_F(IndexUpdateTest, AnalysingAKeywordShowsItAsItIs) {
  const auto tokens = index().Analyze("id", "Grüße, Köln");
  ASSERT_THAT(tokens, SizeIs(1));
  EXPECT_EQ(tokens[0].text, "Grüße, Köln");
  EXPECT_EQ(tokens[0].start, 0U);
  EXPECT_EQ(tokens[0].end, 11U);
}

TEST_F(IndexUpdateTest, AnalysingRefusesWhatCouldNotBeAdded) {
  EXPECT_THROW(index().Analyze("colour", "red"), IndexValueError);
  EXPECT_THROW(index().Analyze("body", "\xff"), IndexValueError);
  EXPECT_THROW(index().Analyze("body", std::string(20'000, 'x')), IndexValueError);
  EXPECT_THAT(index().Analyze("body", ""), IsEmpty());
}

}  // namespace
}  // namespace vantrel::elastic
