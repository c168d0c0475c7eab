// Lookups with a check beforehand against the index library alone, on indexes of every kind: they must say the same.

#include "vantrel/elastic/checked_reader.h"

#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>
#include <sys/wait.h>
// Not without the headers above.
#include <lucene++/TermFreqVector.h>
#include <lucene++/TermPositions.h>

#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "engine/check/health_shapes.h"
#include "support/files.h"
#include "support/library_index.h"
#include "support/open_files.h"
#include "support/run_size.h"
#include "support/sanitized.h"
#include "support/small_index.h"
#include "support/temporary_folder.h"
#include "support/varied_index.h"
#include "support/without_rights.h"
#include "vantrel/elastic/library_setup.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using Lucene::IndexReaderPtr;
using Lucene::newLucene;
using Lucene::String;
using Lucene::StringUtils;
using Lucene::TermPtr;
using vantrel::elastic::CheckedReader;

IndexReaderPtr OpenWithLibrary(const std::string& path) {
  return Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(path)), true);
}

// A few hundred terms that are there, spread over the dictionaries, and some that are not.
std::vector<TermPtr> TermsOf(const IndexReaderPtr& reader) {
  constexpr int kMost = 150;
  std::vector<TermPtr> all;
  const Lucene::TermEnumPtr cursor = reader->terms();
  while (cursor->next()) all.push_back(cursor->term());
  std::vector<TermPtr> terms;
  for (size_t i = 0; i < all.size(); i += 1 + all.size() / kMost) terms.push_back(all[i]);
  for (const wchar_t* field : {L"a", L"body", L"often", L"zzz"}) {
    for (const wchar_t* text : {L"", L"a~", L"every0", L"\U0001f601"})
      terms.push_back(newLucene<Lucene::Term>(field, text));
  }
  return terms;
}

std::vector<int32_t> DocumentsOf(const IndexReaderPtr& reader) {
  const int32_t end = reader->maxDoc();
  std::vector<int32_t> documents = {0, 1, 15, 16, 17, end / 2, end - 17, end - 1, end, end + 9};
  for (int32_t i = 31; i < end; i += 61) documents.push_back(i);
  std::erase_if(documents, [](int32_t document) { return document < 0; });
  return documents;
}

// What a lookup comes to, the error where there is one.
template <typename Lookup>
std::wstring Told(Lookup lookup) {
  try {
    return lookup();
  } catch (const Lucene::LuceneException& error) {
    return L"error: " + error.getError();
  }
}

std::wstring TellPositions(const Lucene::TermPositionsPtr& positions, int32_t document) {
  if (!positions->skipTo(document)) return L"no entry";
  std::wstring told = std::to_wstring(positions->doc()) + L":";
  for (int32_t i = 0; i < positions->freq(); ++i) told += L" " + std::to_wstring(positions->nextPosition());
  return told;
}

std::wstring TellVector(const Lucene::TermFreqVectorPtr& vector) {
  if (!vector) return L"none";
  std::wstring told;
  for (const String& term : vector->getTerms()) told += term + L"\n";
  return told;
}

void ExpectSamePositions(const std::string& path, const IndexReaderPtr& library) {
  for (const TermPtr& term : TermsOf(library)) {
    const CheckedReader checked(path, term);
    for (const int32_t document : DocumentsOf(library)) {
      EXPECT_EQ(Told([&] { return TellPositions(checked.Positions(document), document); }),
                Told([&] { return TellPositions(library->termPositions(term), document); }))
          << StringUtils::toUTF8(term->toString()) << " from document " << document;
    }
  }
}

void ExpectSameVectors(const std::string& path, const IndexReaderPtr& library) {
  const CheckedReader checked(path);
  for (const auto& field : library->getFieldNames(Lucene::IndexReader::FIELD_OPTION_ALL)) {
    for (const int32_t document : DocumentsOf(library)) {
      EXPECT_EQ(Told([&] { return TellVector(checked.TermVector(document, field)); }),
                Told([&] { return TellVector(library->getTermFreqVector(document, field)); }))
          << StringUtils::toUTF8(field) << " of document " << document;
    }
  }
  EXPECT_FALSE(checked.TermVector(-1, L"body"));
  EXPECT_FALSE(checked.TermVector(0, L"no such field"));
}

void ExpectSame(const std::string& path) {
  const IndexReaderPtr library = OpenWithLibrary(path);
  ExpectSamePositions(path, library);
  ExpectSameVectors(path, library);
}

class CheckedReaderTest : public ::testing::TestWithParam<HealthShape> {
 protected:
  void SetUp() override { vantrel::elastic::PrepareIndexLibrary(); }

  TemporaryFolder folder_;
};

INSTANTIATE_TEST_SUITE_P(Shapes, CheckedReaderTest, ::testing::ValuesIn(HealthShapes()),
                         [](const auto& test) { return test.param.name; });

