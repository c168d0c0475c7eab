// "vmtouch": the daemon's indexes in the page cache.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "support/files.h"
#include "support/page_cache.h"
#include "support/sandbox_test.h"
#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

class VmTouchTest : public SandboxTest {
 protected:
  std::string Index(const std::string& name) const { return sandbox_.data_root() + "/" + name; }

  static void WriteIndex(const std::string& path, bool compound) {
    LibraryIndex index(path, {.compound = compound});
    for (int i = 0; i < 2000; ++i) {
      std::string text;
      for (int word = 0; word < 50; ++word) text += std::to_string(i * 50 + word) + " ";
      index.Add({{.name = "body", .value = text}});
    }
  }

  static PageCount CountFolder(const std::string& folder) {
    PageCount sum;
    for (const std::string& name : ListFolder(folder)) {
      const auto [resident, all] = CountPages(folder + "/" + name);
      sum.resident += resident;
      sum.all += all;
    }
    return sum;
  }

  RunResult Touch() const { return sandbox_.RunTool({"-a", "vmtouch"}); }

  Sandbox sandbox_;
};

TEST_F(VmTouchTest, BringsEveryPageOfEveryIndexInAndPrintsNothing) {
  WriteIndex(Index("plain"), false);
  WriteIndex(Index("compound"), true);
  const auto count = [this] {
    const PageCount plain = CountFolder(Index("plain"));
    const PageCount compound = CountFolder(Index("compound"));
    return PageCount{.resident = plain.resident + compound.resident, .all = plain.all + compound.all};
  };
  // The kernel may take pages back at any time, which is no fault of the run.
  PageCount pages;
  for (int tries = 0; tries < 5 && (tries == 0 || pages.resident < pages.all); ++tries) {
    if (!ThrowOutOfPageCache(sandbox_.data_root()))
      GTEST_SKIP() << "this file system keeps its files in memory";
    EXPECT_EQ(count().resident, 0U);
    EXPECT_THAT(Touch(), Printed(""));
    pages = count();
  }
  EXPECT_GT(pages.all, 600U);
  EXPECT_EQ(pages.resident, pages.all);
}

TEST_F(VmTouchTest, PassesOverWhatItCannotRead) {
  WriteIndex(Index("mail"), false);
  std::filesystem::create_directory(Index("closed"));
  WriteFile(Index("closed/segments_1"), "no commit");
  if (!ThrowOutOfPageCache(sandbox_.data_root()))
    GTEST_SKIP() << "this file system keeps its files in memory";
  std::filesystem::permissions(Index("mail/_0.tii"), std::filesystem::perms::none);
  std::filesystem::permissions(Index("closed"), std::filesystem::perms::none);
  EXPECT_THAT(Touch(), Printed(""));
  std::filesystem::permissions(Index("closed"), std::filesystem::perms::owner_all);
  std::filesystem::permissions(Index("mail/_0.tii"), std::filesystem::perms::owner_all);
  const PageCount pages = CountPages(Index("mail/_0.frq"));
  EXPECT_EQ(pages.resident, pages.all);
  EXPECT_EQ(CountPages(Index("mail/_0.tii")).resident, 0U);
}

TEST_F(VmTouchTest, HasNothingToDoWithoutIndexes) {
  EXPECT_THAT(Touch(), Printed(""));
  std::filesystem::remove_all(sandbox_.data_root());
  std::filesystem::create_directory(sandbox_.data_root());
  EXPECT_THAT(sandbox_.RunTool({"-a", "vmtouch", "-d", "/nowhere", "-si", "-1"}), Printed(""));
}

TEST(VmTouchWithoutRootTest, HasNothingToDoEither) {
  if (std::filesystem::exists("/var/lib/quorelastic")) GTEST_SKIP() << "there is a data root on this machine";
  EXPECT_THAT(RunTool({"-a", "vmtouch"}), Printed(""));
}

}  // namespace
}  // namespace quorelastic::testing
