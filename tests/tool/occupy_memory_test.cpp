// "occupy_mem": memory that is really taken, and held.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <fstream>
#include <functional>
#include <string>
#include <thread>

#include "support/sanitized.h"
#include "support/tool_run.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::MatchesRegex;
using ::testing::StartsWith;

constexpr int64_t kMebibyte = 1 << 20;

int64_t ResidentBytes(pid_t process) {
  std::ifstream file("/proc/" + std::to_string(process) + "/statm");
  int64_t total = 0;
  int64_t resident = 0;
  file >> total >> resident;
  return resident * sysconf(_SC_PAGESIZE);
}

bool Await(const std::function<bool()>& condition) {
  for (int i = 0; i < 3000; ++i) {
    if (condition()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
  return false;
}

// A run of the action that has filled its memory, and is killed in the end.
class Occupation {
 public:
  explicit Occupation(const std::vector<std::string>& options) : process_(Command(options)) {
    filled_ = Await([&] { return process_.Err().find("waiting .") != std::string::npos; });
    EXPECT_TRUE(filled_) << process_.Err();
  }

  int64_t resident() const { return ResidentBytes(process_.pid()); }
  std::string Err() const { return process_.Err(); }

  RunResult Kill() {
    process_.Signal(SIGTERM);
    return process_.Wait();
  }

 private:
  static std::vector<std::string> Command(const std::vector<std::string>& options) {
    std::vector<std::string> command = {ToolPath(), "-a", "occupy_mem"};
    command.insert(command.end(), options.begin(), options.end());
    return command;
  }

  Process process_;
  bool filled_ = false;
};

// What a byte takes at most: a sanitizer keeps up to five more, to know what has become of it.
constexpr int64_t kShare = kIsSanitized ? 6 : 1;

TEST(OccupyMemoryTest, TakesTheMemoryAndHoldsIt) {
  Occupation nothing({"--size", "0"});
  Occupation run({"--size", "200"});
  const auto taken = [&] { return run.resident() - nothing.resident(); };
  EXPECT_GT(taken(), 199 * kMebibyte);
  EXPECT_LT(taken(), kShare * 200 * kMebibyte + 2 * kMebibyte);
  std::this_thread::sleep_for(std::chrono::seconds(2));
  EXPECT_GT(taken(), 199 * kMebibyte) << "it was given back";
  nothing.Kill();
  const RunResult result = run.Kill();
  EXPECT_EQ(result.signal, SIGTERM);
  EXPECT_EQ(result.out, "");
  EXPECT_THAT(result.err, MatchesRegex("Occupied 200 MB, waiting \\.\\.+"));
}

TEST(OccupyMemoryTest, ShowsADotASecondOnTheSameLine) {
  Occupation run({"-si", "1"});
  const auto start = std::chrono::steady_clock::now();
  EXPECT_TRUE(Await([&] { return run.Err().starts_with("Occupied 1 MB, waiting ...."); })) << run.Err();
  EXPECT_THAT(run.Err(), MatchesRegex("Occupied 1 MB, waiting \\.+"));
  const std::chrono::duration<double> took = std::chrono::steady_clock::now() - start;
  EXPECT_GT(took.count(), 2.5);
  EXPECT_EQ(run.Kill().signal, SIGTERM);
}

TEST(OccupyMemoryTest, TakesTenByDefault) {
  Occupation nothing({"--size", "0"});
  Occupation run({});
  EXPECT_GT(run.resident() - nothing.resident(), 9 * kMebibyte);
  EXPECT_THAT(run.Kill().err, StartsWith("Occupied 10 MB, waiting ."));
  nothing.Kill();
}

TEST(OccupyMemoryTest, TheSizeWrapsAt4096) {
  Occupation nothing({"--size", "0"});
  for (const auto& [size, shown, megabytes] : {std::tuple{"4096", "4096", 0},
                                               {"4104", "4104", 8},
                                               {"4294967304", "8", 8},
                                               {"-4294967288", "8", 8}}) {
    Occupation run({"--size", size});
    const int64_t taken = run.resident() - nothing.resident();
    EXPECT_GT(taken, (megabytes - 2) * kMebibyte) << size;
    EXPECT_LT(taken, kShare * megabytes * kMebibyte + 3 * kMebibyte) << size;
    EXPECT_THAT(run.Kill().err, StartsWith("Occupied " + std::string(shown) + " MB, waiting .")) << size;
  }
  nothing.Kill();
}

TEST(OccupyMemoryTest, SaysSoWhereTheMemoryIsNotToBeHad) {
  if (kIsSanitized) GTEST_SKIP() << "a sanitizer cannot live with little memory";
  const RunOptions little = {.limits = {{RLIMIT_AS, rlim_t{1} << 30}}};
  EXPECT_THAT(RunTool({"-a", "occupy_mem", "--size", "2000"}, little), Ended(0, "", "malloc failed\n"));
  EXPECT_THAT(RunTool({"-a", "occupy_mem", "--size", "-1"}, little), Ended(0, "", "malloc failed\n"));
}

}  // namespace
}  // namespace quorelastic::testing
