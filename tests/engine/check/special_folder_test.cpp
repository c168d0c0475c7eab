// Verdicts on folders that are out of the ordinary: more or less in them than one commit's files.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <filesystem>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "elastic/check/index_check.h"
#include "elastic/format/commit/file_names.h"
#include "support/byte_writer.h"
#include "support/files.h"
#include "support/memory_folder.h"
#include "support/temporary_folder.h"
#include "support/varied_index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::MemoryFile;
using ::quorelastic::testing::MemoryFolder;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::quorelastic::testing::WriteVariedIndex;
using ::testing::EndsWith;
using ::testing::HasSubstr;

class SpecialFolderTest : public ::testing::Test {
 protected:
  void SetUp() override {
    WriteVariedIndex(path(), {.seed = 3,
                              .documents = 12,
                              .documents_per_segment = 20,
                              .compound = false,
                              .compound_store = false});
    for (const std::string& name : ListFolder(path())) {
      if (name.starts_with("segments_")) generation_ = *format::CommitGeneration(name);
    }
    ASSERT_GT(generation_, 0);
  }

  const std::string& path() const { return folder_.path(); }
  std::string CommitPath(int64_t generation) const { return folder_ / format::CommitFileName(generation); }
  void WriteHint(int64_t first, int64_t second) const {
    WriteFile(folder_ / "segments.gen", ByteWriter().Int(-2).Long(first).Long(second).bytes());
  }

  void ExpectClean() const {
    const HealthReport report = CheckIndexHealth(path());
    for (const HealthFinding& finding : report.findings) {
      ADD_FAILURE() << finding.file << ": expected " << finding.expected << ", found " << finding.found;
    }
  }

  // One finding, about a file whose path ends so.
  void ExpectDamaged(const std::string& file, const std::string& found) const {
    const HealthReport report = CheckIndexHealth(path());
    ASSERT_EQ(report.findings.size(), 1U);
    EXPECT_THAT(report.findings[0].file, EndsWith(file));
    EXPECT_THAT(report.findings[0].found, HasSubstr(found));
    EXPECT_TRUE(IsIndexCorrupted(path()));
  }

  // The folder in memory, where reading can be made to fail.
  void Load(MemoryFolder& memory) const {
    for (const std::string& name : ListFolder(path())) memory.files[name].bytes = ReadFile(folder_ / name);
  }

  TemporaryFolder folder_;
  int64_t generation_ = 0;
};

TEST_F(SpecialFolderTest, WithoutAnIndexIsDamaged) {
  std::filesystem::remove(CommitPath(generation_));
  std::filesystem::remove(folder_ / "segments.gen");
  ExpectDamaged(path(), "no segments file");
  std::filesystem::remove_all(path());
  std::filesystem::create_directory(path());
  ExpectDamaged(path(), "no segments file");
}

TEST_F(SpecialFolderTest, ThatDoesNotExistIsAnErrorThatNamesIt) {
  try {
    IsIndexCorrupted(folder_ / "missing");
    ADD_FAILURE() << "no error";
  } catch (const IndexIoError& error) {
    EXPECT_EQ(error.path(), folder_ / "missing");
    EXPECT_EQ(error.error_number(), ENOENT);
  }
  EXPECT_THROW(IsIndexCorrupted(CommitPath(generation_)), IndexIoError);
}

TEST_F(SpecialFolderTest, WithAUselessHintIsClean) {
  WriteHint(generation_ - 1, generation_ - 1);
  ExpectClean();
  WriteHint(generation_ + 5, generation_ + 6);
  ExpectClean();
  WriteFile(folder_ / "segments.gen", "torn");
  ExpectClean();
  std::filesystem::remove(folder_ / "segments.gen");
  ExpectClean();
  std::filesystem::create_directory(folder_ / "segments.gen");
  ExpectClean();
}

TEST_F(SpecialFolderTest, WhoseHintIsAheadOfEveryCommitIsDamaged) {
  for (const int64_t ahead : {1, 2, 1000}) {
    WriteHint(generation_ + ahead, generation_ + ahead);
    const HealthReport report = CheckIndexHealth(path());
    EXPECT_EQ(report.findings.size(), 1U) << ahead;
  }
}

TEST_F(SpecialFolderTest, WithAnIncompleteNewerCommitIsClean) {
  const std::string commit = ReadFile(CommitPath(generation_));
  for (const size_t length : {size_t{0}, size_t{7}, commit.size() - 1}) {
    WriteFile(CommitPath(generation_ + 1), commit.substr(0, length));
    ExpectClean();
    EXPECT_EQ(CheckIndexHealth(path()).generation, generation_);
  }
}

TEST_F(SpecialFolderTest, WithABadCommitTwoGenerationsAheadIsDamaged) {
  WriteFile(CommitPath(generation_ + 2), "bad");
  ExpectDamaged(format::CommitFileName(generation_ + 2), "wanted");
}

