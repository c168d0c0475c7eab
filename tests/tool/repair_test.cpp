// "repair": one word on standard error, and an index without the segments that cannot be read, but no others.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "support/byte_writer.h"
#include "support/files.h"
#include "support/library_checker.h"
#include "tool/inspection.h"
#include "tool/outcome.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/write_lock.h"

namespace quorelastic::testing {
namespace {

using ::testing::HasSubstr;
using ::testing::StartsWith;

auto Clean() { return Ended(0, "", "clean\n"); }
auto Done() { return Ended(0, "", "done\n"); }

std::map<std::string, std::string> Contents(const std::string& folder) {
  std::map<std::string, std::string> files;
  for (const std::string& name : ListFolder(folder)) files[name] = ReadFile(folder + "/" + name);
  return files;
}

class RepairTest : public ::testing::Test {
 protected:
  // Three segments of files of their own; the documents of _N have the ids "N0" to "N9".
  RepairTest() {
    LibraryIndex index(path(), {.compound = false});
    for (int segment = 0; segment < 3; ++segment) {
      for (int number = 0; number < 10; ++number) {
        index.Add({Keyword("id", std::to_string(segment) + std::to_string(number)),
                   VectorText("body", "a word and another", LibraryField::Vector::kPositions)});
      }
      index.Commit();
    }
  }

  std::string path() const { return folder_ / "index"; }
  std::string File(const std::string& name) const { return path() + "/" + name; }

  // The index library divides by this.
  void MakeUnsafe(const std::string& segment) const {
    const std::string file = File(segment + ".tis");
    WriteFile(file, ReadFile(file).replace(12, 4, ByteWriter().Int(0).bytes()));
  }

  void ExpectSegments(const std::vector<int>& segments) const {
    EXPECT_THAT(Inspect("check", path()), Clean());
    EXPECT_EQ(CheckWithLibrary(path()), LibraryVerdict::kClean);
    std::string ids;
    for (const int segment : segments) {
      for (int number = 0; number < 10; ++number) {
        ids += "field: id text: " + std::to_string(segment) + std::to_string(number) + "\n";
      }
    }
    std::string found;
    for (const std::string& line :
         LinesWithEnds(Inspect("term", path(), {"-i", "-f", "id", "-m", "100"}).out)) {
      if (line.starts_with("field: ")) found += line;
    }
    EXPECT_EQ(found, ids);
  }

  // A run that ends by an exception and leaves everything as it was.
  void ExpectRefusal(const std::string& exception, const ::testing::Matcher<std::string>& what) const {
    const auto before = Contents(path());
    EXPECT_THAT(Inspect("repair", path()), Aborted("", exception, what));
    EXPECT_EQ(Contents(path()), before) << "it was changed";
  }

  TemporaryFolder folder_;
};

TEST_F(RepairTest, LeavesAHealthyIndexAsItIs) {
  const auto before = Contents(path());
  EXPECT_THAT(Inspect("repair", path()), Clean());
  EXPECT_EQ(Contents(path()), before);
}

TEST_F(RepairTest, DropsTheSegmentThatCannotBeRead) {
  std::filesystem::remove(File("_1.frq"));
  EXPECT_THAT(Inspect("repair", path()), Done());
  ExpectSegments({0, 2});
  EXPECT_THAT(Inspect("repair", path()), Clean());
}

TEST_F(RepairTest, DropsASegmentThatTheLibrarysCheckerCrashesOn) {
  MakeUnsafe("_1");
  ASSERT_EQ(CheckWithLibrary(path()), LibraryVerdict::kFailed);
  EXPECT_THAT(Inspect("repair", path()), Done());
  ExpectSegments({0, 2});
}

TEST_F(RepairTest, DropsEverySegmentWhereNoneIsLeft) {
  MakeUnsafe("_0");
  std::filesystem::remove(File("_1.fnm"));
  WriteFile(File("_2.tis"), "");
  EXPECT_THAT(Inspect("repair", path()), Done());
  ExpectSegments({});
}

TEST_F(RepairTest, KeepsASegmentThatSharesStoredFieldsWithADroppedOne) {
  std::filesystem::remove_all(path());
  {
    LibraryIndex index(path(), {.compound = false, .documents_per_segment = 10});
    for (const char* id : {"0", "1"}) {
      for (int number = 0; number < 10; ++number) {
        index.Add({Keyword("id", id + std::to_string(number)),
                   VectorText("body", "a word", LibraryField::Vector::kTerms)});
      }
    }
  }
  ASSERT_TRUE(std::filesystem::exists(File("_0.fdt")));
  ASSERT_FALSE(std::filesystem::exists(File("_1.fdt")));
  MakeUnsafe("_0");
  EXPECT_THAT(Inspect("repair", path()), Done());
  ExpectSegments({1});
  EXPECT_THAT(Inspect("doc_term", path(), {"-f", "body"}), Printed("body: a\nbody: word\n"));
}

TEST_F(RepairTest, KeepsASegmentWhoseDamageTheLibraryLivesWith) {
  WriteFile(File("_1.frq"), ReadFile(File("_1.frq")) + '\0');
  EXPECT_THAT(Inspect("check", path()), Ended(0, "", "NOT clean\n"));
  const auto before = Contents(path());
  EXPECT_THAT(Inspect("repair", path()), Clean());
  EXPECT_EQ(Contents(path()), before);
}

// Three segments as before, written by the engine, which leaves a manifest.
class RepairWithManifestTest : public RepairTest {
 protected:
  RepairWithManifestTest() {
    std::filesystem::remove_all(path());
    const auto index =
        vantrel::elastic::Index::Create(path(), {.fields = {{.name = "body"}}, .compound_files = false});
    for (int segment = 0; segment < 3; ++segment) {
      for (int number = 0; number < 10; ++number) {
        index->Add({{{"id", std::to_string(segment) + std::to_string(number)}, {"body", "a word"}}});
      }
      index->Commit();
    }
  }

