#include "elastic/format/segment/skip_list.h"

#include <gtest/gtest.h>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

constexpr int kMostLevels = 10;

SkipListReader ReaderOf(const ByteWriter& bytes, int32_t documents, bool has_payloads, int32_t interval = 4) {
  SkipListReader reader(SourceOf(bytes.bytes()), interval, kMostLevels);
  reader.Seek(0, documents, has_payloads);
  return reader;
}

TEST(SkipListTest, HasALevelForEachPowerOfTheInterval) {
  const ByteWriter lengths = ByteWriter().VLong(0).VLong(0).VLong(0);
  EXPECT_EQ(ReaderOf(lengths, 3, false).levels(), 0);
  EXPECT_EQ(ReaderOf(lengths, 4, false).levels(), 1);
  EXPECT_EQ(ReaderOf(lengths, 15, false).levels(), 1);
  EXPECT_EQ(ReaderOf(lengths, 16, false).levels(), 2);
  EXPECT_EQ(ReaderOf(lengths, 64, false).levels(), 3);
  SkipListReader few(SourceOf(lengths.bytes()), 4, 1);
  few.Seek(0, 64, false);
  EXPECT_EQ(few.levels(), 1);
}

TEST(SkipListTest, YieldsTheEntriesOfEachLevel) {
  const ByteWriter upper = ByteWriter().VInt(30).VInt(40).VInt(500).VLong(11);
  SkipListReader reader = ReaderOf(ByteWriter()
                                       .VLong(upper.size())
                                       .Raw(upper.bytes())
                                       .VInt(7)
                                       .VInt(8)
                                       .VInt(100)
                                       .VInt(9)
                                       .VInt(10)
                                       .VInt(300),
                                   16, false);
  const SkipListReader::Entry& first = reader.Next(0);
  EXPECT_EQ(first.document, 7U);
  EXPECT_EQ(first.postings_distance, 8U);
  EXPECT_EQ(first.positions_distance, 100U);
  EXPECT_EQ(first.end, 3U);
  EXPECT_FALSE(first.payload_length.has_value());
  const SkipListReader::Entry& second = reader.Next(0);
  EXPECT_EQ(second.document, 16U);
  EXPECT_EQ(second.postings_distance, 18U);
  EXPECT_EQ(second.positions_distance, 400U);
  const SkipListReader::Entry& above = reader.Next(1);
  EXPECT_EQ(above.document, 30U);
  EXPECT_EQ(above.child, 11U);
  EXPECT_EQ(reader.offset(1), reader.end(1));
}

TEST(SkipListTest, KeepsThePayloadsLengthUntilAnotherIsStated) {
  SkipListReader reader =
      ReaderOf(ByteWriter().VInt(6).VInt(1).VInt(1).VInt(7).VInt(20).VInt(1).VInt(1).VInt(8).VInt(1).VInt(1),
               12, true);
  EXPECT_FALSE(reader.Next(0).payload_length.has_value());
  EXPECT_EQ(reader.Next(0).payload_length, 20U);
  const SkipListReader::Entry& third = reader.Next(0);
  EXPECT_EQ(third.payload_length, 20U);
  EXPECT_EQ(third.document, 10U);
}

TEST(SkipListTest, RefusesLevelsAndEntriesThatDoNotFit) {
  ExpectDamage(0, "takes 100 bytes", [] { ReaderOf(ByteWriter().VLong(100), 16, false); });
  ExpectDamage(1, "file ends at 1", [] { ReaderOf(ByteWriter().VInt(1), 4, false).Next(0); });
  ExpectDamage(3, "too few entries", [] {
    SkipListReader reader = ReaderOf(ByteWriter().VInt(1).VInt(1).VInt(1), 8, false);
    reader.Next(0);
    reader.Next(0);
  });
  ExpectDamage(1, "reaches past its level's end",
               [] { ReaderOf(ByteWriter().VLong(2).VInt(1).VInt(1).VInt(1).VLong(1), 16, false).Next(1); });
}

// The index library reads such a level into a buffer and does not look at its end again.
TEST(SkipListTest, RefusesALevelThatIsLongerThanItsEntriesCanBe) {
  const auto level = [](uint64_t length) {
    return ByteWriter().VLong(length).Raw(std::string(length, '\0'));
  };
  ReaderOf(level(29), 16, false);
  ExpectDamage(0, "takes 30 bytes for 1 entries", [&] { ReaderOf(level(30), 16, false); });
}

