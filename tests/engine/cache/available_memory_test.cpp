#include "elastic/cache/available_memory.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <limits>

#include "support/files.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::TemporaryFolder;

constexpr uint64_t kMebibyte = uint64_t{1} << 20;
constexpr uint64_t kUnlimited = std::numeric_limits<uint64_t>::max();

// A system whose /proc and /sys say what a test wants.
class AvailableMemoryTest : public ::testing::Test {
 protected:
  void Write(const std::string& path, const std::string& text) const {
    std::filesystem::create_directories(std::filesystem::path(root_ / path).parent_path());
    quorelastic::testing::WriteFile(root_ / path, text);
  }

  uint64_t Available() const { return AvailableMemory(root_.path()); }

  TemporaryFolder root_;
};

TEST_F(AvailableMemoryTest, IsWhatTheKernelEstimates) {
  Write("proc/meminfo",
        "MemTotal:       24683852 kB\nMemFree:        100 kB\nMemAvailable:    4096 kB\nCached: 7 kB\n");
  EXPECT_EQ(Available(), 4 * kMebibyte);
}

TEST_F(AvailableMemoryTest, LeavesSharedMemoryToTheKernelsEstimate) {
  Write("proc/meminfo", "MemAvailable:    4096 kB\nCached: 9000 kB\nShmem:   1024 kB\n");
  EXPECT_EQ(Available(), 4 * kMebibyte) << "the estimate has left it out already";
}

TEST_F(AvailableMemoryTest, SharedMemoryOfAControlGroupCannotGo) {
  Write("proc/self/cgroup", "0::/box\n");
  Write("sys/fs/cgroup/box/memory.max", std::to_string(100 * kMebibyte) + "\n");
  Write("sys/fs/cgroup/box/memory.current", std::to_string(70 * kMebibyte) + "\n");
  const std::string cache = "anon 1\nfile " + std::to_string(40 * kMebibyte) + "\n";
  Write("sys/fs/cgroup/box/memory.stat", cache + "shmem " + std::to_string(25 * kMebibyte) + "\n");
  EXPECT_EQ(Available(), 45 * kMebibyte) << "of 70 in use, 15 are page cache of files";
  Write("sys/fs/cgroup/box/memory.stat", cache + "shmem " + std::to_string(41 * kMebibyte) + "\n");
  EXPECT_EQ(Available(), 30 * kMebibyte) << "the numbers need not be of one moment";
}

TEST_F(AvailableMemoryTest, IsUnlimitedWhereTheKernelDoesNotTell) {
  EXPECT_EQ(Available(), kUnlimited);
  Write("proc/meminfo", "MemTotal:       24683852 kB\nMemAvailable: lots\n");
  Write("proc/self/cgroup", "");
  EXPECT_EQ(Available(), kUnlimited);
}

TEST_F(AvailableMemoryTest, AControlGroupMayAllowLess) {
  Write("proc/meminfo", "MemAvailable:    1048576 kB\n");
  Write("proc/self/cgroup", "0::/box/inner\n");
  Write("sys/fs/cgroup/box/inner/memory.max", std::to_string(100 * kMebibyte) + "\n");
  Write("sys/fs/cgroup/box/inner/memory.current", std::to_string(70 * kMebibyte) + "\n");
  Write("sys/fs/cgroup/box/inner/memory.stat",
        "anon 1\nfile " + std::to_string(40 * kMebibyte) + "\nfile_dirty 9\n");
  EXPECT_EQ(Available(), 70 * kMebibyte) << "of 70 in use, 40 are page cache";
}

TEST_F(AvailableMemoryTest, TheGroupsAboveBindToo) {
  Write("proc/self/cgroup", "0::/box/inner\n");
  Write("sys/fs/cgroup/box/inner/memory.max", "max\n");
  Write("sys/fs/cgroup/box/inner/memory.current", "5\n");
  Write("sys/fs/cgroup/box/memory.max", std::to_string(10 * kMebibyte) + "\n");
  Write("sys/fs/cgroup/box/memory.current", std::to_string(3 * kMebibyte) + "\n");
  EXPECT_EQ(Available(), 7 * kMebibyte);
}

TEST_F(AvailableMemoryTest, TheOlderLayoutOfGroupsIsKnown) {
  Write("proc/self/cgroup", "9:name=systemd:/\n4:memory:/box\n0::/\n");
  Write("sys/fs/cgroup/memory/box/memory.limit_in_bytes", std::to_string(50 * kMebibyte) + "\n");
  Write("sys/fs/cgroup/memory/box/memory.usage_in_bytes", std::to_string(20 * kMebibyte) + "\n");
  Write("sys/fs/cgroup/memory/box/memory.stat", "cache 1\nshmem 7\ntotal_cache " +
                                                    std::to_string(5 * kMebibyte) + "\ntotal_shmem " +
                                                    std::to_string(2 * kMebibyte) + "\n");
  EXPECT_EQ(Available(), 33 * kMebibyte);
}

TEST_F(AvailableMemoryTest, AGroupThatIsFullLeavesNothing) {
  Write("proc/self/cgroup", "0::/\n");
  Write("sys/fs/cgroup/memory.max", "1000\n");
  Write("sys/fs/cgroup/memory.current", "2000\n");
  EXPECT_EQ(Available(), 0U);
}

TEST(AvailableMemoryOfThisMachineTest, IsMoreThanNothing) { EXPECT_GT(AvailableMemory(), kMebibyte); }

}  // namespace
}  // namespace vantrel::elastic