  void FlipNorm(const std::string& segment) const {
    std::string norms = ReadFile(File(segment + ".nrm"));
    norms.back() = static_cast<char>(norms.back() ^ 1);
    WriteFile(File(segment + ".nrm"), norms);
  }
};

TEST_F(RepairWithManifestTest, LeavesAFreshOne) {
  std::filesystem::remove(File("_1.frq"));
  EXPECT_THAT(Inspect("repair", path()), Done());
  ExpectSegments({0, 2});
  FlipNorm("_2");
  EXPECT_THAT(Inspect("check", path()), Ended(0, "", "NOT clean\n"));
}

TEST_F(RepairWithManifestTest, DoesNotBlessWhatHasDecayedInAKeptSegment) {
  FlipNorm("_2");
  std::filesystem::remove(File("_1.frq"));
  EXPECT_THAT(Inspect("repair", path()), Done());
  EXPECT_EQ(CheckWithLibrary(path()), LibraryVerdict::kClean);
  EXPECT_THAT(Inspect("check", path()), Ended(0, "", "NOT clean\n"));
}

TEST_F(RepairWithManifestTest, LeavesNoneWhereTheCommitHadNone) {
  std::filesystem::remove(File("quorelastic.manifest"));
  std::filesystem::remove(File("_1.frq"));
  EXPECT_THAT(Inspect("repair", path()), Done());
  EXPECT_FALSE(std::filesystem::exists(File("quorelastic.manifest")));
}

TEST_F(RepairTest, RefusesAnIndexThatIsOpenForWriting) {
  MakeUnsafe("_1");
  const vantrel::elastic::WriteLock writer(path());
  ExpectRefusal("vantrel::elastic::IndexLockedError", StartsWith(path() + ": "));
}

TEST_F(RepairTest, RefusesAHealthyIndexThatIsOpenForWriting) {
  const vantrel::elastic::WriteLock writer(path());
  ExpectRefusal("vantrel::elastic::IndexLockedError", StartsWith(path() + ": "));
}

TEST_F(RepairTest, GoesOnWithALockThatNobodyHolds) {
  { const vantrel::elastic::WriteLock writer(path()); }
  EXPECT_THAT(Inspect("repair", path()), Clean());
  MakeUnsafe("_2");
  EXPECT_THAT(Inspect("repair", path()), Done());
  ExpectSegments({0, 1});
}

TEST_F(RepairTest, RefusesAFolderWhoseCommitCannotBeRead) {
  for (const std::string& name : ListFolder(path())) {
    if (name.starts_with("segments_")) WriteFile(File(name), "something else");
  }
  ExpectRefusal("vantrel::elastic::IndexDamagedError", HasSubstr("segments_"));
}

TEST_F(RepairTest, RefusesAFolderWithoutACommit) {
  for (const std::string& name : ListFolder(path())) std::filesystem::remove(File(name));
  const RunResult run = Inspect("repair", path());
  EXPECT_EQ(run.signal, SIGABRT) << run;
  EXPECT_THAT(run.err, HasSubstr(path()));
  EXPECT_TRUE(ListFolder(path()).empty());
  std::filesystem::remove(path());
  EXPECT_THAT(Inspect("repair", path()),
              Aborted("", "vantrel::elastic::IndexIoError",
                      path() + ": cannot open index folder: No such file or directory"));
  EXPECT_FALSE(std::filesystem::exists(path()));
}

TEST_F(RepairTest, RepairsAtAPathOfAnyScriptInAnyLocale) {
  MakeUnsafe("_0");
  const std::string elsewhere = folder_ / "größe 中文";
  std::filesystem::rename(path(), elsewhere);
  EXPECT_THAT(Inspect("repair", elsewhere, {}, {.environment = {"LC_ALL=C"}}), Done());
  EXPECT_THAT(Inspect("repair", elsewhere, {}, {.environment = {"LC_ALL=no such locale"}}), Clean());
}

}  // namespace
}  // namespace quorelastic::testing
