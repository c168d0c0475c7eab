#include "elastic/format/io/byte_reader.h"

#include <gtest/gtest.h>

#include <limits>
#include <memory>
#include <random>
#include <string>
#include <utility>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::MemoryFile;
using ::quorelastic::testing::MemorySource;
using ::quorelastic::testing::SourceOf;

TEST(ByteReaderTest, ReadsNumbersOfFixedLengthBigEndianAndSigned) {
  ByteReader reader(SourceOf(ByteWriter()
                                 .Byte(0xfe)
                                 .Int(0x01020304)
                                 .Int(-2)
                                 .Long(0x0102030405060708)
                                 .Long(std::numeric_limits<int64_t>::min())
                                 .bytes()));
  EXPECT_EQ(reader.ReadByte(), 0xfe);
  EXPECT_EQ(reader.ReadInt(), 0x01020304);
  EXPECT_EQ(reader.ReadInt(), -2);
  EXPECT_EQ(reader.ReadLong(), 0x0102030405060708);
  EXPECT_EQ(reader.ReadLong(), std::numeric_limits<int64_t>::min());
  EXPECT_EQ(reader.remaining(), 0U);
}

TEST(ByteReaderTest, ReadsVariableLengthNumbersUpToTheirLimits) {
  for (const uint32_t value : {0U, 1U, 0x7fU, 0x80U, 0x3fffU, 0x4000U, 0x1fffffU, 0x200000U, 0xfffffffU,
                               0x10000000U, 0x7fffffffU, 0x80000000U, 0xffffffffU}) {
    ByteReader reader(SourceOf(ByteWriter().VInt(value).bytes()));
    EXPECT_EQ(reader.ReadVInt(), value);
    EXPECT_EQ(reader.remaining(), 0U);
  }
  for (const uint64_t value : {uint64_t{0}, uint64_t{0x80}, uint64_t{1} << 35, (uint64_t{1} << 56) - 1,
                               uint64_t{1} << 56, uint64_t{std::numeric_limits<int64_t>::max()}}) {
    ByteReader reader(SourceOf(ByteWriter().VLong(value).bytes()));
    EXPECT_EQ(reader.ReadVLong(), value);
    EXPECT_EQ(reader.remaining(), 0U);
  }
}

TEST(ByteReaderTest, PassesShortNumbersWhereverTheyLieInItsBuffer) {
  for (const size_t buffer : {size_t{8}, size_t{9}, size_t{13}, size_t{16} << 10}) {
    std::mt19937 random(static_cast<uint32_t>(buffer));
    for (int round = 0; round < 200; ++round) {
      ByteWriter bytes;
      const uint64_t count = 1 + random() % 60;
      for (uint64_t i = 0; i < count; ++i) bytes.VInt(int64_t{1} << random() % 21);
      const uint64_t end = bytes.size();
      bytes.Raw(std::string(random() % 12, 'x'));
      ByteReader reader(SourceOf(bytes.bytes()), buffer);
      ASSERT_TRUE(reader.PassShortVInts(count));
      ASSERT_EQ(reader.offset(), end) << count << " numbers";
    }
  }
}

TEST(ByteReaderTest, PassesNoLongNumberAmongShortOnes) {
  constexpr uint64_t kCount = 30;
  for (uint64_t place = 0; place < kCount; ++place) {
    for (const size_t buffer : {size_t{8}, size_t{9}, size_t{16} << 10}) {
      ByteWriter bytes;
      for (uint64_t i = 0; i < kCount; ++i) bytes.VInt(i == place ? 1 << 21 : 1);
      ByteReader reader(SourceOf(bytes.bytes()), buffer);
      EXPECT_FALSE(reader.PassShortVInts(kCount)) << "the number at " << place;
    }
  }
}

TEST(ByteReaderTest, PassesNoShortNumbersPastTheEnd) {
  ByteReader reader(SourceOf("1234567890"), 8);
  EXPECT_FALSE(reader.PassShortVInts(11));
  ByteReader torn(SourceOf("1234567\x80"), 8);
  EXPECT_FALSE(torn.PassShortVInts(8));
}

