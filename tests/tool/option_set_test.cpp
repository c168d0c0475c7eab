#include "option_set.h"

#include <gtest/gtest.h>

namespace {

TEST(OptionSetTest, HasItsDefaultsBeforeAnyOptionIsRead) {
  const OptionSet options;
  EXPECT_EQ(options.ndoc, 0);
  EXPECT_EQ(OptionSet::max, 1000);
  EXPECT_EQ(OptionSet::size, 10);
  EXPECT_EQ(OptionSet::offset, 0);
  EXPECT_FALSE(OptionSet::info);
  EXPECT_EQ(OptionSet::field, "");
}

}  // namespace
