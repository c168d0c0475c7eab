#include "elastic/format/segment/term_cursor.h"

#include <gtest/gtest.h>

#include <limits>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::SourceOf;
using File = TermCursor::File;

constexpr uint32_t kFields = 3;
constexpr int32_t kDocuments = 100;

TermCursor Open(const std::string& bytes, File file = File::kDictionary, uint64_t zeros_after = 0) {
  return TermCursor(SourceOf(bytes, zeros_after), file, kFields, kDocuments);
}

// A header of format F with `count` terms, index interval 2, skip interval 16, 10 skip levels.
ByteWriter Header(int format, int64_t count, File file = File::kDictionary) {
  if (format == 0) return ByteWriter().Int(count);
  ByteWriter out = ByteWriter().Int(format).Long(count);
  if (format < -1 || file == File::kDictionary) out.Int(2).Int(16);
  if (format <= -3) out.Int(10);
  return out;
}

// One term as it stands in a dictionary; text in one-byte characters.
struct TermBytes {
  int64_t prefix = 0;
  std::string_view suffix;
  int64_t field = 0;
  int64_t document_frequency = 1;
  uint64_t postings = 0;
  uint64_t positions = 0;
  std::optional<int64_t> skip_offset = {};
  std::optional<uint64_t> dictionary_pointer = {};
};

ByteWriter& Append(ByteWriter& out, const TermBytes& term) {
  out.VInt(term.prefix).String(term.suffix).VInt(term.field).VInt(term.document_frequency);
  out.VLong(term.postings).VLong(term.positions);
  if (term.skip_offset.has_value()) out.VInt(*term.skip_offset);
  if (term.dictionary_pointer.has_value()) out.VLong(*term.dictionary_pointer);
  return out;
}

std::string Dictionary(int format, const std::vector<TermBytes>& terms) {
  ByteWriter out = Header(format, static_cast<int64_t>(terms.size()));
  for (const TermBytes& term : terms) Append(out, term);
  return out.bytes();
}

class TermCursorOfAnyFormatTest : public ::testing::TestWithParam<int> {
 protected:
  // From which document frequency on a term has an offset of skip data, in a dictionary.
  static bool HasSkipOffset(int64_t document_frequency) {
    if (GetParam() == 0) return false;
    return GetParam() == -1 ? document_frequency > 16 : document_frequency >= 16;
  }

  static std::vector<TermBytes> SomeTerms() {
    std::vector<TermBytes> terms = {
        {.suffix = "apple", .document_frequency = 15},
        {.prefix = 3, .suffix = "ly", .document_frequency = 16, .postings = 200, .positions = 7},
        {.suffix = "", .field = 1, .document_frequency = 17, .postings = 30, .positions = 0},
        {.suffix = "zoo",
         .field = 2,
         .document_frequency = 1,
         .postings = 1'000'000'000'000,
         .positions = 300}};
    for (TermBytes& term : terms) {
      if (HasSkipOffset(term.document_frequency)) term.skip_offset = 77;
    }
    return terms;
  }
};

INSTANTIATE_TEST_SUITE_P(Formats, TermCursorOfAnyFormatTest, ::testing::Range(-4, 1),
                         [](const auto& test) { return "Minus" + std::to_string(-test.param); });

TEST_P(TermCursorOfAnyFormatTest, WalksADictionary) {
  TermCursor cursor = Open(Dictionary(GetParam(), SomeTerms()));
  EXPECT_EQ(cursor.count(), 4U);
  EXPECT_EQ(cursor.index_interval(), GetParam() == 0 ? 128 : 2);
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "apple");
  EXPECT_EQ(cursor.field(), 0);
  EXPECT_EQ(cursor.info().document_frequency, 15);
  EXPECT_EQ(cursor.info().skip_offset, 0U);
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "apply");
  EXPECT_EQ(cursor.info().document_frequency, 16);
  EXPECT_EQ(cursor.info().postings_pointer, 200U);
  EXPECT_EQ(cursor.info().positions_pointer, 7U);
  EXPECT_EQ(cursor.info().skip_offset, HasSkipOffset(16) ? 77U : 0U);
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "");
  EXPECT_EQ(cursor.field(), 1);
  EXPECT_EQ(cursor.info().skip_offset, HasSkipOffset(17) ? 77U : 0U);
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "zoo");
  EXPECT_EQ(cursor.field(), 2);
  EXPECT_EQ(cursor.info().postings_pointer, 1'000'000'000'230U);
  EXPECT_EQ(cursor.info().positions_pointer, 307U);
  EXPECT_FALSE(cursor.Next());
  EXPECT_FALSE(cursor.Next());
}