TEST_F(SpecialFolderTest, WithACommitOfATerabyteIsDamaged) {
  MemoryFolder memory;
  Load(memory);
  memory.files[format::CommitFileName(generation_)].zeros_after = uint64_t{1} << 40;
  const HealthReport report = check::CheckFolder(memory, {});
  ASSERT_EQ(report.findings.size(), 1U);
  EXPECT_THAT(report.findings[0].file, EndsWith(format::CommitFileName(generation_)));
}

// Holes take no time: what is in them is refused before it is read to its end.
TEST_F(SpecialFolderTest, WithFilesThatGrewByATerabyteIsDamaged) {
  for (const std::string& name : ListFolder(path())) {
    if (name.starts_with("segments")) continue;
    SCOPED_TRACE(name);
    MemoryFolder memory;
    Load(memory);
    memory.files[name].zeros_after = uint64_t{1} << 40;
    EXPECT_FALSE(check::CheckFolder(memory, {}).clean());
  }
}

TEST_F(SpecialFolderTest, WithAFileThatSeemsToBeACommitIsDamagedAndTheFileNamed) {
  for (const char* name : {"segments.old", "segments_4.bak", "segments_", "segmentsx"}) {
    WriteFile(folder_ / name, ReadFile(CommitPath(generation_)));
    ExpectDamaged(name, name);
    std::filesystem::remove(folder_ / name);
  }
  ExpectClean();
}

TEST_F(SpecialFolderTest, WithOtherFilesIsClean) {
  for (const char* name :
       {"readme.txt", "write.lock", "_9.cfs", "_9.fdt", "\xff\xfe", "_0.bak", "_0_1.del"}) {
    WriteFile(folder_ / name, "whatever");
  }
  std::filesystem::create_directory(folder_ / "segments_zzz");
  ExpectClean();
}

TEST_F(SpecialFolderTest, WithoutOneOfTheSegmentsFilesIsDamaged) {
  for (const std::string& name : ListFolder(path())) {
    if (name.starts_with("segments")) continue;
    std::filesystem::rename(folder_ / name, folder_ / "aside");
    ExpectDamaged(name, "No such file or directory");
    std::filesystem::create_directory(folder_ / name);
    ExpectDamaged(name, "Is a directory");
    std::filesystem::remove(folder_ / name);
    std::filesystem::rename(folder_ / "aside", folder_ / name);
  }
}

TEST_F(SpecialFolderTest, WithAFileMissingAndANewerCommitIncompleteIsDamaged) {
  WriteFile(CommitPath(generation_ + 1), "incomplete");
  std::filesystem::remove(folder_ / "_0.prx");
  ExpectDamaged("_0.prx", "No such file or directory");
}

TEST_F(SpecialFolderTest, WithAStrayNormsFileWhereTheCommitSaysLookIsDamaged) {
  const TemporaryFolder other;
  WriteVariedIndex(other.path(),
                   {.seed = 4, .documents = 9, .compound = false, .changed_norms = 1, .payloads = false});
  ASSERT_TRUE(CheckIndexHealth(other.path()).clean());
  // Fields 0 and 1 have no norms; those of 2 or 3 were changed, and the other is looked for.
  int stray = 0;
  for (const char* name : {"_0.s2", "_0.s3"}) {
    WriteFile(other / name, "short");
    if (!CheckIndexHealth(other.path()).clean()) ++stray;
    std::filesystem::remove(other / name);
  }
  EXPECT_EQ(stray, 1);
}

TEST_F(SpecialFolderTest, AFailingDiskIsAnErrorAndNoVerdict) {
  MemoryFolder memory;
  Load(memory);
  ASSERT_TRUE(check::CheckFolder(memory, {}).clean());
  for (auto& [name, file] : memory.files) {
    if (name == "segments.gen") continue;
    SCOPED_TRACE(name);
    file.broken_from = file.bytes.size() / 2;
    EXPECT_THROW(check::CheckFolder(memory, {}), IndexIoError);
    file.broken_from.reset();
  }
}

TEST_F(SpecialFolderTest, AFailingDiskUnderTheNewestCommitIsNoReasonToTakeTheOneBefore) {
  MemoryFolder memory;
  Load(memory);
  MemoryFile newer = memory.files[format::CommitFileName(generation_)];
  newer.broken_from = 10;
  memory.files[format::CommitFileName(generation_ + 1)] = newer;
  EXPECT_THROW(check::CheckFolder(memory, {}), IndexIoError);
}

// Nor is anything else that the system refuses, and it is no verdict about the index either.
TEST_F(SpecialFolderTest, ANewestCommitThatTheSystemRefusesToOpenIsAnErrorAndNoVerdict) {
  for (const int refusal : {EACCES, EMFILE, ENFILE, EIO, ENOMEM}) {
    for (const int64_t newer : {0, 1}) {
      MemoryFolder memory;
      Load(memory);
      const std::string newest = format::CommitFileName(generation_ + newer);
      memory.files[newest] = memory.files[format::CommitFileName(generation_)];
      memory.before_open = [&](const std::string& name) {
        if (name == newest) throw IndexIoError("memory/" + name, "cannot open file", refusal);
      };
      try {
        check::CheckFolder(memory, {});
        ADD_FAILURE() << "a verdict in spite of error " << refusal << ", " << newer << " commit later";
      } catch (const IndexIoError& error) {
        EXPECT_EQ(error.error_number(), refusal);
      }
    }
  }
}

