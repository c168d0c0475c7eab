// Damages small indexes of every kind and demands that the check finds at least what the index library's own checker
// reports or crashes on, and never fails itself.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>

#include <algorithm>
#include <cstdlib>
#include <iostream>
#include <random>
#include <set>
#include <string>

#include "damage/damage.h"
#include "engine/check/health_shapes.h"
#include "support/files.h"
#include "support/library_checker.h"
#include "support/run_size.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index_health.h"
#include "vantrel/elastic/library_setup.h"

namespace quorelastic::testing {
namespace {

using vantrel::elastic::CheckIndexHealth;
using vantrel::elastic::HealthFinding;
using vantrel::elastic::HealthReport;

constexpr int kCases = kIsSanitized ? 20 : 100;  // a child takes many times as long then

void WriteIndex(const std::string& folder, const HealthShape& shape) {
  if (shape.older_layout == nullptr) return WriteVariedIndex(folder, shape.index);
  const std::string command = std::string(CLUCENE_WRITER) + " '" + folder + "' " + shape.older_layout;
  const int status = std::system(command.c_str());
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << command;
}

class DamagedHealthTest : public ::testing::TestWithParam<HealthShape> {
 protected:
  void SetUp() override {
    vantrel::elastic::PrepareIndexLibrary();
    ASSERT_NO_FATAL_FAILURE(WriteIndex(folder_.path(), GetParam()));
    ASSERT_TRUE(CheckIndexHealth(folder_.path()).clean());
    ASSERT_EQ(CheckWithLibrary(folder_.path()), LibraryVerdict::kClean);
  }

  const std::string& path() const { return folder_.path(); }

  void ExpectWellFormed(const HealthReport& report) const {
    for (const HealthFinding& finding : report.findings) {
      EXPECT_THAT(finding.file, ::testing::StartsWith(path()));
      EXPECT_NE(finding.expected, "") << finding.file;
      EXPECT_NE(finding.found, "") << finding.file;
    }
  }

 private:
  TemporaryFolder folder_;
};

INSTANTIATE_TEST_SUITE_P(Shapes, DamagedHealthTest, ::testing::ValuesIn(HealthShapes()),
                         [](const auto& test) { return test.param.name; });

TEST(HealthShapesTest, HaveFilesOfEveryKind) {
  std::set<std::string> kinds;
  for (const HealthShape& shape : HealthShapes()) {
    const TemporaryFolder folder;
    ASSERT_NO_FATAL_FAILURE(WriteIndex(folder.path(), shape));
    for (const std::string& name : ListFolder(folder.path())) {
      const std::string kind = name.substr(std::min(name.find('.'), name.size()));
      kinds.insert(kind.starts_with(".s") ? ".s" : kind);
    }
  }
  for (const char* kind : {".cfs", ".cfx", ".fnm", ".tis", ".tii", ".frq", ".prx", ".nrm", ".s", ".fdx",
                           ".fdt", ".tvx", ".tvd", ".tvf", ".del"}) {
    EXPECT_EQ(kinds.count(kind), 1U) << "no shape has a " << kind;
  }
}

bool HoldsUnsafe(const HealthReport& report) {
  return std::any_of(report.findings.begin(), report.findings.end(), [](const HealthFinding& finding) {
    return finding.grade == HealthFinding::Grade::kUnsafe;
  });
}

// QUORELASTIC_DAMAGES makes it a longer campaign, QUORELASTIC_SEED another one.
TEST_P(DamagedHealthTest, WhatTheLibrarysCheckerReportsIsFound) {
  std::mt19937 random(RunSeed(20240517) + GetParam().index.seed);
  const int cases = RunSize("QUORELASTIC_DAMAGES", kCases);
  int counts[4] = {};
  int more = 0;
  for (int i = 0; i < cases; ++i) {
    const std::vector<std::string> files = ListFolder(path());
    const Damage damage = RandomDamageTo(path(), files[random() % files.size()], random);
    SCOPED_TRACE("case " + std::to_string(i) + ": " + damage.Describe());
    const DamagedFile damaged(path(), damage);
    const HealthReport report = CheckIndexHealth(path(), {.threads = 1});
    ExpectWellFormed(report);
    const LibraryVerdict verdict = CheckWithLibrary(path());
    ++counts[static_cast<int>(verdict)];
    const bool is_clean = verdict == LibraryVerdict::kClean;
    EXPECT_TRUE(is_clean || !report.clean())
        << "the index library's verdict is " << static_cast<int>(verdict);
    if (is_clean && !report.clean()) ++more;
    EXPECT_TRUE(verdict != LibraryVerdict::kFailed || HoldsUnsafe(report))
        << "but the library's checker failed";
  }
  std::cout << "the library's checker calls " << counts[0] << " damages clean, " << counts[1]
            << " not, and fails on " << counts[2] << "; " << more << " of the first are found all the same\n";
}

}  // namespace
}  // namespace quorelastic::testing
