// The check of term dictionaries: its work, and the orders that it accepts.

#include <gtest/gtest.h>

#include <ctime>
#include <string>
#include <vector>

#include "support/shared_prefix_index.h"
#include "support/temporary_folder.h"
#include "support/term_list_index.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::kTermsByCodePoints;
using ::quorelastic::testing::kTermsByNeither;
using ::quorelastic::testing::kTermsByUtf16;
using ::quorelastic::testing::SharedPrefixIndex;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteTermListIndex;

constexpr double kMostSeconds = 5;

void ExpectCleanInTime(const SharedPrefixIndex& index) {
  const TemporaryFolder folder;
  index.Write(folder.path());
  const std::clock_t start = std::clock();
  const HealthReport report = CheckIndexHealth(folder.path());
  EXPECT_LT(static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC, kMostSeconds);
  for (const HealthFinding& finding : report.findings) {
    ADD_FAILURE() << finding.file << ", offset " << finding.offset << ": expected " << finding.expected
                  << ", found " << finding.found;
  }
}

// A pass over the whole of each text would take minutes.
TEST(TermsHealthTest, LongTextsThatTermsShareTakeNoTime) {
  ExpectCleanInTime({.format = -4, .terms = 700'000});
  ExpectCleanInTime({.format = -2, .terms = 10'000, .shared = 900'000});
}

TEST(TermsHealthTest, LongTextsThatEntriesOfTheIndexShareTakeNoTime) {
  ExpectCleanInTime({.format = -4, .terms = 400'000, .interval = 1});
  ExpectCleanInTime({.format = -3, .terms = 10'000, .shared = 900'000, .interval = 1});
}

TEST(TermsHealthTest, LongTextsThatTermsOfVectorsShareTakeNoTime) {
  ExpectCleanInTime({.format = -4, .terms = 400'000, .has_vectors = true});
  ExpectCleanInTime({.format = -2, .terms = 10'000, .shared = 900'000, .has_vectors = true});
}

TEST(TermsHealthTest, TheOlderLayoutsMayBeSortedByEitherOrderButNotByBoth) {
  for (const int format : {-3, -2}) {
    for (const auto& terms : {kTermsByUtf16, kTermsByCodePoints}) {
      const TemporaryFolder folder;
      WriteTermListIndex(folder.path(), format, terms);
      EXPECT_TRUE(CheckIndexHealth(folder.path()).clean());
    }
    const TemporaryFolder folder;
    WriteTermListIndex(folder.path(), format, kTermsByNeither);
    const HealthReport report = CheckIndexHealth(folder.path());
    ASSERT_EQ(report.findings.size(), 1U);
    EXPECT_EQ(report.findings[0].expected, "term after the one before it");
  }
}

}  // namespace
}  // namespace vantrel::elastic
