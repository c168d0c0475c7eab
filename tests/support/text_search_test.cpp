#include "support/text_search.h"

#include <gtest/gtest.h>

namespace quorelastic::testing {
namespace {

using Matches = std::vector<std::vector<std::string>>;

TEST(TextSearchTest, FindsEveryMatchWithItsGroups) {
  EXPECT_EQ(FindAll("a1, b, c22", "([a-z])([0-9]+)?"),
            (Matches{{"a1", "a", "1"}, {"b", "b", ""}, {"c22", "c", "22"}}));
  EXPECT_EQ(FindAll("", "x"), Matches());
  EXPECT_THROW(FindAll("x", "("), std::invalid_argument);
}

TEST(TextSearchTest, ThreeDotsStandForAnything) {
  for (const char* shown : {"a(b)c", "...", "a...", "...c", "a...c", "...(...", "a......c", "a(b)c..."}) {
    EXPECT_TRUE(IsAsShown("a(b)c", shown)) << shown;
  }
  for (const char* shown :
       {"", "a", "a(b)", "b...", "...b", "a...d...c", "a(b)...)c", "a(b)cc", "a(b)c...c"}) {
    EXPECT_FALSE(IsAsShown("a(b)c", shown)) << shown;
  }
}

}  // namespace
}  // namespace quorelastic::testing
