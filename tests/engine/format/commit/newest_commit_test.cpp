#include <gtest/gtest.h>

#include <cerrno>
#include <initializer_list>
#include <limits>
#include <string>

#include "elastic/format/commit/commit.h"
#include "elastic/format/commit/file_names.h"
#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::MemoryFile;
using ::quorelastic::testing::MemoryFolder;

// A commit with one segment, which bears the commit's number.
MemoryFile CommitFile(int64_t generation) {
  const std::string segment = "_" + CommitFileName(generation).substr(std::string("segments_").size());
  return {ByteWriter()
              .Int(-5)
              .Long(1)
              .Int(1)
              .Int(1)
              .String(segment)
              .Int(1)
              .Long(-1)
              .Int(-1)
              .Byte(1)
              .Int(-1)
              .Byte(1)
              .Checksum()
              .bytes()};
}

void PutCommit(MemoryFolder& folder, int64_t generation) {
  folder.files[CommitFileName(generation)] = CommitFile(generation);
}

void PutHint(MemoryFolder& folder, int64_t first, int64_t second) {
  folder.files["segments.gen"] = {ByteWriter().Int(-2).Long(first).Long(second).bytes()};
}

int64_t Used(const MemoryFolder& folder) {
  int64_t used = -1;
  UseNewestCommit(folder, [&](const Commit& commit) { used = commit.generation; });
  return used;
}

TEST(NewestCommitTest, IsTheLargestGenerationListed) {
  MemoryFolder folder;
  PutCommit(folder, 9);
  PutCommit(folder, 36);
  PutCommit(folder, 10);
  EXPECT_EQ(Used(folder), 36);
}

TEST(NewestCommitTest, MayBeTheOldestLayoutsFile) {
  MemoryFolder folder;
  folder.files["segments"] = {ByteWriter().Int(1).Int(0).bytes()};
  EXPECT_EQ(Used(folder), 0);
}

TEST(NewestCommitTest, AFolderWithoutACommitIsNoIndex) {
  MemoryFolder folder;
  folder.files["_0.cfs"] = {};
  ExpectIndexError("memory: no index in this folder", [&] { Used(folder); });
}

TEST(NewestCommitTest, TheHintDoesNoHarmWhenItIsMissingTornLowUnreadableOrUnknown) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  EXPECT_EQ(Used(folder), 3) << "missing";
  PutHint(folder, 9, 3);
  EXPECT_EQ(Used(folder), 3) << "torn";
  PutHint(folder, 2, 2);
  EXPECT_EQ(Used(folder), 3) << "low";
  PutHint(folder, std::numeric_limits<int64_t>::min(), std::numeric_limits<int64_t>::min());
  EXPECT_EQ(Used(folder), 3) << "negative";
  folder.files["segments.gen"].bytes.resize(11);
  EXPECT_EQ(Used(folder), 3) << "cut";
  folder.files["segments.gen"].bytes.clear();
  EXPECT_EQ(Used(folder), 3) << "empty";
  PutHint(folder, 9, 9);
  folder.files["segments.gen"].bytes[3] = '\xfd';
  EXPECT_EQ(Used(folder), 3) << "of an unknown format";
  PutHint(folder, 9, 9);
  folder.files["segments.gen"].broken_from = 0;
  EXPECT_EQ(Used(folder), 3) << "unreadable";
}

TEST(NewestCommitTest, TheHintLeadsToACommitThatTheListingMissed) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutHint(folder, 4, 4);
  // As on a file system whose listings lag behind.
  folder.before_open = [&](const std::string& name) {
    if (name == "segments_4") PutCommit(folder, 4);
  };
  EXPECT_EQ(Used(folder), 4);
}

TEST(NewestCommitTest, AHintAheadOfEveryCommitIsAnErrorUnlessTheOneBeforeIsThere) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutHint(folder, 5, 5);
  ExpectIndexError("memory/segments_5: cannot open file", [&] { Used(folder); });
  PutHint(folder, std::numeric_limits<int64_t>::max(), std::numeric_limits<int64_t>::max());
  ExpectIndexError("memory/segments_1y2p0ij32e8e7: cannot open file", [&] { Used(folder); });
  PutHint(folder, 4, 4);
  EXPECT_EQ(Used(folder), 3);
}

TEST(NewestCommitTest, FallsBackToTheOneBeforeWhereTheNewestIsIncomplete) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 4);
  folder.files["segments_4"].bytes.pop_back();
  EXPECT_EQ(Used(folder), 3);
  folder.files["segments_4"].bytes.clear();
  EXPECT_EQ(Used(folder), 3);
}

TEST(NewestCommitTest, FallsBackWhereTheNewestCannotBeUsed) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 4);
  int64_t used = -1;
  UseNewestCommit(folder, [&](const Commit& commit) {
    if (commit.generation == 4) throw IndexError("memory/_4.cfs", "missing");
    used = commit.generation;
  });
  EXPECT_EQ(used, 3);
}

// What the system says of a commit's file is no reason to serve the commit before it.
constexpr int kRefusals[] = {EACCES, EPERM, EMFILE, ENFILE, EIO, ENOMEM};

// The error number of the IndexIoError that an operation throws; 0 without one.
template <typename Operation>
int RefusalOf(Operation operation) {
  try {
    operation();
  } catch (const IndexIoError& error) {
    return error.error_number();
  }
  return 0;
}

TEST(NewestCommitTest, DoesNotFallBackWhereTheSystemRefusesToOpenTheNewest) {
  for (const int refusal : kRefusals) {
    MemoryFolder folder;
    PutCommit(folder, 3);
    PutCommit(folder, 4);
    folder.before_open = [&](const std::string& name) {
      if (name == "segments_4") throw IndexIoError("memory/segments_4", "cannot open file", refusal);
    };
    EXPECT_EQ(RefusalOf([&] { Used(folder); }), refusal);
  }
}