TEST(SkipListTest, RefusesAnEntryOfAnUpperLevelThatGoesOnPastTheFile) {
  ExpectDamage(1, "reaches past its level's end", [] {
    ReaderOf(ByteWriter().VLong(4).VInt(1).VInt(1).VInt(1).Raw("\x80"), 16, false).Next(1);
  });
}

TEST(SkipListTest, AddsDistancesAsSignedNumbers) {
  const SkipListReader::Entry entry = ReaderOf(ByteWriter().VInt(7).VInt(-16).VInt(-1), 4, false).Next(0);
  EXPECT_EQ(static_cast<int64_t>(entry.postings_distance), -16);
  EXPECT_EQ(static_cast<int64_t>(entry.positions_distance), -1);
}

// 16 documents, of which the level below has entries at the 4th, 8th, 12th and 16th, and the one above at the 16th:
// documents 30, 70, 110 and 150, their postings 10 bytes each, their positions 20.
ByteWriter TwoLevels() {
  ByteWriter lower;
  for (const int distance : {30, 40, 40, 40}) lower.VInt(distance).VInt(10).VInt(20);
  const ByteWriter upper = ByteWriter().VInt(150).VInt(40).VInt(80).VLong(12);
  return ByteWriter().VLong(upper.size()).Raw(upper.bytes()).Raw(lower.bytes());
}

TEST(SkipListTest, YieldsTheSameEntriesFromABorrowedBufferWhereverThatEnds) {
  const std::string before(5, 'x');
  const std::string bytes = before + TwoLevels().bytes();
  const auto source = SourceOf(bytes);
  for (size_t buffer = 1; buffer <= bytes.size(); ++buffer) {
    for (int given_back_after = 0; given_back_after <= 4; ++given_back_after) {
      ByteReader lender(source, buffer);
      lender.ReadByte();
      SkipListReader reader(source, 4, kMostLevels);
      reader.SeekBorrowing(lender, before.size(), 16, false);
      for (int entry = 0; entry < 4; ++entry) {
        if (entry == given_back_after) {
          lender.Seek(bytes.size() - 1);
          lender.ReadByte();
          reader.GiveBack();
        }
        ASSERT_EQ(reader.Next(0).document, static_cast<uint32_t>(30 + 40 * entry)) << buffer;
      }
      ASSERT_EQ(reader.Next(1).document, 150U) << buffer;
      EXPECT_EQ(reader.offset(0), bytes.size());
    }
  }
}

TEST(SkipListTest, JumpsBehindTheLastEntryThatLiesBefore) {
  const auto landing = [](int32_t target) { return ReaderOf(TwoLevels(), 17, false).SkipTo(target, 1000); };
  EXPECT_EQ(landing(-5).passed, 0);
  EXPECT_EQ(landing(0).passed, 0);
  EXPECT_EQ(landing(30).passed, 0) << "the document itself may be that of the entry";
  EXPECT_EQ(landing(31).passed, 3);
  EXPECT_EQ(landing(31).entry.document, 30U);
  EXPECT_EQ(landing(110).passed, 7);
  EXPECT_EQ(landing(110).entry.postings_distance, 20U);
  EXPECT_EQ(landing(150).passed, 11);
  EXPECT_EQ(landing(150).entry.positions_distance, 60U);
  EXPECT_EQ(landing(151).passed, 15);
  EXPECT_EQ(landing(999).entry.document, 150U);
  EXPECT_EQ(landing(999).entry.postings_distance, 40U);
}

TEST(SkipListTest, RefusesToBeLedAstray) {
  const auto jump = [](const ByteWriter& bytes) { ReaderOf(bytes, 17, false).SkipTo(500, 1000); };
  const auto two_levels = [](const ByteWriter& upper) {
    return ByteWriter().VLong(upper.size()).Raw(upper.bytes()).VInt(30).VInt(1).VInt(1);
  };
  ExpectDamage(1, "from document 0 to 1000 of 1000",
               [&] { jump(two_levels(ByteWriter().VInt(1000).VInt(1).VInt(1).VLong(3))); });
  ExpectDamage(1, "to byte 4 of a level of 3",
               [&] { jump(two_levels(ByteWriter().VInt(150).VInt(1).VInt(1).VLong(4))); });
  ExpectDamage(1, "level 1 is empty", [&] { jump(two_levels(ByteWriter())); });
  ExpectDamage(3, "from document 30 to 29 of 1000", [] {
    ReaderOf(ByteWriter().VInt(30).VInt(1).VInt(1).VInt(-1).VInt(1).VInt(1), 8, false).SkipTo(500, 1000);
  });
}

}  // namespace
}  // namespace vantrel::elastic::format
