#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/TermPositions.h>
#include <lucene++/TermPositionVector.h>
#include <lucene++/TermVectorOffsetInfo.h>

#include "read_back.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_info.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::OpenReader;
using ::quorelastic::testing::StoredValues;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Terms;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::IsEmpty;
using ::testing::Not;

// Makes an index of one field, "f", with one document of the given values.
void MakeIndex(const std::string& path, const FieldSettings& field, const std::vector<std::string>& values) {
  const auto index = Index::Create(path, {.fields = {field}});
  Document document;
  for (const std::string& value : values) document.fields.push_back({"f", value});
  index->Add(document);
  index->Commit();
}

std::vector<int> ToVector(const Lucene::Collection<int32_t>& numbers) {
  return numbers ? std::vector<int>(numbers.begin(), numbers.end()) : std::vector<int>();
}

std::vector<int> Positions(const std::string& path, const std::wstring& term) {
  std::vector<int> positions;
  const auto walk = OpenReader(path)->termPositions(Lucene::newLucene<Lucene::Term>(L"f", term));
  while (walk->next()) {
    for (int i = 0; i < walk->freq(); ++i) positions.push_back(walk->nextPosition());
  }
  return positions;
}

TEST(IndexFieldsTest, AKeywordIsOneTermAsItIs) {
  const TemporaryFolder folder;
  MakeIndex(folder.path(), {.name = "f", .type = FieldType::kKeyword}, {"The Whole Value", "And Another"});
  EXPECT_THAT(Terms(folder.path(), "f"), ElementsAre("And Another", "The Whole Value"));
}

TEST(IndexFieldsTest, ValuesAreStoredInOrderOrNotAtAll) {
  const TemporaryFolder folder;
  MakeIndex(folder / "stored", {.name = "f", .stored = true}, {"Second  One", "a First", "Second  One"});
  EXPECT_THAT(StoredValues(folder / "stored", 0, "f"), ElementsAre("Second  One", "a First", "Second  One"));
  MakeIndex(folder / "not", {.name = "f", .stored = false}, {"Second  One"});
  EXPECT_THAT(StoredValues(folder / "not", 0, "f"), IsEmpty());
  EXPECT_THAT(Terms(folder / "not", "f"), ElementsAre("one", "second"));
}

TEST(IndexFieldsTest, NormsAreKeptOnlyWhereTheSettingsSaySo) {
  const TemporaryFolder folder;
  MakeIndex(folder / "with", {.name = "f", .norms = true}, {"a b c"});
  MakeIndex(folder / "without", {.name = "f", .norms = false}, {"a b c"});
  EXPECT_TRUE(OpenReader(folder / "with")->hasNorms(L"f"));
  EXPECT_FALSE(OpenReader(folder / "without")->hasNorms(L"f"));
}

TEST(IndexFieldsTest, FrequenciesComeWithPositionsAndGoWithThem) {
  const TemporaryFolder folder;
  MakeIndex(folder / "with", {.name = "f", .frequencies = true}, {"tick tock tick"});
  EXPECT_THAT(Positions(folder / "with", L"tick"), ElementsAre(0, 2));
  MakeIndex(folder / "without", {.name = "f", .frequencies = false}, {"tick tock tick"});
  const auto reader = OpenReader(folder / "without");
  const auto documents = reader->termDocs(Lucene::newLucene<Lucene::Term>(L"f", L"tick"));
  ASSERT_TRUE(documents->next());
  EXPECT_EQ(documents->freq(), 1);
  EXPECT_TRUE(
      reader->getFieldNames(Lucene::IndexReader::FIELD_OPTION_OMIT_TERM_FREQ_AND_POSITIONS).contains(L"f"));
  EXPECT_THAT(Positions(folder / "without", L"tick"), ElementsAre(0));
}

TEST(IndexFieldsTest, NoPhraseSpansTwoValues) {
  const TemporaryFolder folder;
  MakeIndex(folder.path(), {.name = "f"}, {"new york", "city"});
  EXPECT_THAT(Positions(folder.path(), L"york"), ElementsAre(1));
  EXPECT_THAT(Positions(folder.path(), L"city"), ElementsAre(102));
}

struct VectorCase {
  const char* name;
  TermVector vector;
  std::vector<int> positions;
  std::vector<int> ends;
};

class TermVectorTest : public ::testing::TestWithParam<VectorCase> {};

TEST_P(TermVectorTest, HoldsWhatTheSettingsSay) {
  const TemporaryFolder folder;
  MakeIndex(folder.path(), {.name = "f", .term_vector = GetParam().vector}, {"tick tock Tick"});
  const auto vector = OpenReader(folder.path())->getTermFreqVector(0, L"f");
  ASSERT_TRUE(vector);
  ASSERT_EQ(vector->size(), 2);
  EXPECT_EQ(vector->getTerms()[0], L"tick");
  EXPECT_THAT(ToVector(vector->getTermFrequencies()), ElementsAre(2, 1));
  std::vector<int> positions;
  std::vector<int> ends;
  if (const auto located = boost::dynamic_pointer_cast<Lucene::TermPositionVector>(vector)) {
    positions = ToVector(located->getTermPositions(0));
    if (const auto offsets = located->getOffsets(0)) {
      for (const auto& offset : offsets) ends.push_back(offset->getEndOffset());
    }
  }
  EXPECT_EQ(positions, GetParam().positions);
  EXPECT_EQ(ends, GetParam().ends);
}

INSTANTIATE_TEST_SUITE_P(Vectors, TermVectorTest,
                         ::testing::Values(VectorCase{"terms", TermVector::kTerms, {}, {}},
                                           VectorCase{"positions", TermVector::kPositions, {0, 2}, {}},
                                           VectorCase{"offsets", TermVector::kOffsets, {}, {4, 14}},
                                           VectorCase{
                                               "both", TermVector::kPositionsAndOffsets, {0, 2}, {4, 14}}),
                         [](const auto& test) { return test.param.name; });

TEST(IndexFieldsTest, WithoutATermVectorThereIsNone) {
  const TemporaryFolder folder;
  MakeIndex(folder.path(), {.name = "f", .term_vector = TermVector::kNone}, {"tick tock"});
  EXPECT_FALSE(OpenReader(folder.path())->getTermFreqVector(0, L"f"));
}

TEST(IndexFieldsTest, CompoundFilesAreWrittenWhereTheSettingsSaySo) {
  const TemporaryFolder folder;
  for (const bool compound : {true, false}) {
    const std::string path = folder / (compound ? "compound" : "plain");
    const auto index = Index::Create(path, {.fields = {{.name = "f"}}, .compound_files = compound});
    for (const char* value : {"one", "two"}) {
      index->Add({{{"f", value}}});
      index->Commit();
    }
    index->Optimize();
    index->Commit();
    if (compound) {
      EXPECT_THAT(ListFolder(path), Not(Contains(EndsWith(".tis"))));
    } else {
      EXPECT_THAT(ListFolder(path), Contains(EndsWith(".tis")));
    }
    EXPECT_THAT(Terms(path, "f"), ElementsAre("one", "two"));
    EXPECT_EQ(newClassInit<IndexInfo>(path)->GetTermDict(0, true)->GetTermsCount(), 2);
  }
}

}  // namespace
}  // namespace vantrel::elastic
