#include "elastic/repair/checker_trial.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>
#include <stdexcept>
#include <system_error>
#include <vector>

#include "support/sanitized.h"

namespace vantrel::elastic {
namespace {

constexpr uint64_t kSmallIndex = 1000;

TEST(CheckerTrialTest, WhatReturnsIsSurvivedAndLeavesNoTrace) {
  int traces = 0;
  EXPECT_TRUE(SurvivesTrial(kSmallIndex, [&] { ++traces; }));
  EXPECT_EQ(traces, 0);
}

TEST(CheckerTrialTest, AnExceptionIsNotSurvived) {
  EXPECT_FALSE(SurvivesTrial(kSmallIndex, [] { throw std::runtime_error("damaged"); }));
  EXPECT_FALSE(SurvivesTrial(kSmallIndex, [] { throw 1; }));
}

TEST(CheckerTrialTest, ASignalOfTheProcessItselfIsNotSurvived) {
  for (const int signal : {SIGSEGV, SIGABRT, SIGBUS, SIGFPE}) {
    EXPECT_FALSE(SurvivesTrial(kSmallIndex, [&] { raise(signal); })) << signal;
  }
}

TEST(CheckerTrialTest, MemoryWithoutEndIsNotSurvived) {
  if (::quorelastic::testing::kIsSanitized) GTEST_SKIP() << "a sanitizer cannot live with little memory";
  EXPECT_FALSE(SurvivesTrial(kSmallIndex, [] {
    std::vector<std::vector<char>> taken;
    for (;;) taken.emplace_back(size_t{1} << 30);
  }));
}

TEST(CheckerTrialTest, WhatNeverEndsIsNotSurvived) {
  EXPECT_FALSE(SurvivesTrial(kSmallIndex, [] {
    for (volatile bool goes_on = true; goes_on;) continue;
  }));
}

// The kernel kills so whose memory it wants.
TEST(CheckerTrialTest, WhereSomebodyElseKillsItNothingIsKnown) {
  try {
    SurvivesTrial(kSmallIndex, [] { raise(SIGKILL); });
    FAIL() << "a verdict";
  } catch (const std::system_error& error) {
    EXPECT_EQ(error.code().value(), ECANCELED);
  }
}

}  // namespace
}  // namespace vantrel::elastic
