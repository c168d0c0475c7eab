#include "vantrel/elastic/index.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstdlib>
#include <filesystem>
#include <optional>

#include "read_back.h"
#include "support/files.h"
#include "support/library_index.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_info.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::CopyFolder;
using ::quorelastic::testing::DocumentsWith;
using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::StoredValues;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Terms;
using ::quorelastic::testing::WriteFile;
using ::testing::AllOf;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;

// What a call throws, as an administrator would read it; empty where it does not throw an E.
template <typename E, typename Call>
std::string MessageOf(Call call) {
  try {
    call();
  } catch (const E& error) {
    return error.what();
  }
  return "";
}

int SegmentCount(const std::string& path) { return newClassInit<IndexInfo>(path)->GetSegmentNum(); }

TEST(IndexTest, WhatIsAddedAndCommittedIsFoundByANewReader) {
  const TemporaryFolder folder;
  const std::string path = folder / "books";
  const auto index = Index::Create(path, IdAndBody());
  index->Add(MakeDocument("a", "The quick Brown fox"));
  index->Add(MakeDocument("b", "the lazy dog"));
  index->Commit();
  EXPECT_THAT(Terms(path, "id"), ElementsAre("a", "b"));
  EXPECT_THAT(Terms(path, "body"), ElementsAre("brown", "dog", "fox", "lazy", "quick", "the"));
  EXPECT_THAT(DocumentsWith(path, "body", "the"), ElementsAre(0, 1));
  EXPECT_THAT(StoredValues(path, 0, "body"), ElementsAre("The quick Brown fox"));
}

TEST(IndexTest, AnIndexJustCreatedIsEmptyAndComplete) {
  const TemporaryFolder folder;
  const std::string path = folder / "empty";
  Index::Create(path, IdAndBody());
  EXPECT_EQ(SegmentCount(path), 0);
  EXPECT_EQ(Index::Open(path)->CountDocuments().live, 0U);
}

TEST(IndexTest, AFolderThatIsThereAlreadyIsUsed) {
  const TemporaryFolder folder;
  WriteFile(folder / "notes.txt", "mine");
  Index::Create(folder.path(), IdAndBody())->Commit();
  EXPECT_EQ(ReadFile(folder / "notes.txt"), "mine");
  EXPECT_EQ(Index::Open(folder.path())->path(), folder.path());
}

TEST(IndexTest, NoIndexIsCreatedWhereOneIsOrItsFilesAre) {
  const TemporaryFolder folder;
  Index::Create(folder / "ours", IdAndBody());
  LibraryIndex(folder / "plain").Add({{.name = "body", .value = "kept"}});
  std::filesystem::create_directory(folder / "rest");
  WriteFile(folder / "rest/_0.cfs", "segment");
  for (const char* name : {"ours", "plain", "rest"}) {
    const std::string path = folder / name;
    const std::vector<std::string> before = ListFolder(path);
    EXPECT_EQ(MessageOf<IndexExistsError>([&] { Index::Create(path, IdAndBody()); }),
              path + ": there is an index in this folder already");
    EXPECT_EQ(ListFolder(path), before);
  }
  EXPECT_THAT(Terms(folder / "plain", "body"), ElementsAre("kept"));
}

TEST(IndexTest, AnAttemptToCreateThatWasCutShortDoesNotHinderTheNext) {
  const TemporaryFolder folder;
  WriteFile(folder / "quorelastic.json", "{\"version\"");
  WriteFile(folder / "quorelastic.json.new", "{");
  WriteFile(folder / "quorelastic.lock", "");
  Index::Create(folder.path(), IdAndBody());
  EXPECT_EQ(Index::Open(folder.path())->settings().fields.size(), 2U);
}

TEST(IndexTest, AParentThatIsMissingIsNamed) {
  const TemporaryFolder folder;
  const std::string path = folder / "no/index";
  EXPECT_EQ(MessageOf<IndexIoError>([&] { Index::Create(path, IdAndBody()); }),
            path + ": cannot create index folder: No such file or directory");
}

TEST(IndexTest, AFileInPlaceOfTheFolderIsNamed) {
  const TemporaryFolder folder;
  const std::string path = folder / "file";
  WriteFile(path, "");
  EXPECT_EQ(MessageOf<IndexIoError>([&] { Index::Create(path, IdAndBody()); }),
            path + ": cannot open index folder: Not a directory");
  EXPECT_EQ(MessageOf<IndexIoError>([&] { Index::Open(path); }),
            path + ": cannot open index folder: Not a directory");
}

