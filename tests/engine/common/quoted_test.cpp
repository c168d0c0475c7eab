#include "elastic/common/quoted.h"

#include <gtest/gtest.h>

#include <string>

namespace vantrel::elastic {
namespace {

constexpr size_t kMostBytes = 90;

std::string Repeated(const std::string& piece, int times) {
  std::string text;
  for (; times > 0; --times) text += piece;
  return text;
}

TEST(QuotedTest, ShowsANameOnOneLine) {
  EXPECT_EQ(Quoted(""), "\"\"");
  EXPECT_EQ(Quoted("gr\xc3\xbc\xc3\x9f"), "\"gr\xc3\xbc\xc3\x9f\"");
  EXPECT_EQ(Quoted("a\"b\\c\nd\x7f"), "\"a\\x22b\\x5cc\\x0ad\\x7f\"");
  EXPECT_EQ(Quoted("a\xff\x80"), "\"a\\xff\\x80\"");
}

TEST(QuotedTest, CutsALongNameBetweenCharacters) {
  EXPECT_EQ(Quoted(std::string(200, 'x')), "\"" + std::string(79, 'x') + "...\"");
  EXPECT_EQ(Quoted(Repeated("\xe4\xb8\xad", 100)), "\"" + Repeated("\xe4\xb8\xad", 27) + "...\"");
  EXPECT_EQ(Quoted("x" + Repeated("\xf0\x9f\x98\x80", 100)),
            "\"x" + Repeated("\xf0\x9f\x98\x80", 20) + "...\"");
}

TEST(QuotedTest, IsShortWhateverTheBytes) {
  for (int byte = 0; byte < 256; ++byte) {
    const std::string name(size_t{1} << 16, static_cast<char>(byte));
    EXPECT_LE(Quoted(name).size(), kMostBytes) << byte;
    EXPECT_LE(Quoted("name" + name).size(), kMostBytes) << byte;
  }
}

}  // namespace
}  // namespace vantrel::elastic
