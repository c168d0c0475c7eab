// Suggestions and listings from dictionaries whose terms share long texts, and whose terms are sorted by UTF-16.

#include <gtest/gtest.h>

#include <ctime>
#include <set>
#include <string>
#include <vector>

#include "support/shared_prefix_index.h"
#include "support/temporary_folder.h"
#include "support/term_list_index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/suggest_terms.h"
#include "vantrel/elastic/term_listing.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::kTermsByCodePoints;
using ::quorelastic::testing::kTermsByNeither;
using ::quorelastic::testing::kTermsByUtf16;
using ::quorelastic::testing::SharedPrefixIndex;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteTermListIndex;

constexpr double kMostSeconds = 5;

TEST(SharedPrefixTest, SuggestionsTakeNoTimeForWhatTermsShare) {
  for (const auto& index :
       {SharedPrefixIndex{.format = -4, .terms = 100'000, .segments = 3},
        SharedPrefixIndex{.format = -4, .terms = 100'000, .interval = 1, .segments = 3},
        SharedPrefixIndex{.format = -2, .terms = 3000, .shared = 900'000, .segments = 2}}) {
    const TemporaryFolder folder;
    index.Write(folder.path());
    const std::string shared(static_cast<size_t>(index.shared), SharedPrefixIndex::kShared);
    for (const std::string& prefix :
         {std::string("x"), shared + index.Ending(index.terms / 2).substr(0, 3)}) {
      const std::clock_t start = std::clock();
      const auto terms = SuggestTerms({folder.path()}, {.field = "f", .prefix = prefix, .limit = 3});
      EXPECT_LT(static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC, kMostSeconds);
      ASSERT_EQ(terms.size(), 3U);
      EXPECT_EQ(terms[0].document_frequency, static_cast<uint64_t>(index.segments));
      EXPECT_TRUE(terms[0].term.starts_with(prefix));
    }
  }
}

TEST(SharedPrefixTest, AListingTakesNoTimeForTermsThatItPassesOver) {
  const SharedPrefixIndex index = {.format = -4, .terms = 100'000, .segments = 3};
  const TemporaryFolder folder;
  index.Write(folder.path());
  const std::clock_t start = std::clock();
  TermListing listing(folder.path(), {.prefix = "y"});
  while (listing.Next() != TermListing::Move::kEnd) EXPECT_EQ(listing.text(), "");
  EXPECT_LT(static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC, kMostSeconds);
}

std::set<std::string> Suggested(const std::string& folder, const std::string& prefix) {
  std::set<std::string> terms;
  for (const auto& term : SuggestTerms({folder}, {.field = "f", .prefix = prefix})) terms.insert(term.term);
  return terms;
}

TEST(OldLayoutOrderTest, EitherOrderGivesTheSameSuggestions) {
  const std::string grin = "\xf0\x9f\x98\x80";
  const std::string smile = "\xf0\x9f\x98\x81";
  const std::string wide = "\xef\xbc\xa1";
  for (const int format : {-3, -2}) {
    for (const auto& terms : {kTermsByUtf16, kTermsByCodePoints}) {
      const TemporaryFolder folder;
      WriteTermListIndex(folder.path(), format, terms);
      EXPECT_EQ(Suggested(folder.path(), ""),
                (std::set<std::string>{"a", "b" + grin, "b" + wide, grin, smile, wide}));
      EXPECT_EQ(Suggested(folder.path(), wide), std::set<std::string>{wide});
      EXPECT_EQ(Suggested(folder.path(), "\xf0"), (std::set<std::string>{grin, smile}));
      EXPECT_EQ(Suggested(folder.path(), "b" + grin), std::set<std::string>{"b" + grin});
      // Two segments sorted alike are merged by their order.
      const auto twice = SuggestTerms({folder.path(), folder.path()}, {.field = "f", .prefix = ""});
      ASSERT_EQ(twice.size(), 6U);
      for (const auto& term : twice) EXPECT_EQ(term.document_frequency, 2U) << term.term;
    }
    const TemporaryFolder folder;
    WriteTermListIndex(folder.path(), format, kTermsByNeither);
    EXPECT_THROW(Suggested(folder.path(), ""), IndexDamagedError);
  }
}

TEST(OldLayoutOrderTest, SegmentsThatAreSortedDifferentlyAreRefused) {
  const TemporaryFolder by_utf16;
  const TemporaryFolder by_code_points;
  WriteTermListIndex(by_utf16.path(), -2, kTermsByUtf16);
  WriteTermListIndex(by_code_points.path(), -2, kTermsByCodePoints);
  EXPECT_THROW(SuggestTerms({by_utf16.path(), by_code_points.path()}, {.field = "f", .prefix = ""}),
               IndexError);
}

}  // namespace
}  // namespace vantrel::elastic
