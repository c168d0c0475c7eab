#include "elastic/cache/page_cache.h"

#include <gtest/gtest.h>

#include <filesystem>

#include "support/files.h"
#include "support/page_cache.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::CountPages;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::ThrowOutOfPageCache;
using ::quorelastic::testing::WriteFile;

constexpr uint64_t kMiB = uint64_t{1} << 20;
constexpr uint64_t kFileSize = 12 * kMiB + 1000;  // more than is read at once

class PageCacheTest : public ::testing::Test {
 protected:
  void SetUp() override {
    std::filesystem::create_directory(folder_ / "index");
    for (const char* name : {"segments_1", "_0.tii", "_0.frq", "_0.fdt"}) {
      WriteFile(Path(name), std::string(kFileSize, 'x'));
    }
    if (!ThrowOutOfPageCache(folder_.path())) {
      GTEST_SKIP() << "files cannot be thrown out of the page cache on the file system of " << folder_.path();
    }
  }

  std::string Path(const std::string& name) const { return folder_ / "index/" + name; }

  bool IsResident(const std::string& name) const {
    const auto [resident, all] = CountPages(Path(name));
    return resident == all;
  }
  bool IsCold(const std::string& name) const { return CountPages(Path(name)).resident == 0; }

  TemporaryFolder folder_;
};

TEST_F(PageCacheTest, HoldsEveryPageOnceItIsWarm) {
  const PageCacheWarmUp result = WarmPageCache(folder_.path());
  for (const char* name : {"segments_1", "_0.tii", "_0.frq", "_0.fdt"}) EXPECT_TRUE(IsResident(name)) << name;
  EXPECT_EQ(result.bytes, 4 * kFileSize);
  EXPECT_TRUE(result.is_whole);
}

TEST_F(PageCacheTest, IsFilledNoFurtherThanThereIsRoomAndWithTheFirstThings) {
  const PageCacheWarmUp result = BringIn(PlanWarmUp(folder_.path()), kFileSize + 2 * kMiB);
  EXPECT_EQ(result.bytes, kFileSize + 2 * kMiB);
  EXPECT_FALSE(result.is_whole);
  EXPECT_TRUE(IsResident("_0.tii"));
  EXPECT_FALSE(IsResident("_0.frq"));
  EXPECT_FALSE(IsCold("_0.frq"));
  EXPECT_TRUE(IsCold("_0.fdt"));
  EXPECT_TRUE(IsCold("segments_1"));
}

TEST_F(PageCacheTest, StaysAsItIsWhereThereIsNoRoom) {
  const PageCacheWarmUp result = BringIn(PlanWarmUp(folder_.path()), 0);
  EXPECT_EQ(result.bytes, 0U);
  EXPECT_FALSE(result.is_whole);
  EXPECT_TRUE(IsCold("_0.tii"));
}

TEST_F(PageCacheTest, TakesThePartsThatItIsTold) {
  const PageCacheWarmUp result = BringIn({{Path("_0.fdt"), 2 * kMiB, 4096}}, kMiB);
  EXPECT_EQ(result.bytes, 4096U);
  EXPECT_TRUE(result.is_whole);
  EXPECT_FALSE(IsCold("_0.fdt"));
  EXPECT_FALSE(IsResident("_0.fdt"));
}

TEST_F(PageCacheTest, FilesThatAreGoneOrShrankArePassedOver) {
  std::vector<Extent> plan = PlanWarmUp(folder_.path());
  std::filesystem::remove(Path("_0.tii"));
  std::filesystem::resize_file(Path("_0.frq"), kMiB);
  plan.push_back({folder_.path(), 0, 4096});
  const PageCacheWarmUp result = BringIn(plan, 1024 * kMiB);
  EXPECT_EQ(result.bytes, kMiB + 2 * kFileSize);
  EXPECT_TRUE(result.is_whole);
  EXPECT_TRUE(IsResident("_0.fdt"));
}

TEST_F(PageCacheTest, IsNotTouchedForARootThatIsNotThere) {
  const PageCacheWarmUp result = WarmPageCache(folder_ / "missing");
  EXPECT_EQ(result.bytes, 0U);
  EXPECT_TRUE(result.is_whole);
}

}  // namespace
}  // namespace vantrel::elastic
