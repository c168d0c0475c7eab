#include "elastic/format/segment/term_text.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "elastic/common/text.h"
#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

// Pieces that also cut characters in two, and such as no text is made of.
std::string RandomBytes(std::mt19937& random) {
  static const std::vector<std::string> kPieces = {
      "a",        "bc",       "\xc3",         "\xa4",
      "\xe4\xb8", "\xad",     "\xf0\x9f\x98", "\x80",
      "\xef\xbf", "\xbe",     "\xef\xbf\xbe", "\xbf",
      "\xff",     "\xf0\x9f", "\xef\xbf\xbd", "abcdefghijklmnopqrstuvwxyz"};
  std::string bytes;
  for (auto left = random() % 5; left > 0; --left) bytes += kPieces[random() % kPieces.size()];
  return bytes;
}

TermOrders BytewiseOrder(const std::string& left, const std::string& right) {
  return left < right ? kByCodePoints : TermOrders{0};
}

// Each text shares some of the one before, not always as much as it could.
TEST(TermTextTest, IsWhatTheWholeTextWouldBeTakenFor) {
  std::mt19937 random(5);
  int valid = 0;
  int kept = 0;
  for (int round = 0; round < 3000; ++round) {
    std::vector<std::string> texts;
    std::vector<size_t> shared;
    ByteWriter out;
    std::string before;
    for (int i = 0; i < 12; ++i) {
      shared.push_back(random() % (before.size() + 1));
      texts.push_back(before.substr(0, shared.back()) + RandomBytes(random));
      out.VInt(static_cast<int64_t>(shared.back())).String(texts.back().substr(shared.back()));
      before = texts.back();
    }
    ByteReader reader(SourceOf(out.bytes()), 7);
    TermText text(true);
    RawText copy;
    before.clear();
    for (size_t i = 0; i < texts.size(); ++i) {
      text.Read(reader, reader.offset());
      text.UpdateCopy(copy);
      ASSERT_EQ(text.text(), texts[i]);
      EXPECT_EQ(copy.bytes, texts[i]);
      EXPECT_EQ(text.shared_length(), shared[i]);
      EXPECT_EQ(text.same_length(), SameLength(before, texts[i]));
      EXPECT_EQ(text.ascends_by() & kByCodePoints, BytewiseOrder(before, texts[i]));
      // Some are not looked at, as by a walk that passes them over.
      if (random() % 3 != 0) {
        EXPECT_EQ(text.IsValid(), IsValidUtf8(texts[i])) << ::testing::PrintToString(texts[i]);
        EXPECT_EQ(text.IsKept(), IsKeptText(texts[i])) << ::testing::PrintToString(texts[i]);
        valid += text.IsValid() ? 1 : 0;
        kept += text.IsKept() ? 1 : 0;
      }
      before = texts[i];
    }
  }
  EXPECT_GT(kept, 1000);
  EXPECT_GT(valid, kept + 100) << "hardly a text had a character that is not kept";
}

std::u16string RandomUnits(std::mt19937& random) {
  static constexpr char16_t kUnits[] = {u'a',   u'b',   0xe4,   0x4e2d, 0xd83d, 0xde00,
                                        0xde01, 0xd83d, 0xde00, 0xe000, 0xfffd};
  std::u16string units;
  for (auto left = random() % 5; left > 0; --left) units.push_back(kUnits[random() % std::size(kUnits)]);
  return units;
}

TEST(TermTextTest, OfTheOlderLayoutsIsConvertedAsTheWholeWouldBe) {
  std::mt19937 random(6);
  for (int round = 0; round < 3000; ++round) {
    std::vector<std::u16string> texts;
    ByteWriter out;
    std::u16string before;
    for (int i = 0; i < 12; ++i) {
      const size_t shared = random() % (before.size() + 1);
      texts.push_back(before.substr(0, shared) + RandomUnits(random));
      out.VInt(static_cast<int64_t>(shared)).UnitsString(texts.back().substr(shared));
      before = texts.back();
    }
    ByteReader reader(SourceOf(out.bytes()));
    TermText text(false);
    RawText copy;
    before.clear();
    for (const std::u16string& units : texts) {
      text.Read(reader, reader.offset());
      text.UpdateCopy(copy);
      ASSERT_EQ(text.text(), FromUtf16(units));
      EXPECT_EQ(copy.units, units);
      EXPECT_EQ((text.ascends_by() & kByUtf16) != 0, before < units);
      const std::string before_bytes = FromUtf16(before);
      EXPECT_LE(text.same_length(), SameLength(before_bytes, text.text()));
      EXPECT_TRUE(text.IsValid());
      before = units;
    }
  }
}

