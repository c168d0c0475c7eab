#include <lucene++/LuceneHeaders.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "read_back.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_info.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::DocumentsWith;
using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::StoredValues;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Terms;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr size_t kLongestTerm = 16383;

// An index in which each test adds what is good or bad.
class IndexDocumentsTest : public ::testing::Test {
 protected:
  const std::string& path() const { return folder_.path(); }
  Index& index() { return *index_; }

  // Adds a document that must be refused, and returns why, without the path.
  std::string Refusal(const Document& document) {
    try {
      index_->Add(document);
    } catch (const IndexValueError& error) {
      EXPECT_EQ(error.path(), path());
      return std::string(error.what()).substr(path().size() + 2);
    }
    return "";
  }

  // The documents that are there once all is committed.
  uint64_t CommittedDocuments() {
    index_->Commit();
    EXPECT_EQ(index_->CountDocuments().deleted, 0U);
    return index_->CountDocuments().live;
  }

 private:
  TemporaryFolder folder_;
  std::shared_ptr<Index> index_ = Index::Create(folder_.path(), IdAndBody());
};

TEST_F(IndexDocumentsTest, AFieldWithoutSettingsIsRefused) {
  EXPECT_EQ(Refusal({{{"id", "a"}, {"colour", "red"}}}), "there is no field \"colour\"");
  EXPECT_EQ(Refusal({{{"", "red"}}}), "there is no field \"\"");
  EXPECT_EQ(CommittedDocuments(), 0U);
}

TEST_F(IndexDocumentsTest, AnUnknownFieldsNameIsShownOnOneLine) {
  EXPECT_EQ(Refusal({{{"a\nb\"\xff", "red"}}}), R"(there is no field "a\x0ab\x22\xff")");
  const std::string shown = Refusal({{{std::string(1000, 'x'), "red"}}});
  EXPECT_LT(shown.size(), 120U);
}

TEST_F(IndexDocumentsTest, AValueThatIsNotUtf8IsRefusedAndTheIndexStaysUsable) {
  index().Add(MakeDocument("a", "before"));
  EXPECT_EQ(Refusal(MakeDocument("b", "caf\xe9")), "field \"body\": the value is not valid UTF-8");
  EXPECT_EQ(Refusal(MakeDocument("b\xc0\x80", "text")), "field \"id\": the value is not valid UTF-8");
  EXPECT_EQ(Refusal(MakeDocument("b", "\xed\xa0\x80")), "field \"body\": the value is not valid UTF-8");
  index().Add(MakeDocument("c", "after"));
  EXPECT_EQ(CommittedDocuments(), 2U);
  EXPECT_THAT(Terms(path(), "id"), ElementsAre("a", "c"));
}

TEST_F(IndexDocumentsTest, CharactersThatFilesCannotKeepAreRefusedAndTheirNeighboursKept) {
  EXPECT_EQ(Refusal(MakeDocument("a\xef\xbf\xbe", "")),
            "field \"id\": the value holds U+FFFE, which an index cannot keep");
  EXPECT_EQ(Refusal(MakeDocument("a", "a\xef\xbf\xbf")),
            "field \"body\": the value holds U+FFFF, which an index cannot keep");
  EXPECT_EQ(Refusal(MakeDocument("a", "a\xf0\x9f\xbf\xbf")),
            "field \"body\": the value holds U+1FFFF, which an index cannot keep");
  const std::vector<std::string> good = {"\xef\xbf\xbd", "\xf0\x90\x80\x80", "\xf0\x9f\xbf\xbe",
                                         "\xf0\xa0\x80\x80", "\xf4\x8f\xbf\xbf"};
  for (const std::string& value : good) index().Add(MakeDocument(value, value));
  EXPECT_EQ(CommittedDocuments(), good.size());
  for (int i = 0; i < static_cast<int>(good.size()); ++i) {
    const std::string& value = good[static_cast<size_t>(i)];
    EXPECT_THAT(StoredValues(path(), i, "body"), ElementsAre(value));
    EXPECT_THAT(DocumentsWith(path(), "id", value), ElementsAre(i));
  }
}

TEST_F(IndexDocumentsTest, AZeroIsRefusedInATextWhoseRestWouldBeLostAndKeptInAKeyword) {
  const std::string value("one\0two", 7);
  EXPECT_EQ(Refusal(MakeDocument("a", value)),
            "field \"body\": the value holds U+0000, after which a text is not indexed");
  index().Add(MakeDocument(value, "text"));
  EXPECT_EQ(CommittedDocuments(), 1U);
  EXPECT_THAT(Terms(path(), "id"), ElementsAre(value));
  EXPECT_THAT(StoredValues(path(), 0, "id"), ElementsAre(value));
}