TEST_F(SpecialFolderTest, WithANewestCommitOfZerosIsDamagedUnlessTheOneBeforeIsThere) {
  const std::string commit = ReadFile(CommitPath(generation_));
  WriteFile(CommitPath(generation_ + 1), std::string(commit.size(), '\0'));
  ExpectClean();
  EXPECT_EQ(CheckIndexHealth(path()).generation, generation_);
  std::filesystem::remove(CommitPath(generation_ + 1));
  WriteFile(CommitPath(generation_), std::string(commit.size(), '\0'));
  ExpectDamaged(format::CommitFileName(generation_), "format is 0");
}

// A commit of the layout that names the fewest things, with segments of one document each.
std::string CommitOfSegments(const std::vector<std::string>& segments) {
  const auto count = static_cast<int32_t>(segments.size());
  ByteWriter commit = ByteWriter().Int(-1).Long(1).Int(count).Int(count);
  for (const std::string& segment : segments) commit.String(segment).Int(1);
  return commit.bytes();
}

TEST(SpecialCommitTest, ThatNamesASegmentOftenIsRefusedBeforeAnyFileOfTheSegmentIsOpened) {
  MemoryFolder memory;
  memory.files["segments_1"].bytes = CommitOfSegments(std::vector<std::string>(4096, "_0"));
  for (const char* name : {"_0.fnm", "_0.tis", "_0.tii", "_0.frq", "_0.fdx", "_0.fdt"})
    memory.files[name] = {};
  std::set<std::string> opened;
  memory.before_open = [&](const std::string& name) { opened.insert(name); };
  const HealthReport report = check::CheckFolder(memory, {});
  ASSERT_EQ(report.findings.size(), 1U);
  EXPECT_THAT(report.findings[0].found, HasSubstr("segment _0 is there twice"));
  EXPECT_EQ(opened, (std::set<std::string>{"segments_1", "segments.gen"}));
}

TEST(SpecialCommitTest, OfAnOlderLayoutHasItsFolderListedOnceForAllSegments) {
  const auto count_listings = [](int segments) {
    std::vector<std::string> names;
    for (int i = 0; i < segments; ++i) names.push_back("_" + std::to_string(i));
    MemoryFolder memory;
    memory.files["segments_1"].bytes = CommitOfSegments(names);
    check::CheckFolder(memory, {});
    return memory.listed;
  };
  EXPECT_EQ(count_listings(1000), count_listings(1));
}

TEST_F(SpecialFolderTest, FilesThatVanishWithTheirCommitAreNoDamage) {
  // The writer's next commit replaces the segment just before its files are opened.
  const TemporaryFolder other;
  WriteVariedIndex(other.path(), {.seed = 5, .documents = 5, .documents_per_commit = 2, .optimize = true});
  MemoryFolder memory;
  Load(memory);
  bool is_replaced = false;
  memory.before_open = [&](const std::string& name) {
    if (name != "_0.tis" || is_replaced) return;
    is_replaced = true;
    memory.files.clear();
    for (const std::string& file : ListFolder(other.path()))
      memory.files[file].bytes = ReadFile(other / file);
    int64_t newest = 0;
    for (const auto& [file, content] : memory.files) {
      newest = std::max(newest, format::CommitGeneration(file).value_or(0));
    }
    memory.files[format::CommitFileName(generation_ + 9)] = memory.files[format::CommitFileName(newest)];
  };
  const HealthReport report = check::CheckFolder(memory, {});
  EXPECT_TRUE(report.clean()) << report.findings.front().file;
  EXPECT_EQ(report.generation, generation_ + 9);
}

TEST_F(SpecialFolderTest, ReportsWhatItHasReadAndHowFarItIs) {
  uint64_t bytes = 0;
  HealthProgress last;
  const HealthReport report =
      CheckIndexHealth(path(), {.progress = [&](const HealthProgress& now) { last = now; }});
  for (const std::string& file : report.files) bytes += std::filesystem::file_size(file);
  EXPECT_EQ(report.files.size(), ListFolder(path()).size());
  EXPECT_EQ(last.segments, 1U);
  EXPECT_EQ(last.segments_opened, 1U);
  EXPECT_EQ(last.bytes_opened, bytes);
  EXPECT_GE(last.bytes_read, bytes);
}

TEST_F(SpecialFolderTest, WhatTheProgressCallbackThrowsEndsTheCheck) {
  EXPECT_THROW(
      CheckIndexHealth(path(), {.progress = [](const HealthProgress&) { throw std::length_error("stop"); }}),
      std::length_error);
}

}  // namespace
}  // namespace vantrel::elastic