TEST_P(TermCursorOfAnyFormatTest, WalksAnIndex) {
  ByteWriter out = Header(GetParam(), 3, File::kIndex);
  Append(out, {.suffix = "", .field = -1, .document_frequency = 0, .dictionary_pointer = 24});
  // The earliest layouts never have skip offsets in an index.
  const auto skip = GetParam() < -1 ? std::optional<int64_t>(5) : std::nullopt;
  Append(out, {.suffix = "b", .document_frequency = 17, .skip_offset = skip, .dictionary_pointer = 30});
  Append(out, {.suffix = "c", .field = 1, .postings = 20, .dictionary_pointer = 500});
  TermCursor cursor = Open(out.bytes(), File::kIndex);
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.field(), -1);
  EXPECT_EQ(cursor.dictionary_pointer(), 24U);
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "b");
  EXPECT_EQ(cursor.dictionary_pointer(), 54U);
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "c");
  EXPECT_EQ(cursor.info().postings_pointer, 20U);
  EXPECT_EQ(cursor.dictionary_pointer(), 554U);
  EXPECT_FALSE(cursor.Next());
}

TEST_P(TermCursorOfAnyFormatTest, MayHoldNoTerm) {
  TermCursor cursor = Open(Dictionary(GetParam(), {}));
  EXPECT_EQ(cursor.count(), 0U);
  EXPECT_FALSE(cursor.Next());
}

TEST_P(TermCursorOfAnyFormatTest, IsDamagedWhereverItIsCutAndWhereMoreFollows) {
  const std::string bytes = Dictionary(GetParam(), SomeTerms());
  const auto walk = [](const std::string& all) {
    TermCursor cursor = Open(all);
    while (cursor.Next()) {
    }
  };
  for (size_t length = 0; length < bytes.size(); ++length) {
    EXPECT_THROW(walk(bytes.substr(0, length)), IndexDamagedError) << "cut to " << length;
  }
  ExpectDamage(bytes.size(), "terms end here, but the file goes on", [&] { walk(bytes + "x"); });
}

TEST_P(TermCursorOfAnyFormatTest, RefusesACountThatTheFileCannotHold) {
  if (GetParam() == 0) {
    ExpectDamage(0, "term count 2147483647 does not fit a file of 4 bytes",
                 [&] { Open(Header(0, 0x7fffffff).bytes()); });
    return;
  }
  for (const int64_t count :
       {int64_t{-1}, int64_t{1}, std::numeric_limits<int64_t>::max(), std::numeric_limits<int64_t>::min()}) {
    ExpectDamage(4, "term count " + std::to_string(count), [&] { Open(Header(GetParam(), count).bytes()); });
  }
}

TEST_P(TermCursorOfAnyFormatTest, APrefixMustLieInTheTermBefore) {
  ByteWriter out = Header(GetParam(), 2);
  Append(out, {.suffix = "app"});
  const uint64_t second = out.size();
  Append(out, {.prefix = 4, .suffix = "x", .postings = 1});
  TermCursor cursor = Open(out.bytes());
  ASSERT_TRUE(cursor.Next());
  ExpectDamage(second, "term shares 4", [&] { cursor.Next(); });
}

TEST_P(TermCursorOfAnyFormatTest, ATermLongerThanAnyIsDamageEvenOverAHoleInTheFile) {
  for (const int64_t length : {int64_t{-1}, int64_t{0x7fffffff}, int64_t{17} << 20}) {
    ByteWriter out = Header(GetParam(), 1).VInt(0).VInt(length);
    TermCursor short_file = Open(ByteWriter(out).Raw("some text").bytes());
    EXPECT_THROW(short_file.Next(), IndexDamagedError);
    TermCursor sparse_file = Open(out.bytes(), File::kDictionary, uint64_t{1} << 40);
    ExpectIndexError("is too long", [&] { sparse_file.Next(); });
  }
}

TEST_P(TermCursorOfAnyFormatTest, AHugeCountOverAHoleInTheFileEndsAtOnce) {
  const int64_t count = GetParam() == 0 ? 0x7fffffff : int64_t{1} << 37;
  TermCursor cursor = Open(Header(GetParam(), count).bytes(), File::kDictionary, uint64_t{1} << 40);
  EXPECT_EQ(cursor.count(), static_cast<uint64_t>(count));
  ExpectDamage(Header(GetParam(), count).size(), "term is in 0 documents of 100", [&] { cursor.Next(); });
}

TEST(TermCursorTest, RefusesALayoutNewerThanKnownAndIntervalsThatCannotBe) {
  ExpectDamage(0, "format is -5, but -4 is the newest known", [] { Open(Header(-5, 0).bytes()); });
  for (const auto& [index_interval, skip_interval] : {std::pair{0, 16}, {-1, 16}, {128, 0}, {128, -1}}) {
    const ByteWriter bytes = ByteWriter().Int(-4).Long(0).Int(index_interval).Int(skip_interval).Int(10);
    ExpectDamage(12, "must both be above 0", [&] { Open(bytes.bytes()); });
  }
}

