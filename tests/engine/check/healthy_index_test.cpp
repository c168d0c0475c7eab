// Whatever the libraries write is clean: there is never a false alarm.

#include <gtest/gtest.h>
#include <sys/wait.h>

#include <cstdlib>
#include <iostream>
#include <ostream>
#include <string>

#include "support/byte_writer.h"
#include "support/files.h"
#include "support/library_checker.h"
#include "support/random_index.h"
#include "support/run_size.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "support/varied_index.h"
#include "vantrel/elastic/index_health.h"
#include "vantrel/elastic/library_setup.h"

namespace vantrel::elastic {

// What a failed expectation shows.
std::ostream& operator<<(std::ostream& out, const HealthFinding& finding) {
  return out << finding.segment << " " << finding.file << ", offset " << finding.offset << ": expected "
             << finding.expected << ", found " << finding.found;
}

namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::CheckWithLibrary;
using ::quorelastic::testing::LibraryVerdict;
using ::quorelastic::testing::RandomIndexShape;
using ::quorelastic::testing::RandomShape;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::RunSize;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::quorelastic::testing::WriteRandomIndex;
using ::quorelastic::testing::WriteVariedIndex;

void ExpectClean(const std::string& path) {
  const HealthReport report = CheckIndexHealth(path);
  for (const HealthFinding& finding : report.findings) ADD_FAILURE() << finding;
  EXPECT_FALSE(IsIndexCorrupted(path));
}

class HealthyIndexTest : public ::testing::Test {
 protected:
  static void SetUpTestSuite() { PrepareIndexLibrary(); }
};

// QUORELASTIC_HEALTHY_INDEXES makes it a longer campaign.
TEST_F(HealthyIndexTest, RandomIndexesOfEveryKindAreClean) {
  const int count = RunSize("QUORELASTIC_HEALTHY_INDEXES", 150 / ::quorelastic::testing::kFewer);
  for (int seed = 1; seed <= count; ++seed) {
    SCOPED_TRACE("seed " + std::to_string(seed));
    const TemporaryFolder folder;
    WriteVariedIndex(folder.path(), RandomShape(static_cast<uint32_t>(seed)));
    ExpectClean(folder.path());
    if (HasFailure()) return;
  }
}

TEST_F(HealthyIndexTest, SeveralLevelsOfSkipDataAreClean) {
  for (const bool compound : {false, true}) {
    const TemporaryFolder folder;
    WriteVariedIndex(folder.path(),
                     {.seed = 5, .documents = 4200, .documents_per_segment = 5000, .compound = compound});
    ExpectClean(folder.path());
  }
}

TEST_F(HealthyIndexTest, TheIndexesOfTheOtherTestsAreClean) {
  for (const RandomIndexShape& shape :
       {RandomIndexShape{.seed = 1, .compound = false, .term_index_interval = 4},
        RandomIndexShape{.seed = 2, .deletions = 9, .delete_segment = true},
        RandomIndexShape{.seed = 3, .documents = 700, .documents_per_segment = 1000, .deletions = 1}}) {
    const TemporaryFolder folder;
    WriteRandomIndex(folder.path(), shape);
    ExpectClean(folder.path());
  }
}

TEST_F(HealthyIndexTest, OlderLayoutsAreClean) {
  for (const char* arguments : {"plain 250 0", "plain 250 40", "compound 250 0", "compound 250 40",
                                "plain 90 90", "compound 3000 1"}) {
    SCOPED_TRACE(arguments);
    const TemporaryFolder folder;
    const std::string command = std::string(CLUCENE_WRITER) + " '" + folder.path() + "' " + arguments;
    const int status = std::system(command.c_str());
    ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << command;
    ExpectClean(folder.path());
  }
}

// Three documents by hand, in layouts that nothing writes any more; `format` is the dictionary's.
void WriteOldest(const TemporaryFolder& folder, int format) {
  const auto header = [&](int64_t count, bool is_index) {
    if (format == 0) return ByteWriter().Int(count);
    ByteWriter out = ByteWriter().Int(format).Long(count);
    if (format < -1 || !is_index) out.Int(128).Int(16);
    if (format <= -3) out.Int(10);
    return out;
  };
  WriteFile(folder / "segments", ByteWriter().Int(1).Int(1).String("_0").Int(3).bytes());
  WriteFile(folder / "_0.fnm",
            ByteWriter().VInt(2).UnitsString(u"k\u00f6rper").Byte(0x13).UnitsString(u"z").Byte(0x01).bytes());
  WriteFile(folder / "_0.tis", header(2, false)
                                   .VInt(0)
                                   .UnitsString(u"a")
                                   .VInt(0)
                                   .VInt(3)
                                   .VLong(0)
                                   .VLong(0)
                                   .VInt(0)
                                   .UnitsString(u"\u00e4\u4e2d")
                                   .VInt(1)
                                   .VInt(1)
                                   .VLong(3)
                                   .VLong(3)
                                   .bytes());
  const auto first = static_cast<uint64_t>(header(2, false).size());
  WriteFile(folder / "_0.tii",
            header(1, true).VInt(0).VInt(0).VInt(-1).VInt(0).VLong(0).VLong(0).VLong(first).bytes());
  WriteFile(folder / "_0.frq", ByteWriter().VInt(1).VInt(3).VInt(3).VInt(5).bytes());
  WriteFile(folder / "_0.prx", std::string(4, '\0'));
  WriteFile(folder / "_0.f1", "abc");
  WriteFile(folder / "_0.fdx", ByteWriter().Long(0).Long(1).Long(2).bytes());
  WriteFile(folder / "_0.fdt", std::string(3, '\0'));
  WriteFile(folder / "_0.tvx", ByteWriter().Int(1).Long(4).Long(7).Long(8).bytes());
  WriteFile(folder / "_0.tvd", ByteWriter().Int(1).VInt(1).VInt(0).VLong(4).VInt(0).VInt(0).bytes());
  WriteFile(folder / "_0.tvf", ByteWriter().Int(1).VInt(1).VInt(0).VInt(0).UnitsString(u"a").VInt(1).bytes());
}

TEST_F(HealthyIndexTest, TheOldestLayoutsAreCleanAndTheirDamageIsFound) {
  for (int format = -3; format <= 0; ++format) {
    SCOPED_TRACE("format " + std::to_string(format));
    const TemporaryFolder folder;
    WriteOldest(folder, format);
    ExpectClean(folder.path());
    EXPECT_EQ(CheckWithLibrary(folder.path()), LibraryVerdict::kClean);
    for (const char* name : {"_0.frq", "_0.prx", "_0.f1", "_0.tvd", "_0.tvf", "_0.fdt", "_0.tis", "_0.tii"}) {
      const std::string intact = ReadFile(folder / name);
      WriteFile(folder / name, intact + '\0');
      EXPECT_TRUE(IsIndexCorrupted(folder.path())) << name << " is longer";
      WriteFile(folder / name, intact.substr(0, intact.size() - 1));
      EXPECT_TRUE(IsIndexCorrupted(folder.path())) << name << " is shorter";
      WriteFile(folder / name, intact);
    }
    WriteFile(folder / "_0.s1", "xyz");
    ExpectClean(folder.path());
    WriteFile(folder / "_0.s1", "xy");
    EXPECT_TRUE(IsIndexCorrupted(folder.path())) << "own norms are short";
  }
}

TEST_F(HealthyIndexTest, AnIndexWithoutDocumentsIsClean) {
  const TemporaryFolder folder;
  WriteVariedIndex(folder.path(), {.documents = 0});
  ExpectClean(folder.path());
  ASSERT_EQ(CheckWithLibrary(folder.path()), LibraryVerdict::kClean);
}

TEST_F(HealthyIndexTest, AnyNumberOfThreadsGivesTheSameReport) {
  const TemporaryFolder folder;
  WriteVariedIndex(folder.path(), {.seed = 9, .documents = 200, .deletions = 5, .changed_norms = 4});
  const HealthReport one = CheckIndexHealth(folder.path(), {.threads = 1});
  EXPECT_TRUE(one.clean());
  EXPECT_GT(one.generation, 0);
  for (const unsigned threads : {2U, 7U}) {
    const HealthReport more = CheckIndexHealth(folder.path(), {.threads = threads});
    EXPECT_EQ(more.findings, one.findings);
    EXPECT_EQ(more.files, one.files);
  }
}

}  // namespace
}  // namespace vantrel::elastic
