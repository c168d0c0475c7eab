#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <filesystem>
#include <memory>
#include <random>

#include "engine/suggest/library_suggestions.h"
#include "support/random_index.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/suggest_terms.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::LibraryFrequencies;
using ::quorelastic::testing::ReadLibraryFrequencies;
using ::quorelastic::testing::SuggestByBruteForce;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteRandomIndex;

// One to three indexes, whose shapes follow from the seed's bits, so that every combination comes up.
class RandomSuggestionsTest : public ::testing::TestWithParam<uint32_t> {
 protected:
  RandomSuggestionsTest() {
    for (uint32_t i = 0; i <= GetParam() % 3; ++i) {
      const uint32_t seed = GetParam() * 5 + i;
      paths_.push_back(folder_ / std::to_string(i));
      WriteRandomIndex(paths_.back(), {.seed = seed,
                                       .documents = 40 + static_cast<int>(seed % 7) * 30,
                                       .documents_per_segment = (seed & 16) != 0 ? 1000 : 30,
                                       .deletions = (seed & 1) != 0 ? 3 + static_cast<int>(seed % 40) : 0,
                                       .delete_segment = seed % 5 == 1,
                                       .optimize = (seed & 8) != 0,
                                       .compound = (seed & 2) != 0,
                                       .term_index_interval = (seed & 4) != 0 ? 2 : 128});
    }
    frequencies_ = ReadLibraryFrequencies(paths_);
  }

  // Beginnings of terms, cut anywhere, also within a character, and some that no term has.
  std::vector<std::string> Prefixes(const std::string& field) {
    std::vector<std::string> prefixes = {"",         "a",    "the",   "\xc3",
                                         "\xe4\xb8", "\xff", "~none", std::string(1, '\0')};
    const auto& terms = frequencies_[field];
    for (int i = 0; i < 12 && !terms.empty(); ++i) {
      auto term = terms.begin();
      std::advance(term, random_() % terms.size());
      prefixes.push_back(term->first.substr(0, random_() % (term->first.size() + 1)));
    }
    return prefixes;
  }

  std::mt19937 random_{GetParam()};
  TemporaryFolder folder_;
  std::vector<std::string> paths_;
  LibraryFrequencies frequencies_;
};

INSTANTIATE_TEST_SUITE_P(Seeds, RandomSuggestionsTest,
                         ::testing::Range(0U, 30U / ::quorelastic::testing::kFewer));

TEST_P(RandomSuggestionsTest, AreThoseOfBruteForce) {
  std::vector<std::string> fields = {"", "absent", "\xff"};
  for (const auto& [field, terms] : frequencies_) fields.push_back(field);
  size_t suggested = 0;
  for (const std::string& field : fields) {
    for (const std::string& prefix : Prefixes(field)) {
      SCOPED_TRACE("field '" + field + "', prefix '" + prefix + "'");
      const std::vector<SuggestedTerm> all = SuggestByBruteForce(frequencies_, field, prefix);
      EXPECT_EQ(SuggestTerms(paths_, {.field = field, .prefix = prefix, .limit = 1'000'000}), all);
      const size_t skip = random_() % 4;
      std::vector<SuggestedTerm> window = all;
      window.erase(window.begin(), window.begin() + static_cast<ptrdiff_t>(std::min(skip, window.size())));
      window.resize(std::min<size_t>(window.size(), 10));
      EXPECT_EQ(SuggestTerms(paths_, {.field = field, .prefix = prefix, .skip = skip}), window);
      suggested += window.size();
    }
  }
  EXPECT_GT(suggested, 50U) << "the prefixes hardly met a term";
}

}  // namespace
}  // namespace vantrel::elastic
