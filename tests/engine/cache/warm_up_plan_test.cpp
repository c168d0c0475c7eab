#include "elastic/cache/warm_up_plan.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <filesystem>

#include "support/files.h"
#include "support/library_index.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

class WarmUpPlanTest : public ::testing::Test {
 protected:
  void WriteFiles(const std::string& folder, const std::vector<std::string>& names) const {
    std::filesystem::create_directory(root_ / folder);
    for (const std::string& name : names)
      WriteFile(root_ / folder + "/" + name, std::string(name.size(), 'x'));
  }

  // The plan's files, in its order, without the root.
  std::vector<std::string> PlannedFiles() const {
    std::vector<std::string> files;
    for (const Extent& extent : PlanWarmUp(root_.path()))
      files.push_back(extent.path.substr(root_.path().size() + 1));
    return files;
  }

  TemporaryFolder root_;
};

TEST_F(WarmUpPlanTest, PutsWhatSearchesNeedFirstOverAllIndexes) {
  const std::vector<std::string> names = {"_0.fdt", "_0.frq", "_0.nrm",    "_0.prx",
                                          "_0.tii", "_0.tis", "segments_1"};
  WriteFiles("a", names);
  WriteFiles("b", names);
  EXPECT_THAT(PlannedFiles(), ElementsAre("a/_0.tii", "b/_0.tii", "a/_0.tis", "b/_0.tis", "a/_0.nrm",
                                          "b/_0.nrm", "a/_0.frq", "b/_0.frq", "a/_0.prx", "b/_0.prx",
                                          "a/_0.fdt", "a/segments_1", "b/_0.fdt", "b/segments_1"));
  EXPECT_EQ(PlanWarmUp(root_.path()).front(), (Extent{root_ / "a/_0.tii", 0, 6}));
}

TEST_F(WarmUpPlanTest, TakesFoldersForIndexesThatHoldACommit) {
  WriteFiles("import", {"documents.json", "_0.tii"});
  WriteFiles(".new-mail", {"segments_1"});
  WriteFiles("mail", {"segments_2"});
  WriteFile(root_ / "segments_1", "no folder");
  EXPECT_THAT(PlannedFiles(), ElementsAre("mail/segments_2"));
}

TEST_F(WarmUpPlanTest, PartsOfACompoundFileCountByWhatTheyAre) {
  {
    LibraryIndex index(root_ / "a", {.compound = true});
    index.Add({{.name = "body", .value = "some words to be indexed"}});
  }
  const std::string file = root_ / "a/_0.cfs";
  std::vector<Extent> parts;
  for (const Extent& extent : PlanWarmUp(root_.path())) {
    if (extent.path == file) parts.push_back(extent);
  }
  ASSERT_GT(parts.size(), 6U);
  EXPECT_EQ(ReadFile(file).substr(parts[1].offset, 4), "\xff\xff\xff\xfc")
      << "after the table, dictionaries come first";
  // All of the file, once.
  std::sort(parts.begin(), parts.end(),
            [](const auto& left, const auto& right) { return left.offset < right.offset; });
  uint64_t end = 0;
  for (const Extent& part : parts) {
    EXPECT_EQ(part.offset, end);
    end += part.length;
  }
  EXPECT_EQ(end, std::filesystem::file_size(file));
}

TEST_F(WarmUpPlanTest, ACompoundFileThatCannotBeReadIsTakenAsAWhole) {
  WriteFiles("a", {"_0.cfs", "segments_1"});
  EXPECT_THAT(PlannedFiles(), ElementsAre("a/_0.cfs", "a/segments_1"));
}

TEST_F(WarmUpPlanTest, WhatIsNoFileIsLeftOut) {
  WriteFiles("a", {"segments_1"});
  ASSERT_EQ(mkfifo((root_ / "a/_0.tis").c_str(), 0600), 0);
  ASSERT_EQ(mkfifo((root_ / "a/_1.cfs").c_str(), 0600), 0);
  std::filesystem::create_symlink("nowhere", root_ / "a/_0.tii");
  std::filesystem::create_directory(root_ / "a/_0.frq");
  EXPECT_THAT(PlannedFiles(), ElementsAre("a/segments_1"));
}

TEST_F(WarmUpPlanTest, WithoutARootThereIsNothingToDo) {
  EXPECT_THAT(PlanWarmUp(root_ / "missing"), IsEmpty());
  WriteFile(root_ / "file", "");
  EXPECT_THAT(PlanWarmUp(root_ / "file"), IsEmpty());
  EXPECT_THAT(PlanWarmUp(""), IsEmpty());
}

}  // namespace
}  // namespace vantrel::elastic