// Counts how often it is read.
std::shared_ptr<const ByteSource> CountingSource(const std::string& bytes, int& reads) {
  return std::make_shared<MemorySource>("memory",
                                        MemoryFile{.bytes = bytes, .before_read = [&reads] { ++reads; }});
}

TEST(ByteReaderTest, ReadsWhatAnotherReaderHoldsFromItsBuffer) {
  int reads = 0;
  const auto source = CountingSource("0123456789abcdef", reads);
  ByteReader lender(source, 8);
  lender.Seek(4);
  lender.ReadByte();
  EXPECT_EQ(reads, 1);
  ByteReader borrower(source, 8);
  borrower.Borrow(lender);
  borrower.Seek(6);
  EXPECT_EQ(borrower.ReadByte(), '6');
  EXPECT_EQ(borrower.Take(5).size(), 5U);
  EXPECT_EQ(borrower.offset(), 12U);
  EXPECT_EQ(reads, 1);
  // Behind the buffer, and before it.
  EXPECT_EQ(borrower.ReadByte(), 'c');
  borrower.Borrow(lender);
  borrower.Seek(3);
  EXPECT_EQ(borrower.ReadByte(), '3');
  EXPECT_EQ(reads, 3);
  EXPECT_EQ(lender.offset(), 5U);
  EXPECT_EQ(lender.ReadByte(), '5');
}

TEST(ByteReaderTest, GoesOnByItselfOnceItHasGivenBack) {
  const auto source = SourceOf("0123456789abcdef");
  ByteReader lender(source, 4);
  ByteReader borrower(source, 4);
  EXPECT_EQ(lender.ReadByte(), '0');
  const uint64_t fills = lender.fills();
  borrower.Borrow(lender);
  borrower.Seek(1);
  EXPECT_EQ(borrower.ReadByte(), '1');
  lender.Seek(8);
  EXPECT_EQ(lender.ReadByte(), '8');
  EXPECT_NE(lender.fills(), fills);
  borrower.GiveBack();
  EXPECT_EQ(borrower.offset(), 2U);
  EXPECT_EQ(borrower.ReadByte(), '2');
  // It has left the lender's buffer already: there is nothing to give back.
  borrower.GiveBack();
  EXPECT_EQ(borrower.ReadByte(), '3');
}

TEST(ByteReaderTest, BorrowsFromAReaderThatHasReadNothing) {
  const auto source = SourceOf("0123");
  const ByteReader lender(source);
  ByteReader borrower(source);
  borrower.Borrow(lender);
  borrower.Seek(2);
  EXPECT_EQ(borrower.ReadByte(), '2');
  borrower.GiveBack();
  EXPECT_EQ(borrower.ReadByte(), '3');
  EXPECT_EQ(borrower.remaining(), 0U);
}

TEST(ByteReaderTest, ReadsOnFromABorrowedBufferWhereverThatEnds) {
  ByteWriter bytes;
  for (int i = 0; i < 60; ++i) bytes.VInt(int64_t{1} << (i % 30));
  const auto source = SourceOf(bytes.bytes());
  for (size_t buffer = 1; buffer < bytes.size(); ++buffer) {
    ByteReader lender(source, buffer);
    lender.ReadByte();
    for (int given_back_after = 0; given_back_after < 60; ++given_back_after) {
      ByteReader borrower(source, 16);
      borrower.Borrow(lender);
      borrower.Seek(0);
      for (int i = 0; i < 60; ++i) {
        if (i == given_back_after) borrower.GiveBack();
        ASSERT_EQ(borrower.ReadVInt(), 1U << (i % 30)) << "number " << i << ", buffer of " << buffer;
      }
    }
  }
}

TEST(ByteReaderTest, KeepsItsPlaceWhenItIsMoved) {
  const auto source = SourceOf("0123456789");
  ByteReader lender(source, 4);
  EXPECT_EQ(lender.ReadByte(), '0');
  ByteReader borrower(source, 4);
  borrower.Borrow(lender);
  borrower.Seek(1);
  ByteReader moved_lender(std::move(lender));
  ByteReader moved(std::move(borrower));
  EXPECT_EQ(moved_lender.ReadByte(), '1');
  EXPECT_EQ(moved.ReadByte(), '1');
  moved.GiveBack();
  EXPECT_EQ(moved.ReadByte(), '2');
}