TEST(IndexTest, OpeningSaysWhatIsMissing) {
  const TemporaryFolder folder;
  EXPECT_EQ(MessageOf<IndexIoError>([&] { Index::Open(folder / "none"); }),
            folder / "none: cannot open index folder: No such file or directory");
  EXPECT_EQ(MessageOf<IndexError>([&] { Index::Open(folder.path()); }),
            folder.path() + ": no index in this folder: it holds no segments file");
  { LibraryIndex plain(folder / "plain"); }
  EXPECT_EQ(MessageOf<IndexIoError>([&] { Index::Open(folder / "plain"); }),
            folder / "plain/quorelastic.json: cannot open file: No such file or directory");
}

TEST(IndexTest, PathsThatTheIndexLibraryCannotTakeAreRefused) {
  const TemporaryFolder folder;
  for (const auto& [path, problem] : std::vector<std::pair<std::string, std::string>>{
           {"", "the path of an index is not empty"},
           {folder / "caf\xe9", "the path is not valid UTF-8"},
           {folder / "\xef\xbf\xbf", "the path holds U+FFFF, which an index cannot keep"},
           {folder / std::string("a\0b", 3), "the path goes on after a zero byte"}}) {
    EXPECT_THAT(MessageOf<IndexValueError>([&, p = path] { Index::Create(p, IdAndBody()); }),
                EndsWith(": " + problem));
    EXPECT_THAT(MessageOf<IndexValueError>([&, p = path] { Index::Open(p); }), EndsWith(": " + problem));
  }
  EXPECT_THAT(ListFolder(folder.path()), IsEmpty());
}

TEST(IndexTest, OpeningAndCommittingNothingChangesNothing) {
  const TemporaryFolder folder;
  const std::string path = folder / "index";
  Index::Create(path, IdAndBody())->Commit();
  std::filesystem::remove(path + "/quorelastic.lock");
  const std::vector<std::string> before = ListFolder(path);
  {
    const auto index = Index::Open(path);
    index->CountDocuments();
    index->Commit();
  }
  EXPECT_EQ(ListFolder(path), before);
}

TEST(IndexTest, AnIndexOpenedAgainTakesMoreDocuments) {
  const TemporaryFolder folder;
  const std::string path = folder / "index";
  {
    const auto index = Index::Create(path, IdAndBody());
    index->Add(MakeDocument("a", "one"));
    index->Commit();
  }
  {
    const auto index = Index::Open(path);
    index->Add(MakeDocument("b", "two"));
    index->Commit();
  }
  EXPECT_THAT(Terms(path, "id"), ElementsAre("a", "b"));
}

TEST(IndexTest, WhatIsNotCommittedIsNotSeenAndGoesWithTheIndex) {
  const TemporaryFolder folder;
  const std::string path = folder / "index";
  std::vector<std::string> files;
  {
    const auto index = Index::Create(path, IdAndBody());
    index->Add(MakeDocument("a", "kept"));
    index->Commit();
    files = ListFolder(path);
    index->Add(MakeDocument("b", "dropped"));
    index->Delete("id", "a");
    index->Optimize();
    EXPECT_THAT(Terms(path, "id"), ElementsAre("a"));
    EXPECT_EQ(index->CountDocuments().live, 1U);
  }
  EXPECT_THAT(Terms(path, "id"), ElementsAre("a"));
  EXPECT_THAT(DocumentsWith(path, "id", "a"), ElementsAre(0));
  EXPECT_EQ(ListFolder(path), files);
}

TEST(IndexTest, DeletingATermDeletesEveryDocumentThatHoldsItExactly) {
  const TemporaryFolder folder;
  const std::string path = folder / "index";
  const auto index = Index::Create(path, IdAndBody());
  index->Add(MakeDocument("same", "one"));
  index->Add(MakeDocument("same thing", "two"));
  index->Commit();
  index->Add(MakeDocument("same", "three"));
  index->Delete("id", "same");
  index->Add(MakeDocument("same", "added after"));
  index->Commit();
  EXPECT_EQ(index->CountDocuments().live, 2U);
  EXPECT_EQ(index->CountDocuments().deleted, 2U);
  EXPECT_THAT(DocumentsWith(path, "body", "two"), ElementsAre(1));
  EXPECT_THAT(DocumentsWith(path, "body", "added"), ElementsAre(3));
  EXPECT_THAT(DocumentsWith(path, "body", "three"), IsEmpty());
}

TEST(IndexTest, AWordOfATextCanBeDeletedInItsIndexedForm) {
  const TemporaryFolder folder;
  const auto index = Index::Create(folder.path(), IdAndBody());
  index->Add(MakeDocument("a", "Grüße aus Köln"));
  index->Commit();
  index->Delete("body", "Köln");
  index->Commit();
  EXPECT_EQ(index->CountDocuments().live, 1U);
  index->Delete("body", "köln");
  index->Commit();
  EXPECT_EQ(index->CountDocuments().live, 0U);
}

