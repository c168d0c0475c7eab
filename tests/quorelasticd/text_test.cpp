#include "base/text.h"

#include <gtest/gtest.h>

#include <string>

namespace quorelasticd {
namespace {

TEST(Text, AnythingBecomesOneLineOfUtf8) {
  EXPECT_EQ(ToOneLine("a\nb\tc\x7f"), "a b c ");
  EXPECT_EQ(ToOneLine("\xc3\xa4\xff."), "\xc3\xa4\xef\xbf\xbd.");
  EXPECT_EQ(ToOneLine("\xff\xfe"), "\xef\xbf\xbd\xef\xbf\xbd");
  EXPECT_EQ(ToOneLine("\xf0\x9f\x98"), "\xef\xbf\xbd\xef\xbf\xbd\xef\xbf\xbd");
  EXPECT_EQ(ToOneLine(""), "");
}

}  // namespace
}  // namespace quorelasticd