TEST(ByteReaderTest, RefusesAVIntOfMoreThan32BitsWhereItBegins) {
  ByteReader fits(SourceOf("\xff\xff\xff\xff\x0f"));
  EXPECT_EQ(fits.ReadVInt(), 0xffffffffU);
  for (const char* too_large :
       {"A\xff\xff\xff\xff\x10", "A\x80\x80\x80\x80\x80\x01", "A\x80\x80\x80\x80\x8f"}) {
    ByteReader reader(SourceOf(too_large));
    reader.ReadByte();
    ExpectDamage(1, "does not fit 32 bits", [&] { reader.ReadVInt(); });
  }
}

TEST(ByteReaderTest, RefusesAVLongOfMoreThan63BitsWhereItBegins) {
  const std::string nine_with_more = "A" + std::string(9, '\xff') + "\x01";
  ByteReader reader(SourceOf(nine_with_more));
  reader.ReadByte();
  ExpectDamage(1, "does not fit 63 bits", [&] { reader.ReadVLong(); });
}

TEST(ByteReaderTest, ReadsTheSameWhateverTheLengthOfItsBuffer) {
  ByteWriter writer;
  for (int i = 0; i < 50; ++i) {
    writer.Byte(i)
        .Int(int64_t{i} * 1000003)
        .Long(-i)
        .VInt(1 << (i % 31))
        .VLong(uint64_t{1} << (i % 63))
        .String("t\xc3\xa4xt");
  }
  for (size_t buffer_size = 1; buffer_size < 40; ++buffer_size) {
    ByteReader reader(SourceOf(writer.bytes()), buffer_size);
    for (int i = 0; i < 50; ++i) {
      EXPECT_EQ(reader.ReadByte(), i);
      EXPECT_EQ(reader.ReadInt(), i * 1000003);
      EXPECT_EQ(reader.ReadLong(), -i);
      EXPECT_EQ(reader.ReadVInt(), 1U << (i % 31));
      EXPECT_EQ(reader.ReadVLong(), uint64_t{1} << (i % 63));
      EXPECT_EQ(reader.ReadString(), "t\xc3\xa4xt");
    }
    EXPECT_EQ(reader.offset(), writer.size());
    EXPECT_EQ(reader.remaining(), 0U);
  }
}

TEST(ByteReaderTest, ReportsTheEndOfTheFileWhereTheMissingBytesWouldBegin) {
  const auto source = SourceOf("\x01\x02\x03");
  ExpectDamage(0, "wanted 4 more bytes, but the file ends at 3", [&] { ByteReader(source).ReadInt(); });
  ExpectDamage(0, "wanted 8 more bytes, but the file ends at 3", [&] { ByteReader(source).ReadLong(); });
  ByteReader reader(source);
  reader.Skip(3);
  ExpectDamage(3, "wanted 1 more bytes", [&] { reader.ReadByte(); });
  ExpectDamage(3, "wanted 1 more bytes", [&] { reader.ReadVInt(); });
  ExpectDamage(2, "wanted 1 more bytes", [&] {
    ByteReader unfinished(SourceOf("\x80\x80"));
    unfinished.ReadVInt();
  });
  ExpectDamage(0, "wanted 1 more bytes, but the file ends at 0",
               [&] { ByteReader(SourceOf("")).ReadByte(); });
}

TEST(ByteReaderTest, TellsTheEndOfTheFileFromOtherDamage) {
  EXPECT_THROW(ByteReader(SourceOf("abc")).ReadInt(), EndOfFileError);
  EXPECT_THROW(ByteReader(SourceOf("\x80")).ReadVInt(), EndOfFileError);
  const auto throws_another = [](auto read) {
    try {
      read();
    } catch (const EndOfFileError&) {
      return false;
    } catch (const IndexDamagedError&) {
      return true;
    }
    return false;
  };
  EXPECT_TRUE(throws_another([] {
    ByteReader(SourceOf("\x09"
                        "abc"))
        .ReadString();
  }));
  EXPECT_TRUE(throws_another([] { ByteReader(SourceOf("abc")).Skip(4); }));
}