TEST(NewestCommitTest, DoesNotFallBackWhereTheNewestCannotBeRead) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 4);
  folder.files["segments_4"].broken_from = 10;
  EXPECT_EQ(RefusalOf([&] { Used(folder); }), EIO);
}

TEST(NewestCommitTest, DoesNotFallBackWhereTheSystemRefusesAFileOfTheNewest) {
  for (const int refusal : kRefusals) {
    MemoryFolder folder;
    PutCommit(folder, 3);
    PutCommit(folder, 4);
    int tries = 0;
    const auto use = [&](const Commit&) {
      ++tries;
      throw IndexIoError("memory/_4.cfs", "cannot open file", refusal);
    };
    EXPECT_EQ(RefusalOf([&] { UseNewestCommit(folder, use); }), refusal);
    EXPECT_EQ(tries, 1);
  }
}

TEST(NewestCommitTest, TheSystemsRefusalOfTheOneBeforeIsReportedToo) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 4);
  folder.files["segments_4"].bytes.pop_back();
  folder.files["segments_3"].broken_from = 10;
  EXPECT_EQ(RefusalOf([&] { Used(folder); }), EIO);
}

TEST(NewestCommitTest, AFileOfZerosIsNoEmptyIndex) {
  for (const size_t size : std::initializer_list<size_t>{8, 16, 17, 24, 46, 512, 4096}) {
    MemoryFolder folder;
    folder.files["segments_4"].bytes = std::string(size, '\0');
    EXPECT_THROW(Used(folder), IndexDamagedError) << size;
    PutCommit(folder, 3);
    EXPECT_EQ(Used(folder), 3) << size;
  }
}

TEST(NewestCommitTest, DoesNotFallBackPastAGap) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 5);
  folder.files["segments_5"].bytes.pop_back();
  ExpectIndexError("memory/segments_5: offset", [&] { Used(folder); });
}

TEST(NewestCommitTest, SaysWhatIsWrongWithTheNewerOneWhereBothAreBad) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 4);
  folder.files["segments_3"].bytes.clear();
  folder.files["segments_4"].bytes.back() ^= 1;
  ExpectIndexError("memory/segments_4: offset 45: checksum", [&] { Used(folder); });
}

TEST(NewestCommitTest, AStrayNameThatStandsForACommitIsNamed) {
  for (const char* name : {"segments.old", "segments_4.bak", "segments_", "segmentsx"}) {
    MemoryFolder folder;
    PutCommit(folder, 3);
    folder.files[name] = {};
    ExpectIndexError(std::string("memory: \"") + name + "\" stands for a commit", [&] { Used(folder); });
  }
}

TEST(NewestCommitTest, ListsAgainWhereTheCommitIsReplacedBeforeItIsOpened) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  folder.before_open = [&](const std::string& name) {
    if (name != "segments_3" || !folder.files.contains(name)) return;
    folder.files.erase(name);
    PutCommit(folder, 4);
  };
  EXPECT_EQ(Used(folder), 4);
}

TEST(NewestCommitTest, ListsAgainWhereASegmentsFileVanishesAsTheNextCommitAppears) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  int64_t used = -1;
  UseNewestCommit(folder, [&](const Commit& commit) {
    if (commit.generation == 3) {
      folder.files.erase("segments_3");
      PutCommit(folder, 5);
      throw IndexIoError("memory/_3.cfs", "cannot open file", ENOENT);
    }
    used = commit.generation;
  });
  EXPECT_EQ(used, 5);
}

TEST(NewestCommitTest, ReadsACommitAgainThatWasCompletedWhileItWasBeingRead) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 4);
  folder.files["segments_4"].bytes.pop_back();
  // The writer finishes the fourth, and drops the third, just as we turn back to that.
  folder.before_open = [&](const std::string& name) {
    if (name != "segments_3") return;
    folder.files.erase(name);
    PutCommit(folder, 4);
  };
  EXPECT_EQ(Used(folder), 4);
}

TEST(NewestCommitTest, EachCommitThatItComesToHasASecondTry) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  folder.files["segments_3"].bytes.pop_back();
  int opened_fourth = 0;
  folder.before_open = [&](const std::string& name) {
    if (name == "segments_3" && folder.opened > 2) {
      folder.files.erase(name);
      PutCommit(folder, 4);
      folder.files["segments_4"].bytes.pop_back();
    }
    if (name == "segments_4" && ++opened_fourth == 2) PutCommit(folder, 4);
  };
  EXPECT_EQ(Used(folder), 4);
  EXPECT_EQ(opened_fourth, 2);
}

TEST(NewestCommitTest, GivesUpWhereNothingChanges) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  int tries = 0;
  EXPECT_THROW(UseNewestCommit(folder,
                               [&](const Commit&) {
                                 ++tries;
                                 throw IndexError("memory/_3.cfs", "damaged");
                               }),
               IndexError);
  EXPECT_LE(tries, 2);
}

TEST(NewestCommitTest, PassesOnWhatIsNoIndexErrorAtOnce) {
  MemoryFolder folder;
  PutCommit(folder, 3);
  PutCommit(folder, 4);
  int tries = 0;
  EXPECT_THROW(UseNewestCommit(folder,
                               [&](const Commit&) {
                                 ++tries;
                                 throw std::bad_alloc();
                               }),
               std::bad_alloc);
  EXPECT_EQ(tries, 1);
}

}  // namespace
}  // namespace vantrel::elastic::format