TEST(TermTextTest, GoesOnFromAPlace) {
  for (const bool is_utf8 : {true, false}) {
    TermText text(is_utf8);
    text.Assign({is_utf8 ? "tea" : "", is_utf8 ? u"" : u"tea"});
    EXPECT_EQ(text.text(), "tea");
    ByteReader reader(SourceOf(ByteWriter().VInt(2).String("st").bytes()));
    text.Read(reader, 0);
    EXPECT_EQ(text.text(), "test");
    EXPECT_EQ(text.ascends_by(), kByBoth);
    EXPECT_EQ(text.same_length(), 2U);
    text.Clear();
    EXPECT_EQ(text.text(), "");
  }
}

TEST(TermTextTest, RefusesToShareMoreThanThereIs) {
  for (const bool is_utf8 : {true, false}) {
    ByteReader reader(SourceOf(ByteWriter().VInt(0).String("ab").VInt(3).String("c").bytes()));
    TermText text(is_utf8);
    text.Read(reader, 0);
    ExpectDamage(3, "term shares 3 ", [&] { text.Read(reader, 3); });
  }
}

TEST(OrderOfTermsTest, IsEitherOneInTheOlderLayoutsButOnlyOne) {
  const std::string astral = "\xf0\x9f\x98\x80";
  const std::string behind_surrogates = "\xef\xbc\xa1";
  EXPECT_EQ(OrdersBefore(behind_surrogates, astral), kByCodePoints);
  EXPECT_EQ(OrdersBefore(astral, behind_surrogates), kByUtf16);
  EXPECT_EQ(OrdersBefore("a", astral), kByBoth);
  EXPECT_EQ(OrdersBefore(astral, "a"), 0);
  EXPECT_EQ(OrdersBefore("a", "a"), 0);
  EXPECT_EQ(OrdersBefore("a", "ab"), kByBoth);

  OrderOfTerms old(false);
  EXPECT_TRUE(old.Take(kByBoth));
  EXPECT_TRUE(old.Take(kByUtf16));
  EXPECT_TRUE(old.Take(kByUtf16));
  EXPECT_FALSE(old.Take(kByCodePoints)) << "after it was sorted by UTF-16";
  EXPECT_FALSE(OrderOfTerms(false).Take(0));
  EXPECT_FALSE(OrderOfTerms(true).Take(kByUtf16));
  EXPECT_TRUE(OrderOfTerms(true).Take(kByCodePoints));
}

TEST(FieldOrderTest, IsThatOfTheNames) {
  std::vector<FieldInfo> fields(4);
  fields[0].name = "\xf0\x9f\x98\x80";
  fields[1].name = "b";
  fields[2].name = "\xef\xbc\xa1";
  fields[3].name = "b";
  const FieldOrder order(fields);
  EXPECT_EQ(order.OrdersBefore(-1, 1), kByBoth);
  EXPECT_EQ(order.OrdersBefore(1, -1), 0);
  EXPECT_EQ(order.OrdersBefore(1, 0), kByBoth);
  EXPECT_EQ(order.OrdersBefore(2, 0), kByCodePoints);
  EXPECT_EQ(order.OrdersBefore(0, 2), kByUtf16);
  EXPECT_EQ(order.OrdersBefore(1, 3), 0);
  EXPECT_EQ(order.OrdersBefore(3, 1), 0);
}

}  // namespace
}  // namespace vantrel::elastic::format