TEST(ByteReaderTest, StaysUsableAfterAReadThatFailed) {
  ByteReader reader(SourceOf("\x01\x02\x03"));
  EXPECT_THROW(reader.ReadInt(), IndexDamagedError);
  EXPECT_EQ(reader.offset(), 0U);
  EXPECT_EQ(reader.ReadByte(), 1);
}

TEST(ByteReaderTest, SeeksAnywhereUpToTheEndButNotPastIt) {
  ByteReader reader(SourceOf("0123456789"), 4);
  reader.Seek(9);
  EXPECT_EQ(reader.ReadByte(), '9');
  reader.Seek(1);
  EXPECT_EQ(reader.ReadByte(), '1');
  reader.Seek(3);  // within the buffer
  EXPECT_EQ(reader.ReadByte(), '3');
  reader.Seek(10);
  EXPECT_EQ(reader.remaining(), 0U);
  ExpectDamage(11, "past the end of the file at 10", [&] { reader.Seek(11); });
  ExpectDamage(UINT64_MAX, "past the end", [&] { reader.Seek(UINT64_MAX); });
  reader.Seek(4);
  reader.Skip(3);
  EXPECT_EQ(reader.ReadByte(), '7');
  ExpectDamage(8, "wanted to skip 3 bytes", [&] { reader.Skip(3); });
  ExpectDamage(8, "wanted to skip", [&] { reader.Skip(UINT64_MAX); });
}

TEST(ByteReaderTest, ReadsRunsOfBytesShorterAndLongerThanItsBuffer) {
  std::string bytes;
  for (int i = 0; i < 1000; ++i) bytes.push_back(static_cast<char>(i * 7));
  for (const size_t length :
       {size_t{0}, size_t{1}, size_t{15}, size_t{16}, size_t{17}, size_t{500}, size_t{990}}) {
    ByteReader reader(SourceOf(bytes), 16);
    reader.Skip(3);
    reader.ReadByte();
    std::string run(length, '\0');
    reader.ReadBytes(std::span(reinterpret_cast<uint8_t*>(run.data()), run.size()));
    EXPECT_EQ(run, bytes.substr(4, length));
    EXPECT_EQ(reader.offset(), 4 + length);
    EXPECT_EQ(reader.ReadByte(), static_cast<uint8_t>(bytes[4 + length]));
  }
}

TEST(ByteReaderTest, AStringMustLieInTheFileAndBeUtf8) {
  EXPECT_EQ(ByteReader(SourceOf(ByteWriter().String("").bytes())).ReadString(), "");
  const std::string with_zero("a\0b", 3);
  EXPECT_EQ(ByteReader(SourceOf(ByteWriter().String(with_zero).bytes())).ReadString(), with_zero);
  ExpectDamage(0, "string of 5 bytes reaches past the end of the file at 5",
               [] { ByteReader(SourceOf(ByteWriter().VInt(5).Raw("four").bytes())).ReadString(); });
  ExpectDamage(0, "string of 4294967295 bytes",
               [] { ByteReader(SourceOf(ByteWriter().VInt(-1).Raw("four").bytes())).ReadString(); });
  ExpectDamage(0, "not valid UTF-8",
               [] { ByteReader(SourceOf(ByteWriter().String("\xc3").bytes())).ReadString(); });
}

TEST(ByteReaderTest, AMediumErrorPassesOnAndTheReaderStaysWhereItWas) {
  ByteReader reader(SourceOf("0123456789", 0, 8), 4);
  for (int i = 0; i < 8; ++i) EXPECT_EQ(reader.ReadByte(), '0' + i);
  ExpectIndexError("cannot read: Input/output error", [&] { reader.ReadByte(); });
  EXPECT_EQ(reader.offset(), 8U);
  ExpectIndexError("cannot read: Input/output error", [&] { reader.ReadByte(); });
  reader.Seek(0);
  EXPECT_EQ(reader.ReadByte(), '0');
}

}  // namespace
}  // namespace vantrel::elastic::format