TEST(IndexTest, DeletingWhatIsNotThereDeletesNothing) {
  const TemporaryFolder folder;
  const auto index = Index::Create(folder.path(), IdAndBody());
  index->Add(MakeDocument("a", "one"));
  index->Delete("id", "b");
  index->Delete("id", std::string(100'000, 'a'));
  index->Commit();
  EXPECT_EQ(index->CountDocuments().live, 1U);
  EXPECT_EQ(index->CountDocuments().deleted, 0U);
}

TEST(IndexTest, OptimizingLeavesOneSegmentWithoutDeletedDocuments) {
  const TemporaryFolder folder;
  const auto index = Index::Create(folder.path(), IdAndBody());
  for (const char* id : {"a", "b", "c"}) {
    index->Add(MakeDocument(id, "text"));
    index->Commit();
  }
  index->Delete("id", "b");
  index->Commit();
  ASSERT_EQ(SegmentCount(folder.path()), 3);
  index->Optimize();
  index->Commit();
  EXPECT_EQ(SegmentCount(folder.path()), 1);
  EXPECT_EQ(index->CountDocuments().live, 2U);
  EXPECT_EQ(index->CountDocuments().deleted, 0U);
  EXPECT_THAT(Terms(folder.path(), "id"), ElementsAre("a", "c"));
}

TEST(IndexTest, ManyRoundsAreMergedByThemselvesAndLoseNothing) {
  const TemporaryFolder folder;
  const auto index = Index::Create(folder.path(), IdAndBody());
  for (int i = 0; i < 35; ++i) {
    index->Add(MakeDocument(std::to_string(i), "shared word" + std::to_string(i)));
    index->Commit();
  }
  EXPECT_LT(SegmentCount(folder.path()), 20);
  EXPECT_EQ(index->CountDocuments().live, 35U);
  for (int i = 0; i < 35; ++i) {
    EXPECT_THAT(DocumentsWith(folder.path(), "body", "word" + std::to_string(i)), ElementsAre(i));
    EXPECT_THAT(StoredValues(folder.path(), i, "id"), ElementsAre(std::to_string(i)));
  }
}

TEST(IndexTest, ADamagedCommitIsReportedWhenWritingBegins) {
  const TemporaryFolder folder;
  Index::Create(folder / "index", IdAndBody())->Commit();
  const auto index = Index::Open(folder / "index");
  std::string bytes = ReadFile(folder / "index/segments_1");
  bytes[10] = static_cast<char>(bytes[10] ^ 0x40);
  WriteFile(folder / "index/segments_1", bytes);
  EXPECT_THAT(MessageOf<IndexDamagedError>([&] { index->Add(MakeDocument("a", "b")); }),
              StartsWith(folder / "index/segments_1: offset "));
  EXPECT_THROW(Index::Open(folder / "index"), IndexDamagedError);
}

TEST(IndexTest, AMissingSegmentFileIsNamedWhenDocumentsAreMerged) {
  const TemporaryFolder folder;
  const auto index = Index::Create(folder.path(), IdAndBody());
  index->Add(MakeDocument("a", "one"));
  index->Commit();
  std::filesystem::remove(folder / "_0.cfs");
  index->Add(MakeDocument("b", "two"));
  EXPECT_THAT(MessageOf<IndexError>([&] {
                index->Optimize();
                index->Commit();
              }),
              AllOf(StartsWith(folder.path()), HasSubstr("_0.cfs")));
}

// Runs with LC_ALL at a value, and puts the old one back.
class WithLocale : public ::testing::TestWithParam<const char*> {
 protected:
  void SetUp() override {
    if (const char* before = std::getenv("LC_ALL")) before_ = before;
    setenv("LC_ALL", GetParam(), 1);
  }
  void TearDown() override {
    if (before_.has_value()) {
      setenv("LC_ALL", before_->c_str(), 1);
    } else {
      unsetenv("LC_ALL");
    }
  }

 private:
  std::optional<std::string> before_;
};

TEST_P(WithLocale, APathBeyondAsciiWorks) {
  const TemporaryFolder folder;
  const std::string path = folder / "büro-索引-𝄞";
  {
    const auto index = Index::Create(path, IdAndBody());
    index->Add(MakeDocument("ä", "ÄRGER"));
    index->Commit();
  }
  const auto index = Index::Open(path);
  index->Add(MakeDocument("b", "zweite"));
  index->Optimize();
  index->Commit();
  EXPECT_EQ(index->CountDocuments().live, 2U);
  EXPECT_THAT(Terms(path, "body"), ElementsAre("zweite", "ärger"));
  EXPECT_EQ(ListFolder(folder.path()), std::vector<std::string>{"büro-索引-𝄞"});
}

INSTANTIATE_TEST_SUITE_P(Locales, WithLocale, ::testing::Values("C", "C.UTF-8", "xx_XX.nonsense"),
                         [](const auto& test) {
                           return test.index == 0 ? "plain" : test.index == 1 ? "utf8" : "invalid";
                         });

}  // namespace
}  // namespace vantrel::elastic
