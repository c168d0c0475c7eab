// What a repair would drop, told beforehand. What it does is tested with the program: tests/tool/repair_test.cpp.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <string>

#include "support/byte_writer.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_repair.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using Loss = RepairReport::Loss;

class RepairPlanTest : public ::testing::Test {
 protected:
  // Three segments of ten documents each; "13" is deleted again.
  RepairPlanTest() {
    index_ = Index::Create(path_, {.fields = {{.name = "body"}}, .compound_files = false});
    for (int segment = 0; segment < 3; ++segment) {
      for (int number = 0; number < 10; ++number) {
        index_->Add({{{"id", std::to_string(segment) + std::to_string(number)}, {"body", "a word"}}});
      }
      index_->Commit();
    }
    index_->DeleteById("13");
    index_->Commit();
  }

  std::string File(const std::string& name) const { return path_ + "/" + name; }

  // The index library divides by this.
  void MakeUnsafe(const std::string& segment) const {
    const std::string file = File(segment + ".tis");
    WriteFile(file, ReadFile(file).replace(12, 4, ByteWriter().Int(0).bytes()));
  }

  std::map<std::string, std::string> Contents() const {
    std::map<std::string, std::string> files;
    for (const std::string& name : ListFolder(path_)) files[name] = ReadFile(File(name));
    return files;
  }

  const TemporaryFolder folder_;
  const std::string path_ = folder_ / "index";
  std::shared_ptr<Index> index_;
};

TEST_F(RepairPlanTest, OfAHealthyIndexIsEmptyAlsoBesideAWriter) {
  const RepairReport report = PlanRepair(path_);
  EXPECT_TRUE(report.is_clean);
  EXPECT_THAT(report.losses, IsEmpty());
  EXPECT_EQ(report.generation, index_->Statistics().generation);
}

TEST_F(RepairPlanTest, CountsTheDocumentsThatWouldBeLostAndChangesNothing) {
  std::filesystem::remove(File("_1.frq"));
  MakeUnsafe("_2");
  const auto before = Contents();
  const RepairReport report = PlanRepair(path_);
  EXPECT_FALSE(report.is_clean);
  EXPECT_THAT(report.losses, ElementsAre(Loss{.segment = "_1", .documents = 9, .is_condemned = false},
                                         Loss{.segment = "_2", .documents = 10, .is_condemned = true}));
  EXPECT_EQ(Contents(), before);
}

TEST_F(RepairPlanTest, IsWhatTheRepairThenDoes) {
  index_.reset();
  std::filesystem::remove(File("_0.fnm"));
  const RepairReport plan = PlanRepair(path_);
  const RepairReport done = RepairIndex(path_);
  EXPECT_THAT(plan.losses, ElementsAre(Loss{.segment = "_0", .documents = 10}));
  EXPECT_EQ(done.losses, plan.losses);
  EXPECT_EQ(done.generation, plan.generation);
  EXPECT_TRUE(PlanRepair(path_).is_clean);
  EXPECT_EQ(Index::Open(path_)->CountDocuments().live, 19U);
}

TEST_F(RepairPlanTest, IsRefusedWhereTheCommitCannotBeRead) {
  index_.reset();
  const std::string commit = File("segments_" + std::to_string(Index::Open(path_)->Statistics().generation));
  WriteFile(commit, ReadFile(commit).substr(0, 20));
  EXPECT_THROW(PlanRepair(path_), IndexError);
}

// The index library takes zeros for an empty index of its oldest layout, and a negative length for a huge one.
TEST_F(RepairPlanTest, IsOfTheCommitBeforeWhereTheNewestIsNone) {
  index_.reset();
  const int64_t generation = Index::Open(path_)->Statistics().generation;
  const std::string commit = ReadFile(File("segments_" + std::to_string(generation)));
  std::filesystem::remove(File("_1.frq"));
  std::string negative_length = commit;
  negative_length.replace(20, 5, ByteWriter().VInt(-1).bytes());
  for (const std::string& newest : {std::string(commit.size(), '\0'), negative_length}) {
    WriteFile(File("segments_" + std::to_string(generation + 1)), newest);
    const RepairReport report = PlanRepair(path_);
    EXPECT_EQ(report.generation, generation);
    EXPECT_THAT(report.losses, ElementsAre(Loss{.segment = "_1", .documents = 9}));
  }
}

TEST_F(RepairPlanTest, IsRefusedAtOnceWhereTheCommitNamesASegmentOften) {
  index_.reset();
  constexpr int kSegments = 4096;
  ByteWriter commit = ByteWriter().Int(-1).Long(1).Int(kSegments).Int(kSegments);
  for (int i = 0; i < kSegments; ++i) commit.String("_0").Int(10);
  WriteFile(File("segments_z"), commit.bytes());
  EXPECT_THROW(PlanRepair(path_), IndexDamagedError);
}

TEST_F(RepairPlanTest, IsRefusedWhereThereIsNoIndex) {
  EXPECT_THROW(PlanRepair(folder_ / "nowhere"), IndexError);
  EXPECT_THROW(PlanRepair(folder_.path()), IndexError);
}

}  // namespace
}  // namespace vantrel::elastic
