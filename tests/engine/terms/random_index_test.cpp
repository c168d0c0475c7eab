#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <filesystem>

#include "engine/terms/expect_same_terms.h"
#include "support/random_index.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index_info.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ExpectSameTerms;
using ::quorelastic::testing::RandomIndexShape;
using ::quorelastic::testing::ReadLibraryTerms;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteRandomIndex;

class RandomIndexTest : public ::testing::TestWithParam<uint32_t> {
 protected:
  // The seed's bits choose the shape, so that every combination comes up.
  static RandomIndexShape Shape() {
    const uint32_t seed = GetParam();
    return {.seed = seed,
            .documents = 40 + static_cast<int>(seed % 7) * 30,
            .documents_per_segment = (seed & 16) != 0 ? 1000 : 30,
            .deletions = (seed & 1) != 0 ? 3 + static_cast<int>(seed % 40) : 0,
            .delete_segment = seed % 5 == 1,
            .optimize = (seed & 8) != 0,
            .compound = (seed & 2) != 0,
            .term_index_interval = (seed & 4) != 0 ? 2 : 128};
  }
};

INSTANTIATE_TEST_SUITE_P(Seeds, RandomIndexTest, ::testing::Range(0U, 40U));

TEST_P(RandomIndexTest, HasTheTermsThatTheIndexLibraryReads) {
  const TemporaryFolder folder;
  WriteRandomIndex(folder.path(), Shape());
  ExpectSameTerms(folder.path(), ReadLibraryTerms(folder.path()));
}

TEST(SparseDeletionsTest, AFewDeletedDocumentsOfManyLeaveTheSameLiveTermsAsTheIndexLibrarySees) {
  const TemporaryFolder folder;
  WriteRandomIndex(folder.path(),
                   {.seed = 77, .documents = 4000, .documents_per_segment = 4000, .deletions = 8});
  const auto expected = ReadLibraryTerms(folder.path());
  ASSERT_LT(expected.at(0).live.size(), expected.at(0).all.size());
  ExpectSameTerms(folder.path(), expected);
}

TEST(EmptyIndexTest, HasNoSegments) {
  const TemporaryFolder folder;
  WriteRandomIndex(folder.path(), {.documents = 0});
  const auto info = newClassInit<IndexInfo>(folder.path());
  EXPECT_EQ(info->GetSegmentNum(), 0);
  EXPECT_EQ(info->GetSuggestDivisor(), 1);
  EXPECT_THROW(info->GetTermDict(0, false), std::out_of_range);
  EXPECT_THROW(info->GetTermDict(-1, true), std::out_of_range);
}

TEST(OpenIndexTest, StaysReadableWhenAllItsFilesAreDeleted) {
  const TemporaryFolder folder;
  WriteRandomIndex(folder.path(), {.seed = 3, .deletions = 9, .compound = false});
  const auto expected = ReadLibraryTerms(folder.path());
  const auto info = newClassInit<IndexInfo>(folder.path());
  for (const auto& entry : std::filesystem::directory_iterator(folder.path())) std::filesystem::remove(entry);
  ExpectSameTerms(*info, expected);
}

TEST(OpenIndexTest, ADictionaryMayOutliveItsIndex) {
  const TemporaryFolder folder;
  WriteRandomIndex(folder.path(), {.seed = 4, .deletions = 9});
  const auto expected = ReadLibraryTerms(folder.path());
  auto info = newClassInit<IndexInfo>(folder.path());
  const auto dictionary = info->GetTermDict(0, true);
  info.reset();
  quorelastic::testing::ExpectSameTerms(*dictionary, expected.at(0).live);
}

}  // namespace
}  // namespace vantrel::elastic
