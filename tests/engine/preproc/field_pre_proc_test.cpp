#include "vantrel/elastic/field_pre_proc.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unicode/uchar.h>
#include <unicode/unistr.h>

#include <clocale>
#include <stdexcept>
#include <type_traits>
#include <vector>

#include "vantrel/elastic/ngram_pre_proc.h"
#include "vantrel/elastic/to_lower_pre_proc.h"

namespace vantrel::elastic {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

// Programs that were built earlier make these objects themselves.
static_assert(std::is_abstract_v<FieldPreProc>);
static_assert(sizeof(FieldPreProc) == sizeof(void*) + sizeof(std::shared_ptr<FieldPreProc>));
static_assert(sizeof(ToLowerPreProc) == sizeof(FieldPreProc) + sizeof(std::string));
static_assert(sizeof(NgramPreProc) == sizeof(FieldPreProc) + sizeof(std::string));

std::string Utf8(std::u32string_view code_points) {
  std::string text;
  for (const char32_t code_point : code_points)
    icu::UnicodeString(static_cast<UChar32>(code_point)).toUTF8String(text);
  return text;
}

std::vector<FieldToken> Tokens(const FieldPreProc& chain, const std::string& text) {
  const std::unique_ptr<FieldTokens> tokens = chain.Process(text);
  std::vector<FieldToken> all;
  FieldToken token;
  while (tokens->Next(token)) all.push_back(token);
  EXPECT_FALSE(tokens->Next(token)) << "more after the end";
  return all;
}

std::vector<std::string> Texts(const FieldPreProc& chain, const std::string& text) {
  std::vector<std::string> texts;
  for (const FieldToken& token : Tokens(chain, text)) texts.push_back(token.text);
  return texts;
}

std::vector<std::string> Grams(const std::string& argument, const std::string& text) {
  return Texts(NgramPreProc(nullptr, argument), text);
}

TEST(ToLowerPreProcTest, LowersLettersOfAnyScriptAndNothingElse) {
  const ToLowerPreProc lower(nullptr, "");
  EXPECT_THAT(Texts(lower, "ABC xyz 1-2"), ElementsAre("abc xyz 1-2"));
  EXPECT_THAT(Texts(lower, "\xc3\x84RGER \xce\xa3\xce\x91 \xd0\x96\xd0\xaf"),
              ElementsAre("\xc3\xa4rger \xcf\x83\xce\xb1 \xd0\xb6\xd1\x8f"));
  EXPECT_THAT(Texts(lower, "\xe4\xb8\xad \xf0\x9f\x98\x80 \xf0\x9d\x94\xb8"),
              ElementsAre("\xe4\xb8\xad \xf0\x9f\x98\x80 \xf0\x9d\x94\xb8"));
}

TEST(ToLowerPreProcTest, KnowsTheLettersOfTodaysUnicode) {
  const ToLowerPreProc lower(nullptr, "");
  // Georgian, Cherokee, Latin, Osage, Adlam.
  EXPECT_THAT(Texts(lower, Utf8(U"\u1c90 \u13a0 \u13f0 \ua796 \ua7ae \U000104b0 \U0001e900")),
              ElementsAre(Utf8(U"\u10d0 \uab70 \u13f8 \ua797 \u026a \U000104d8 \U0001e922")));
}

TEST(ToLowerPreProcTest, MapsOneCharacterToOneWhateverTheLocale) {
  const ToLowerPreProc lower(nullptr, "");
  const std::string text = Utf8(U"I \u0130 \u1e9e \u03a3\u03a3 \u01c4 \u212a");
  const std::string expected = Utf8(U"i i \u00df \u03c3\u03c3 \u01c6 k");
  EXPECT_THAT(Texts(lower, text), ElementsAre(expected));
  for (const char* locale : {"C", "C.UTF-8", "tr_TR.UTF-8"}) {
    setlocale(LC_ALL, locale);
    EXPECT_THAT(Texts(lower, text), ElementsAre(expected)) << locale;
  }
  setlocale(LC_ALL, "C");
}

// All of them, against what the library that knows Unicode says.
TEST(ToLowerPreProcTest, AgreesWithUnicodeOnEveryCharacter) {
  const ToLowerPreProc lower(nullptr, "");
  int changed = 0;
  constexpr char32_t kTogether = 256;
  for (char32_t first = 0; first <= 0x10ffff; first += kTogether) {
    if (first >= 0xd800 && first < 0xe000) continue;
    std::u32string characters;
    std::u32string lowered;
    for (char32_t code_point = first; code_point < first + kTogether; ++code_point) {
      characters += code_point;
      lowered += static_cast<char32_t>(u_tolower(static_cast<UChar32>(code_point)));
      if (lowered.back() != code_point) ++changed;
    }
    ASSERT_EQ(Texts(lower, Utf8(characters)), std::vector<std::string>{Utf8(lowered)})
        << "from " << std::hex << static_cast<uint32_t>(first);
  }
  EXPECT_GT(changed, 1400);
}

TEST(ToLowerPreProcTest, AnEmptyTextIsOneEmptyToken) {
  EXPECT_THAT(Texts(ToLowerPreProc(nullptr, ""), ""), ElementsAre(""));
}

TEST(ToLowerPreProcTest, TakesNoArgument) {
  EXPECT_THROW(ToLowerPreProc(nullptr, "de"), std::invalid_argument);
}

TEST(NgramPreProcTest, YieldsEveryRunOfSoManyCharacters) {
  EXPECT_THAT(Grams("2", "abcd"), ElementsAre("ab", "bc", "cd"));
  EXPECT_THAT(Grams("1", "abc"), ElementsAre("a", "b", "c"));
  EXPECT_THAT(Grams("3", "abc"), ElementsAre("abc"));
}

TEST(NgramPreProcTest, CountsCodePointsNotBytes) {
  EXPECT_THAT(Grams("2", "\xe4\xb8\xad\xe6\x96\x87\xf0\x9f\x98\x80z"),
              ElementsAre("\xe4\xb8\xad\xe6\x96\x87", "\xe6\x96\x87\xf0\x9f\x98\x80", "\xf0\x9f\x98\x80z"));
}

TEST(NgramPreProcTest, WhatIsShorterHasNone) {
  EXPECT_THAT(Grams("4", "abc"), IsEmpty());
  EXPECT_THAT(Grams("1", ""), IsEmpty());
}

TEST(NgramPreProcTest, GramsOfSeveralLengthsThatBeginTogetherShareAPosition) {
  const std::vector<FieldToken> tokens = Tokens(NgramPreProc(nullptr, "2,3"),
                                                "\xc3\xa4"
                                                "bcd");
  std::vector<std::string> texts;
  std::vector<uint64_t> positions;
  std::vector<uint64_t> starts;
  std::vector<uint64_t> ends;
  for (const FieldToken& token : tokens) {
    texts.push_back(token.text);
    positions.push_back(token.position);
    starts.push_back(token.start);
    ends.push_back(token.end);
  }
  EXPECT_THAT(texts, ElementsAre("\xc3\xa4"
                                 "b",
                                 "\xc3\xa4"
                                 "bc",
                                 "bc", "bcd", "cd"));
  EXPECT_THAT(positions, ElementsAre(0, 0, 1, 1, 2));
  EXPECT_THAT(starts, ElementsAre(0, 0, 1, 1, 2));
  EXPECT_THAT(ends, ElementsAre(2, 3, 3, 4, 4));
}

TEST(NgramPreProcTest, TakesAscendingLengthsAndNothingElse) {
  EXPECT_THAT(NgramPreProc::GramLengths("2"), ElementsAre(2));
  EXPECT_THAT(NgramPreProc::GramLengths("1,2,255"), ElementsAre(1, 2, 255));
  EXPECT_THAT(NgramPreProc::GramLengths("1,2,3,4,5,6,7,8"), ElementsAre(1, 2, 3, 4, 5, 6, 7, 8));
  for (const char* argument : {"", "0", "256", "-1", "+2", " 2", "2 ", "2,", ",2", "2,,3", "3,2", "2,2",
                               "two", "2;3", "99999999999999999999", "1,2,3,4,5,6,7,8,9"}) {
    EXPECT_THROW(NgramPreProc(nullptr, argument), std::invalid_argument) << argument;
  }
}

TEST(NgramPreProcTest, ABadArgumentIsShownInTheError) {
  try {
    const NgramPreProc refused(nullptr, "x\n");
    ADD_FAILURE() << "taken";
  } catch (const std::invalid_argument& error) {
    EXPECT_THAT(error.what(), ::testing::HasSubstr(R"("x\x0a")"));
  }
}

TEST(PreProcChainTest, TheWrappedStepComesFirst) {
  const auto lower = PreProcFactoryT<ToLowerPreProc>(nullptr, "");
  const auto grams = PreProcFactoryT<NgramPreProc>(lower, "2");
  EXPECT_THAT(Texts(*grams, "ABC"), ElementsAre("ab", "bc"));
  EXPECT_EQ(lower.use_count(), 2) << "the chain holds what it wraps";

  const auto bigrams = PreProcFactoryT<NgramPreProc>(PreProcFactoryT<NgramPreProc>(nullptr, "3"), "2");
  EXPECT_THAT(Texts(*bigrams, "abcd"), ElementsAre("ab", "bc", "bc", "cd"));
}

TEST(PreProcChainTest, TokensOutliveTheTextTheyAreOf) {
  const NgramPreProc grams(nullptr, "2");
  std::unique_ptr<FieldTokens> tokens;
  {
    const std::string text = "a text that is too long to be kept in place";
    tokens = grams.Process(text);
  }
  FieldToken token;
  ASSERT_TRUE(tokens->Next(token));
  EXPECT_EQ(token.text, "a ");
}

TEST(PreProcChainTest, BytesThatAreNotUtf8AreCharactersForThemselves) {
  EXPECT_THAT(Grams("2", "a\xff\xc3"), ElementsAre("a\xff", "\xff\xc3"));
  EXPECT_THAT(Texts(ToLowerPreProc(nullptr, ""), "A\xff\xc3"), ElementsAre("a\xff\xc3"));
}

}  // namespace
}  // namespace vantrel::elastic
