#include "elastic/repair/checker_trial.h"

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <functional>
#include <stdexcept>
#include <string>
#include <vector>

#include "support/sanitized.h"
#include "vantrel/elastic/index_error.h"

namespace {

bool fork_fails = false;

}  // namespace

extern "C" __attribute__((visibility("default"))) pid_t fork() noexcept {
  if (fork_fails) {
    errno = EAGAIN;
    return -1;
  }
  static const auto next = reinterpret_cast<pid_t (*)()>(dlsym(RTLD_NEXT, "fork"));
  return next();
}

namespace vantrel::elastic {
namespace {

constexpr const char* kPath = "/srv/index";
constexpr uint64_t kSmallIndex = 1000;

// What is told where there is no verdict.
std::string ProblemOfTrial(const std::function<void()>& operation) {
  try {
    SurvivesTrial(kPath, kSmallIndex, operation);
  } catch (const IndexIoError& error) {
    EXPECT_EQ(error.path(), kPath);
    return error.what();
  }
  return "a verdict";
}

TEST(CheckerTrialTest, WhatReturnsIsSurvivedAndLeavesNoTrace) {
  int traces = 0;
  EXPECT_TRUE(SurvivesTrial(kPath, kSmallIndex, [&] { ++traces; }));
  EXPECT_EQ(traces, 0);
}

TEST(CheckerTrialTest, AnExceptionIsNotSurvived) {
  EXPECT_FALSE(SurvivesTrial(kPath, kSmallIndex, [] { throw std::runtime_error("damaged"); }));
  EXPECT_FALSE(SurvivesTrial(kPath, kSmallIndex, [] { throw 1; }));
}

TEST(CheckerTrialTest, ASignalOfTheProcessItselfIsNotSurvived) {
  for (const int signal : {SIGSEGV, SIGABRT, SIGBUS, SIGFPE}) {
    EXPECT_FALSE(SurvivesTrial(kPath, kSmallIndex, [&] { raise(signal); })) << signal;
  }
}

TEST(CheckerTrialTest, MemoryWithoutEndIsNotSurvived) {
  if (::quorelastic::testing::kIsSanitized) GTEST_SKIP() << "a sanitizer cannot live with little memory";
  EXPECT_FALSE(SurvivesTrial(kPath, kSmallIndex, [] {
    std::vector<std::vector<char>> taken;
    for (;;) taken.emplace_back(size_t{1} << 30);
  }));
}

TEST(CheckerTrialTest, WhatNeverEndsIsNotSurvived) {
  EXPECT_FALSE(SurvivesTrial(kPath, kSmallIndex, [] {
    for (volatile bool goes_on = true; goes_on;) continue;
  }));
}

// The kernel kills so whose memory it wants.
TEST(CheckerTrialTest, WhereSomebodyElseKillsItNothingIsKnown) {
  EXPECT_EQ(ProblemOfTrial([] { raise(SIGKILL); }),
            "/srv/index: somebody killed the trial of the index library: Operation canceled");
}

TEST(CheckerTrialTest, WhereThereCanBeNoProcessTheErrorNamesTheIndex) {
  fork_fails = true;
  const std::string problem = ProblemOfTrial([] {});
  fork_fails = false;
  EXPECT_EQ(problem,
            "/srv/index: cannot start a process to try the index library in: "
            "Resource temporarily unavailable");
}

}  // namespace
}  // namespace vantrel::elastic
