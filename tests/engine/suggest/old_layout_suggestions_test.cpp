#include <gtest/gtest.h>
#include <sys/wait.h>

#include <cstdlib>

#include "engine/suggest/library_suggestions.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/suggest_terms.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::LibraryFrequencies;
using ::quorelastic::testing::ReadLibraryFrequencies;
using ::quorelastic::testing::SuggestByBruteForce;
using ::quorelastic::testing::TemporaryFolder;

// Dictionaries that hold their texts as UTF-16, written by the older library.
class OldLayoutSuggestionsTest : public ::testing::TestWithParam<const char*> {};

INSTANTIATE_TEST_SUITE_P(Layouts, OldLayoutSuggestionsTest, ::testing::Values("plain", "compound"),
                         [](const auto& test) { return std::string(test.param); });

TEST_P(OldLayoutSuggestionsTest, AreThoseOfBruteForce) {
  const TemporaryFolder folder;
  const std::string command =
      std::string(CLUCENE_WRITER) + " '" + folder.path() + "' " + GetParam() + " 3000 200";
  const int status = std::system(command.c_str());
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << command;
  const LibraryFrequencies frequencies = ReadLibraryFrequencies({folder.path()});
  size_t terms = 0;
  size_t suggested = 0;
  for (const auto& [field, texts] : frequencies) {
    terms = std::max(terms, texts.size());
    size_t number = 0;
    for (const auto& [text, frequency] : texts) {
      if (number++ % 61 != 0) continue;  // some of them
      for (const size_t length : {size_t{0}, size_t{1}, text.size() / 2, text.size()}) {
        const std::string prefix = text.substr(0, length);
        SCOPED_TRACE("field '" + field + "', prefix '" + prefix + "'");
        const auto expected = SuggestByBruteForce(frequencies, field, prefix);
        EXPECT_EQ(SuggestTerms({folder.path()}, {.field = field, .prefix = prefix, .limit = 1'000'000}),
                  expected);
        suggested += expected.size();
      }
    }
  }
  EXPECT_GT(terms, 1000U) << "no dictionary needs its index";
  EXPECT_GT(suggested, 1000U);
}

}  // namespace
}  // namespace vantrel::elastic
