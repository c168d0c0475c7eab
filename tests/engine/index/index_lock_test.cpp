#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>

#include "read_back.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Terms;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::Not;

enum Outcome { kWritten = 0, kLocked = 1, kFailed = 2 };

Outcome TryToWrite(const std::string& path, const std::string& id) {
  try {
    const auto index = Index::Open(path);
    index->Add(MakeDocument(id, "text"));
    index->Commit();
    return kWritten;
  } catch (const IndexLockedError&) {
    return kLocked;
  } catch (const std::exception&) {
    return kFailed;
  }
}

// The same in a process of its own.
int TryToWriteElsewhere(const std::string& path, const std::string& id) {
  const pid_t child = fork();
  if (child == 0) _exit(TryToWrite(path, id));
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

TEST(IndexLockTest, ASecondWriterIsRefusedInThisProcessAndInAnother) {
  const TemporaryFolder folder;
  {
    const auto writer = Index::Create(folder.path(), IdAndBody());
    writer->Add(MakeDocument("a", "text"));
    writer->Commit();
    EXPECT_EQ(TryToWrite(folder.path(), "b"), kLocked);
    EXPECT_EQ(TryToWriteElsewhere(folder.path(), "b"), kLocked);
  }
  EXPECT_EQ(TryToWrite(folder.path(), "c"), kWritten);
  EXPECT_EQ(TryToWriteElsewhere(folder.path(), "d"), kWritten);
  EXPECT_THAT(Terms(folder.path(), "id"), ElementsAre("a", "c", "d"));
}

TEST(IndexLockTest, TheRefusalNamesTheIndex) {
  const TemporaryFolder folder;
  const auto writer = Index::Create(folder.path(), IdAndBody());
  const auto second = Index::Open(folder.path());
  try {
    second->Delete("id", "a");
    FAIL() << "both write";
  } catch (const IndexLockedError& error) {
    EXPECT_EQ(error.what(), folder.path() + ": the index is open for writing elsewhere");
    EXPECT_EQ(error.path(), folder.path());
  }
}

TEST(IndexLockTest, ARefusedWriterWritesOnceTheOtherIsGone) {
  const TemporaryFolder folder;
  auto first = Index::Create(folder.path(), IdAndBody());
  const auto second = Index::Open(folder.path());
  EXPECT_THROW(second->Add(MakeDocument("a", "text")), IndexLockedError);
  first.reset();
  second->Add(MakeDocument("b", "text"));
  second->Commit();
  EXPECT_THAT(Terms(folder.path(), "id"), ElementsAre("b"));
}

TEST(IndexLockTest, LookingIntoAnIndexLeavesTheLockToOthers) {
  const TemporaryFolder folder;
  Index::Create(folder.path(), IdAndBody());
  const auto looking = Index::Open(folder.path());
  looking->CountDocuments();
  looking->Commit();
  EXPECT_EQ(TryToWriteElsewhere(folder.path(), "a"), kWritten);
  EXPECT_EQ(looking->CountDocuments().live, 1U);
}

TEST(IndexLockTest, ClosingAnotherDescriptorOfTheLockFileKeepsTheLock) {
  const TemporaryFolder folder;
  const auto writer = Index::Create(folder.path(), IdAndBody());
  close(open((folder / "quorelastic.lock").c_str(), O_RDWR));
  EXPECT_EQ(TryToWrite(folder.path(), "a"), kLocked);
  EXPECT_EQ(TryToWriteElsewhere(folder.path(), "a"), kLocked);
}

TEST(IndexLockTest, TheLockOfAKilledWriterIsFreeAndWhatItDidNotCommitIsGone) {
  const TemporaryFolder folder;
  Index::Create(folder.path(), IdAndBody());
  int ready[2];
  ASSERT_EQ(pipe(ready), 0);
  const pid_t child = fork();
  if (child == 0) {
    const auto index = Index::Open(folder.path());
    index->Add(MakeDocument("committed", "text"));
    index->Commit();
    index->Add(MakeDocument("lost", "text"));
    index->Optimize();
    if (write(ready[1], "x", 1) != 1) _exit(1);
    pause();
  }
  char byte = 0;
  ASSERT_EQ(read(ready[0], &byte, 1), 1);
  EXPECT_EQ(TryToWrite(folder.path(), "too early"), kLocked);
  kill(child, SIGKILL);
  waitpid(child, nullptr, 0);
  EXPECT_EQ(TryToWrite(folder.path(), "after"), kWritten);
  EXPECT_THAT(Terms(folder.path(), "id"), ElementsAre("after", "committed"));
  close(ready[0]);
  close(ready[1]);
}

TEST(IndexLockTest, TheLockFileStaysAndTheLibrarysOwnIsNotMade) {
  const TemporaryFolder folder;
  {
    const auto index = Index::Create(folder.path(), IdAndBody());
    index->Add(MakeDocument("a", "text"));
    index->Commit();
    EXPECT_THAT(ListFolder(folder.path()), Not(Contains("write.lock")));
  }
  EXPECT_THAT(ListFolder(folder.path()), Contains("quorelastic.lock"));
}

TEST(IndexLockTest, ALockFileThatCannotBeOpenedIsNamed) {
  const TemporaryFolder folder;
  Index::Create(folder.path(), IdAndBody());
  const std::string lock = folder / "quorelastic.lock";
  std::filesystem::remove(lock);
  std::filesystem::create_directory(lock);
  const auto index = Index::Open(folder.path());
  try {
    index->Add(MakeDocument("a", "text"));
    FAIL() << "written without a lock";
  } catch (const IndexIoError& error) {
    EXPECT_EQ(error.what(), lock + ": cannot open lock file: Is a directory");
  }
}

TEST(IndexLockTest, OfTwoThatCreateAnIndexInOneFolderOneIsRefused) {
  const TemporaryFolder folder;
  const auto first = Index::Create(folder.path(), IdAndBody());
  EXPECT_THROW(Index::Create(folder.path(), IdAndBody()), IndexExistsError);
  // As if the first had not come further than its lock.
  for (const char* name : {"segments_1", "segments.gen", "quorelastic.json", "quorelastic.manifest"}) {
    std::filesystem::remove(folder / name);
  }
  EXPECT_THROW(Index::Create(folder.path(), IdAndBody()), IndexLockedError);
  EXPECT_THAT(ListFolder(folder.path()), ElementsAre("quorelastic.lock"));
}

}  // namespace
}  // namespace vantrel::elastic
