// The calls that make files durable are stood in for, so that a test can see their order and let them fail.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>

#include "read_back.h"
#include "support/file_size_limit.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"

namespace {

// What has been made durable or removed, in order: "sync /path", "unlink /path".
std::vector<std::string> journal;

// The path whose next sync fails.
std::string failing_sync;

}  // namespace

extern "C" __attribute__((visibility("default"))) int fsync(int descriptor) {
  const std::string path = std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(descriptor));
  if (path == failing_sync) {
    failing_sync.clear();
    errno = EIO;
    return -1;
  }
  journal.push_back("sync " + path);
  return static_cast<int>(syscall(SYS_fsync, descriptor));
}

extern "C" __attribute__((visibility("default"))) int unlink(const char* path) noexcept {
  const int result = static_cast<int>(syscall(SYS_unlink, path));
  if (result == 0) journal.push_back(std::string("unlink ") + path);
  return result;
}

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::DocumentsWith;
using ::quorelastic::testing::FileSizeLimit;
using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::StoredValues;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Terms;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::Not;
using ::testing::StartsWith;

// Where in the journal something stands; beyond its end where it does not.
std::ptrdiff_t When(const std::string& event) {
  return std::find(journal.begin(), journal.end(), event) - journal.begin();
}

class IndexDurabilityTest : public ::testing::Test {
 protected:
  IndexDurabilityTest() {
    index_ = Index::Create(path_, IdAndBody());
    index_->Add(MakeDocument("old", "text"));
    index_->Commit();
    journal.clear();
  }

  const std::string& path() const { return path_; }
  Index& index() { return *index_; }

  // Nothing but the first document is there, for who comes anew.
  void ExpectOnlyTheOldCommit() const {
    EXPECT_THAT(Terms(path_, "id"), ElementsAre("old"));
    EXPECT_THAT(StoredValues(path_, 0, "body"), ElementsAre("text"));
    EXPECT_EQ(Index::Open(path_)->CountDocuments().live, 1U);
  }

  // The index takes documents again.
  void ExpectAFreshStart() {
    index_->Add(MakeDocument("new", "text"));
    index_->Commit();
    EXPECT_THAT(Terms(path_, "id"), ElementsAre("new", "old"));
    EXPECT_EQ(Index::Open(path_)->CountDocuments().live, 2U);
  }

 private:
  TemporaryFolder folder_;
  std::string path_ = folder_ / "index";
  std::shared_ptr<Index> index_;
};

TEST_F(IndexDurabilityTest, ACommitAndItsFolderAreDurableBeforeTheOneBeforeGoes) {
  index().Add(MakeDocument("new", "text"));
  index().Commit();
  EXPECT_LT(When("sync " + path() + "/_1.cfs"), When("sync " + path() + "/segments_3"));
  EXPECT_LT(When("sync " + path() + "/segments_3"), When("sync " + path()));
  EXPECT_LT(When("sync " + path()), When("unlink " + path() + "/segments_2"));
  EXPECT_THAT(journal, Contains("unlink " + path() + "/segments_2"));
}

TEST_F(IndexDurabilityTest, EveryFileOfAnIndexIsDurableAsSoonAsItIsCommitted) {
  const TemporaryFolder other;
  const std::string made = other / "made";
  const auto index = Index::Create(made, {.fields = {{.name = "f"}}, .compound_files = false});
  EXPECT_THAT(journal, Contains("sync " + other.path()));
  index->Add({{{"f", "text"}}});
  index->Add({{{"f", "more"}}});
  index->Commit();
  index->Delete("f", "more");
  index->Commit();
  EXPECT_THAT(ListFolder(made), Contains(EndsWith(".del")));
  for (const std::string& name : ListFolder(made)) {
    if (name == "segments.gen" || name == "quorelastic.lock") continue;
    const std::string event = name.starts_with("quorelastic.") ? name + ".new" : name;
    EXPECT_THAT(journal, Contains("sync " + made + "/" + event));
  }
}

TEST_F(IndexDurabilityTest, ACommitWhoseSegmentsFileCannotBeSyncedFailsAndKeepsTheOneBefore) {
  index().Add(MakeDocument("lost", "text"));
  index().Optimize();
  failing_sync = path() + "/segments_3";
  try {
    index().Commit();
    FAIL() << "committed";
  } catch (const IndexIoError& error) {
    EXPECT_EQ(error.what(), path() + "/segments_3: cannot make file durable: Input/output error");
    EXPECT_EQ(error.error_number(), EIO);
  }
  EXPECT_THAT(journal, Not(Contains("unlink " + path() + "/segments_2")));
  ExpectOnlyTheOldCommit();
  ExpectAFreshStart();
}

TEST_F(IndexDurabilityTest, ACommitWhoseFolderCannotBeSyncedFailsAndKeepsTheOneBefore) {
  index().Add(MakeDocument("lost", "text"));
  index().Delete("id", "old");
  failing_sync = path();
  EXPECT_THROW(index().Commit(), IndexIoError);
  EXPECT_THAT(journal, Not(Contains("unlink " + path() + "/segments_2")));
  ExpectOnlyTheOldCommit();
  ExpectAFreshStart();
}

TEST_F(IndexDurabilityTest, ACommitWithAFileThatCannotBeSyncedFailsAndKeepsTheOneBefore) {
  index().Add(MakeDocument("lost", "text"));
  failing_sync = path() + "/_1.cfs";
  EXPECT_THROW(index().Commit(), IndexIoError);
  ExpectOnlyTheOldCommit();
  ExpectAFreshStart();
}