TEST_F(IndexDocumentsTest, TheLongestKeywordIsKeptAndALongerOneRefused) {
  std::string longest;
  for (size_t i = 0; i < kLongestTerm; ++i) longest += "ü";
  EXPECT_EQ(Refusal(MakeDocument(longest + "x", "text")),
            "field \"id\": the value has 16384 characters; a keyword has at most 16383");
  index().Add(MakeDocument(longest, "text"));
  EXPECT_EQ(CommittedDocuments(), 1U);
  const auto dictionary = newClassInit<IndexInfo>(path())->GetTermDict(0, false);
  ASSERT_TRUE(dictionary->Next());
  ASSERT_TRUE(dictionary->Next());
  EXPECT_EQ(Lucene::StringUtils::toUTF8(dictionary->Term()->text()), longest);
}

TEST_F(IndexDocumentsTest, TheLongestWordIsKeptAndALongerOneRefused) {
  const std::string longest(kLongestTerm, 'a');
  EXPECT_EQ(Refusal(MakeDocument("a", "short " + longest + "a end")),
            "field \"body\": the value holds a word of 16384 characters; a word has at most 16383");
  // The analyzer takes the ending off, but not before it has looked at the length.
  EXPECT_EQ(Refusal(MakeDocument("a", longest + "'s")),
            "field \"body\": the value holds a word of 16385 characters; a word has at most 16383");
  index().Add(MakeDocument("b", "short " + longest + " end"));
  EXPECT_EQ(CommittedDocuments(), 1U);
  EXPECT_THAT(Terms(path(), "body"), ElementsAre(longest, "end", "short"));
}

TEST_F(IndexDocumentsTest, ALongTextOfShortWordsWithoutBlanksIsTaken) {
  std::string text;
  for (int i = 0; i < 20'000; ++i) text += "a,";
  index().Add(MakeDocument("a", text));
  EXPECT_EQ(CommittedDocuments(), 1U);
  EXPECT_THAT(Terms(path(), "body"), ElementsAre("a"));
}

TEST_F(IndexDocumentsTest, AHugeDocumentIsRefused) {
  std::string half(size_t{128} << 20, 'a');
  EXPECT_EQ(Refusal({{{"body", half}, {"body", half}, {"id", "a"}}}),
            "a document of 268435457 bytes is larger than 268435456, the most that is taken");
}

TEST_F(IndexDocumentsTest, ADocumentMayHaveNoFieldsOrEmptyValues) {
  index().Add({});
  index().Add(MakeDocument("", ""));
  EXPECT_EQ(CommittedDocuments(), 2U);
  EXPECT_THAT(StoredValues(path(), 0, "id"), IsEmpty());
  EXPECT_THAT(StoredValues(path(), 1, "body"), ElementsAre(""));
  EXPECT_THAT(DocumentsWith(path(), "id", ""), ElementsAre(1));
}

TEST_F(IndexDocumentsTest, DeletingRefusesWhatCannotBeATermOfAField) {
  EXPECT_THROW(index().Delete("colour", "red"), IndexValueError);
  EXPECT_THROW(index().Delete("id", "caf\xe9"), IndexValueError);
}

TEST_F(IndexDocumentsTest, WordsOfManyScriptsAreFoundLowerCased) {
  index().Add(MakeDocument("a", "ΑΘΗΝΑ Москва İzmir 東京 user@Example.org 3.14 R2D2"));
  EXPECT_EQ(CommittedDocuments(), 1U);
  for (const char* word : {"αθηνα", "москва", "東", "京", "user@example.org", "3.14", "r2d2"}) {
    EXPECT_THAT(DocumentsWith(path(), "body", word), ElementsAre(0)) << word;
  }
}

TEST_F(IndexDocumentsTest, CommonEnglishWordsAreTermsLikeAllOthers) {
  index().Add(MakeDocument("a", "to be or not to be"));
  EXPECT_EQ(CommittedDocuments(), 1U);
  EXPECT_THAT(Terms(path(), "body"), ElementsAre("be", "not", "or", "to"));
}

}  // namespace
}  // namespace vantrel::elastic
