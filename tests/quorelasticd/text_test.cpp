#include "base/text.h"

#include <gtest/gtest.h>

#include <string>

namespace quorelasticd {
namespace {

constexpr size_t kNone = std::string::npos;

TEST(Text, WellFormedUtf8IsTaken) {
  EXPECT_EQ(FindInvalidUtf8(""), kNone);
  EXPECT_EQ(FindInvalidUtf8("plain"), kNone);
  EXPECT_EQ(FindInvalidUtf8("\xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80\xf4\x8f\xbf\xbf"), kNone);
  EXPECT_EQ(FindInvalidUtf8(std::string_view("a\0b", 3)), kNone);
}

TEST(Text, TheFirstMalformedByteIsFound) {
  EXPECT_EQ(FindInvalidUtf8("ab\xff"), 2u);
  EXPECT_EQ(FindInvalidUtf8("a\x80"), 1u);             // goes on with nothing before it
  EXPECT_EQ(FindInvalidUtf8("\xc3"), 0u);              // cut off
  EXPECT_EQ(FindInvalidUtf8("\xc0\xaf"), 0u);          // not the shortest form
  EXPECT_EQ(FindInvalidUtf8("\xe0\x80\xaf"), 0u);      // the same in three bytes
  EXPECT_EQ(FindInvalidUtf8("\xf0\x80\x80\xaf"), 0u);  // and in four
  EXPECT_EQ(FindInvalidUtf8("x\xed\xa0\x80"), 1u);     // a surrogate
  EXPECT_EQ(FindInvalidUtf8("\xf4\x90\x80\x80"), 0u);  // past U+10FFFF
  EXPECT_EQ(FindInvalidUtf8("\xc3\xa4\xe2\x82"), 2u);
}

TEST(Text, AnythingBecomesOneLineOfUtf8) {
  EXPECT_EQ(ToOneLine("a\nb\tc\x7f"), "a b c ");
  EXPECT_EQ(ToOneLine("\xc3\xa4\xff."), "\xc3\xa4\xef\xbf\xbd.");
  EXPECT_EQ(ToOneLine(""), "");
}

TEST(Text, LongNamesAreCutBetweenCharacters) {
  EXPECT_EQ(Quoted("x"), "\"x\"");
  const std::string umlauts = [] {
    std::string text = "a";
    for (int i = 0; i < 100; ++i) text += "\xc3\xa4";
    return text;
  }();
  const std::string quoted = Quoted(umlauts);
  EXPECT_EQ(FindInvalidUtf8(quoted), kNone);
  EXPECT_EQ(quoted.find("\xef\xbf\xbd"), kNone);
  EXPECT_TRUE(quoted.ends_with("...\""));
  EXPECT_LT(quoted.size(), 100u);
}

}  // namespace
}  // namespace quorelasticd