TEST_F(IndexDurabilityTest, ACommitWhoseManifestCannotBeSyncedStands) {
  index().Add(MakeDocument("new", "text"));
  failing_sync = path() + "/quorelastic.manifest.new";
  index().Commit();
  EXPECT_EQ(failing_sync, "");
  EXPECT_THAT(Terms(path(), "id"), ElementsAre("new", "old"));
  EXPECT_THAT(ListFolder(path()), Not(Contains(EndsWith(".new"))));
}

TEST_F(IndexDurabilityTest, SettingsThatCannotBeSyncedLeaveNoIndex) {
  const TemporaryFolder other;
  failing_sync = other / "quorelastic.json.new";
  EXPECT_THROW(Index::Create(other.path(), IdAndBody()), IndexIoError);
  EXPECT_THAT(ListFolder(other.path()), ElementsAre("quorelastic.lock"));
  Index::Create(other.path(), IdAndBody());
  EXPECT_EQ(Index::Open(other.path())->CountDocuments().live, 0U);
}

TEST_F(IndexDurabilityTest, AnIndexWhoseFirstCommitCannotBeSyncedCanBeCreatedAgain) {
  const TemporaryFolder other;
  failing_sync = other / "segments_1";
  EXPECT_THROW(Index::Create(other.path(), IdAndBody()), IndexIoError);
  Index::Create(other.path(), IdAndBody());
  EXPECT_EQ(Index::Open(other.path())->CountDocuments().live, 0U);
}

std::string ManyWords() {
  std::string text;
  for (int i = 0; i < 20'000; ++i) text += "word" + std::to_string(i) + " ";
  return text;
}

TEST_F(IndexDurabilityTest, AWriteThatFailsFailsTheRoundAndKeepsTheCommitBefore) {
  for (const rlim_t limit : {0U, 100U, 1000U, 20'000U, 60'000U}) {
    SCOPED_TRACE(limit);
    try {
      const FileSizeLimit full_disk(limit);
      index().Delete("id", "old");
      index().Add(MakeDocument("lost", ManyWords()));
      index().Commit();
      FAIL() << "committed";
    } catch (const IndexIoError& error) {
      EXPECT_THAT(error.what(), StartsWith(path() + "/"));
      EXPECT_THAT(error.what(), EndsWith(": File too large"));
      EXPECT_EQ(error.error_number(), EFBIG);
    }
    ExpectOnlyTheOldCommit();
    try {
      index().Commit();
    } catch (const IndexChangesLostError& error) {
      // Where it was not the commit that failed: what had gone well before is lost with it.
      EXPECT_THAT(error.what(), HasSubstr("changes since the last commit were lost"));
    }
  }
  ExpectAFreshStart();
}

TEST_F(IndexDurabilityTest, ACommitTellsOnceThatEarlierChangesAreLost) {
  index().Add(MakeDocument("early", "text"));
  {
    const FileSizeLimit full_disk(0);
    EXPECT_THROW(index().Optimize(), IndexIoError);  // writes the segment of what was added
  }
  index().Add(MakeDocument("late", "text"));
  EXPECT_THROW(index().Commit(), IndexChangesLostError);
  EXPECT_THAT(Terms(path(), "id"), ElementsAre("old"));
  index().Commit();
  EXPECT_THAT(Terms(path(), "id"), ElementsAre("late", "old"));
}

TEST_F(IndexDurabilityTest, AMergeThatFailsKeepsTheCommitBefore) {
  index().Add(MakeDocument("big", ManyWords()));
  index().Commit();
  {
    const FileSizeLimit full_disk(10'000);
    EXPECT_THROW(
        {
          index().Optimize();
          index().Commit();
        },
        IndexIoError);
  }
  EXPECT_THAT(Terms(path(), "id"), ElementsAre("big", "old"));
  EXPECT_THAT(DocumentsWith(path(), "body", "word19999"), ElementsAre(1));
  index().Optimize();
  index().Commit();
  EXPECT_THAT(DocumentsWith(path(), "body", "word19999"), ElementsAre(1));
}

// Words that no other document has.
std::string OwnWords(int document) {
  std::string text;
  for (int i = 0; i < 2000; ++i) text += "own" + std::to_string(document * 2000 + i) + " ";
  return text;
}

TEST_F(IndexDurabilityTest, AMergeThatACommitMakesDueAndThatFailsLosesNothing) {
  constexpr int kCommits = 25;  // two of them make a merge due
  {
    const FileSizeLimit no_room_for_a_merge(200'000);
    for (int i = 0; i < kCommits; ++i) {
      index().Add(MakeDocument("new" + std::to_string(i), OwnWords(i)));
      index().Commit();
      EXPECT_EQ(Index::Open(path())->CountDocuments().live, static_cast<uint64_t>(i) + 2);
    }
    EXPECT_EQ(index().Statistics().segments, kCommits + 1U);  // so every merge has failed
  }
  index().Add(MakeDocument("last", "text"));
  index().Commit();
  EXPECT_LT(index().Statistics().segments, 10U);
  EXPECT_EQ(index().Statistics().documents.live, kCommits + 2U);
  for (int i = 0; i < kCommits; ++i) {
    EXPECT_EQ(DocumentsWith(path(), "body", "own" + std::to_string(i * 2000)).size(), 1U) << i;
  }
}

TEST_F(IndexDurabilityTest, MergesThatACommitMakesDueAreDoneAndDurable) {
  for (int i = 0; i < 25; ++i) {
    index().Add(MakeDocument("new" + std::to_string(i), "text"));
    index().Commit();
  }
  EXPECT_LT(index().Statistics().segments, 10U);
  for (const std::string& name : ListFolder(path())) {
    if (name == "segments.gen" || name.starts_with("quorelastic.")) continue;
    if (name.starts_with("_0.")) continue;  // committed before the journal begins
    EXPECT_THAT(journal, Contains("sync " + path() + "/" + name));
  }
}

}  // namespace
}  // namespace vantrel::elastic