TEST_P(CheckedReaderTest, AnswersAsTheLibraryDoes) {
  const HealthShape& shape = GetParam();
  if (shape.older_layout == nullptr) {
    WriteVariedIndex(folder_.path(), shape.index);
  } else {
    const std::string command =
        std::string(CLUCENE_WRITER) + " '" + folder_.path() + "' " + shape.older_layout;
    const int status = std::system(command.c_str());
    ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << command;
  }
  ExpectSame(folder_.path());
}

TEST(CheckedReaderUseTest, PositionsOfAReaderForTermVectorsAreAnError) {
  vantrel::elastic::PrepareIndexLibrary();
  const TemporaryFolder folder;
  WriteSmallIndex(folder.path(), false);
  const CheckedReader checked(folder.path());
  EXPECT_THROW(checked.Positions(0), Lucene::IllegalStateException);
  EXPECT_TRUE(checked.TermVector(0, L"body"));
}

// Three levels of skip data, with and without payloads.
TEST(CheckedReaderSkipTest, JumpsAsTheLibraryDoes) {
  vantrel::elastic::PrepareIndexLibrary();
  const TemporaryFolder folder;
  WriteVariedIndex(folder.path(),
                   {.seed = 23, .documents = 4600, .documents_per_segment = 5000, .deletions = 300});
  ExpectSame(folder.path());
}

// QUORELASTIC_HEALTHY_INDEXES makes it a longer campaign.
TEST(CheckedReaderRandomTest, AnswersAsTheLibraryDoesOnAnyIndex) {
  vantrel::elastic::PrepareIndexLibrary();
  const int indexes = RunSize("QUORELASTIC_HEALTHY_INDEXES", 12 / kFewer);
  for (int i = 0; i < indexes; ++i) {
    SCOPED_TRACE("seed " + std::to_string(31000 + i));
    const TemporaryFolder folder;
    WriteVariedIndex(folder.path(), RandomShape(static_cast<uint32_t>(31000 + i)));
    ExpectSame(folder.path());
    if (::testing::Test::HasFailure()) return;
  }
}

// An index of two commits, of one and of two documents, as where the writer of the second could not remove the first.
class TwoCommitsTest : public ::testing::Test {
 protected:
  void SetUp() override {
    vantrel::elastic::PrepareIndexLibrary();
    const TemporaryFolder before;
    {
      LibraryIndex index(folder_.path());
      index.Add({{.name = "body", .value = "word"}});
      index.Commit();
      CopyFolder(folder_.path(), before.path());
      index.Add({{.name = "body", .value = "word"}});
    }
    for (const std::string& name : ListFolder(folder_.path())) {
      if (name.starts_with("segments_")) newest_ = folder_ / name;
    }
    for (const std::string& name : ListFolder(before.path())) {
      if (name.starts_with("segments_")) WriteFile(folder_ / name, ReadFile(before / name));
    }
    fs::permissions(folder_.path(), fs::perms::all);
    for (const auto& file : fs::directory_iterator(folder_.path())) fs::permissions(file, fs::perms::all);
  }

  // How many documents a reader finds, and which error it meets else.
  std::wstring CountDocuments() const {
    return Told([&] { return std::to_wstring(CheckedReader(folder_.path()).reader()->numDocs()); });
  }

  TemporaryFolder folder_;
  std::string newest_;
};

TEST_F(TwoCommitsTest, TheOlderIsReadWhereTheNewestIsIncompleteOrZeros) {
  EXPECT_EQ(CountDocuments(), L"2");
  const std::string whole = ReadFile(newest_);
  WriteFile(newest_, std::string(whole.size(), '\0'));
  EXPECT_EQ(CountDocuments(), L"1");
  WriteFile(newest_, whole.substr(0, 10));
  EXPECT_EQ(CountDocuments(), L"1");
}

TEST_F(TwoCommitsTest, TheOlderIsNotReadWhereTheSystemRefusesTheNewest) {
  fs::permissions(newest_, fs::perms::none);
  const WithoutRights rights;
  EXPECT_EQ(CountDocuments(), L"error: " + StringUtils::toUnicode(newest_));
}

TEST_F(TwoCommitsTest, TheOlderIsNotReadWhereThereAreTooFewDescriptors) {
  if (kIsSanitized) GTEST_SKIP() << kSanitizerNeedsDescriptors;
  int refusals = 0;
  for (std::wstring told; told != L"2"; ++refusals) {
    ASSERT_LT(refusals, 100) << "not even with as many descriptors";
    const FewOpenFiles few(static_cast<size_t>(refusals));
    told = CountDocuments();
    EXPECT_NE(told, L"1") << "with " << refusals << " descriptors";
  }
  EXPECT_GT(refusals, 3);
}

}  // namespace
}  // namespace quorelastic::testing