void ExpectSecondTermDamaged(const TermBytes& second, const std::string& problem) {
  ByteWriter out = Header(-4, 2);
  Append(out, {.suffix = "app", .document_frequency = 3, .postings = 10, .positions = 10});
  const uint64_t offset = out.size();
  Append(out, second);
  TermCursor cursor = Open(out.bytes());
  ASSERT_TRUE(cursor.Next());
  ExpectDamage(offset, problem, [&] { cursor.Next(); });
}

TEST(TermCursorTest, RefusesNumbersThatCannotBe) {
  ExpectSecondTermDamaged({.suffix = "b", .field = 3, .postings = 5}, "field number 3 of 3");
  ExpectSecondTermDamaged({.suffix = "b", .field = -1, .postings = 5}, "field number -1 of 3");
  ExpectSecondTermDamaged({.suffix = "b", .field = -2, .postings = 5}, "field number -2 of 3");
  ExpectSecondTermDamaged({.suffix = "b", .document_frequency = 0, .postings = 5}, "in 0 documents of 100");
  ExpectSecondTermDamaged({.suffix = "b", .document_frequency = 101, .postings = 5},
                          "in 101 documents of 100");
  ExpectSecondTermDamaged({.suffix = "b", .document_frequency = -1, .postings = 5}, "in -1 documents of 100");
  constexpr uint64_t kLargest = std::numeric_limits<int64_t>::max();
  ExpectSecondTermDamaged({.suffix = "b", .postings = kLargest - 9}, "does not fit 63 bits");
  ExpectSecondTermDamaged({.suffix = "b", .postings = 5, .positions = kLargest - 9}, "does not fit 63 bits");
}

TEST(TermCursorTest, PostingsMustNotOverlapTheTermsBefore) {
  ExpectSecondTermDamaged({.suffix = "b", .postings = 2}, "postings of 3 documents take 2 bytes");
  ExpectSecondTermDamaged({.suffix = "b", .postings = 0}, "postings of 3 documents take 0 bytes");
}

TEST(TermCursorTest, OnlyTheFirstTermOfAnIndexMayStandBeforeAllFields) {
  ByteWriter out = Header(-4, 2, File::kIndex);
  Append(out, {.suffix = "", .field = -1, .document_frequency = 0, .dictionary_pointer = 24});
  const uint64_t second = out.size();
  Append(out, {.suffix = "", .field = -1, .dictionary_pointer = 30});
  TermCursor cursor = Open(out.bytes(), File::kIndex);
  ASSERT_TRUE(cursor.Next());
  ExpectDamage(second, "field number -1", [&] { cursor.Next(); });
}

TEST(TermCursorTest, TextOfTheOlderLayoutsBecomesUtf8) {
  ByteWriter out = Header(-3, 3);
  out.VInt(0).UnitsString(u"k\u00f6\U0001F600").VInt(0).VInt(1).VLong(0).VLong(0);
  out.VInt(3).UnitsString(u"\xde01z").VInt(0).VInt(1).VLong(1).VLong(0);  // shares half a pair
  out.VInt(3).UnitsString(u"").VInt(0).VInt(1).VLong(1).VLong(0);         // half a pair alone
  TermCursor cursor = Open(out.bytes());
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "k\xc3\xb6\xf0\x9f\x98\x80");
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "k\xc3\xb6\xf0\x9f\x98\x81z");
  EXPECT_EQ(cursor.text(), "k\xc3\xb6\xf0\x9f\x98\x81z");
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "k\xc3\xb6\xef\xbf\xbd");
}

TEST(TermCursorTest, TextOfTheOlderLayoutsIsCutBetweenCharactersNotBytes) {
  ByteWriter out = Header(-2, 2);
  out.VInt(0).UnitsString(u"\u00f6\u00f6a").VInt(0).VInt(1).VLong(0).VLong(0);
  out.VInt(2).UnitsString(u"\u00f6").VInt(0).VInt(1).VLong(1).VLong(0);
  TermCursor cursor = Open(out.bytes());
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(),
            "\xc3\xb6\xc3\xb6"
            "a");
  ASSERT_TRUE(cursor.Next());
  EXPECT_EQ(cursor.text(), "\xc3\xb6\xc3\xb6\xc3\xb6");
}

TEST(TermCursorTest, AMediumErrorPassesOn) {
  const auto broken = std::make_shared<quorelastic::testing::MemorySource>(
      "memory", quorelastic::testing::MemoryFile{Dictionary(-4, {{.suffix = "apple"}}), 0, 0});
  EXPECT_THROW(TermCursor(broken, File::kDictionary, kFields, kDocuments), IndexIoError);
}

}  // namespace
}  // namespace vantrel::elastic::format
