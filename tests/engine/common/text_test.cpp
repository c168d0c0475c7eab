#include "elastic/common/text.h"

#include <gtest/gtest.h>

#include <string>

namespace vantrel::elastic {
namespace {

TEST(TextTest, TellsWellFormedUtf8FromEverythingElse) {
  struct Case {
    const char* why;
    std::string_view text;
    bool valid;
  };
  using namespace std::string_view_literals;
  const Case cases[] = {
      {"empty", "", true},
      {"ASCII with a zero byte", "a\0b"sv, true},
      {"largest of one byte", "\x7f", true},
      {"smallest of two bytes", "\xc2\x80", true},
      {"largest of two bytes", "\xdf\xbf", true},
      {"smallest of three bytes", "\xe0\xa0\x80", true},
      {"last before the surrogates", "\xed\x9f\xbf", true},
      {"first after the surrogates", "\xee\x80\x80", true},
      {"noncharacter U+FFFE", "\xef\xbf\xbe", true},
      {"noncharacter U+FFFF", "\xef\xbf\xbf", true},
      {"smallest of four bytes", "\xf0\x90\x80\x80", true},
      {"largest code point", "\xf4\x8f\xbf\xbf", true},
      {"continuation alone", "\x80", false},
      {"last continuation alone", "a\xbf", false},
      {"overlong zero in two bytes", "\xc0\x80", false},
      {"overlong in two bytes", "\xc1\xbf", false},
      {"overlong in three bytes", "\xe0\x9f\xbf", false},
      {"overlong in four bytes", "\xf0\x8f\xbf\xbf", false},
      {"high surrogate", "\xed\xa0\x80", false},
      {"low surrogate", "\xed\xbf\xbf", false},
      {"surrogate pair in six bytes", "\xed\xa0\xbd\xed\xb8\x80", false},
      {"above U+10FFFF", "\xf4\x90\x80\x80", false},
      {"lead byte f5", "\xf5\x80\x80\x80", false},
      {"five-byte form", "\xf8\x88\x80\x80\x80", false},
      {"byte fe", "\xfe", false},
      {"byte ff", "\xff", false},
      {"two bytes, cut", "a\xc2", false},
      {"three bytes, cut after one", "\xe2", false},
      {"three bytes, cut after two", "\xe2\x82", false},
      {"four bytes, cut after three", "\xf0\x9f\x98", false},
      {"lead byte in place of a continuation", "\xe2\xe2\x82", false},
      {"ASCII in place of a continuation",
       "\xc2"
       "a",
       false},
      {"good text, then bad", "gr\xc3\xbc\xc3\x9f\xff", false},
  };
  for (const Case& one : cases) {
    EXPECT_EQ(IsValidUtf8(one.text), one.valid) << one.why;
    std::wstring wide;
    EXPECT_EQ(AppendCodePoints(one.text, wide), one.valid) << one.why;
  }
}

TEST(TextTest, TheFirstIllFormedByteIsFound) {
  EXPECT_EQ(WellFormedLength("ab\xff"), 2U);
  EXPECT_EQ(WellFormedLength("a\x80"), 1U);             // continues nothing
  EXPECT_EQ(WellFormedLength("\xc3"), 0U);              // cut off
  EXPECT_EQ(WellFormedLength("\xc0\xaf"), 0U);          // not the shortest form
  EXPECT_EQ(WellFormedLength("\xe0\x80\xaf"), 0U);      // the same in three bytes
  EXPECT_EQ(WellFormedLength("\xf0\x80\x80\xaf"), 0U);  // and in four
  EXPECT_EQ(WellFormedLength("x\xed\xa0\x80"), 1U);     // a surrogate
  EXPECT_EQ(WellFormedLength("\xf4\x90\x80\x80"), 0U);  // past U+10FFFF
  EXPECT_EQ(WellFormedLength("\xc3\xa4\xe2\x82"), 2U);
  EXPECT_EQ(WellFormedLength("\xc3\xa4"), 2U);
  EXPECT_EQ(WellFormedLength(""), 0U);
}

TEST(TextTest, DecodesEveryCodePointToItself) {
  for (char32_t code_point = 0; code_point <= 0x10ffff; code_point += code_point < 0x800 ? 1 : 61) {
    if (code_point >= 0xd800 && code_point <= 0xdfff) continue;
    std::u16string units;
    if (code_point < 0x10000) {
      units.push_back(static_cast<char16_t>(code_point));
    } else {
      units.push_back(static_cast<char16_t>(0xd800 + ((code_point - 0x10000) >> 10)));
      units.push_back(static_cast<char16_t>(0xdc00 + ((code_point - 0x10000) & 0x3ff)));
    }
    std::wstring wide = L"x";
    ASSERT_TRUE(AppendCodePoints(FromUtf16(units), wide));
    ASSERT_EQ(wide, std::wstring({L'x', static_cast<wchar_t>(code_point)}));
  }
}

TEST(TextTest, ASurrogateWithoutItsPartnerBecomesTheReplacementCharacter) {
  const std::string replacement = "\xef\xbf\xbd";
  const char16_t high[] = {u'a', 0xd83d, u'b', 0};
  const char16_t low[] = {u'a', 0xde00, u'b', 0};
  const char16_t swapped[] = {0xde00, 0xd83d, 0};
  const char16_t high_before_pair[] = {0xd83d, 0xd83d, 0xde00, 0};
  const char16_t high_last[] = {0xd83d, 0};
  EXPECT_EQ(FromUtf16(high), "a" + replacement + "b");
  EXPECT_EQ(FromUtf16(low), "a" + replacement + "b");
  EXPECT_EQ(FromUtf16(swapped), replacement + replacement);
  EXPECT_EQ(FromUtf16(high_before_pair), replacement + "\xf0\x9f\x98\x80");
  EXPECT_EQ(FromUtf16(high_last), replacement);
  EXPECT_EQ(FromUtf16(u""), "");
}

}  // namespace
}  // namespace vantrel::elastic
