#include "elastic/format/segment/positions.h"

#include <gtest/gtest.h>

#include <string>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

PositionsReader ReaderOf(const ByteWriter& bytes, bool has_payloads, uint64_t pointer = 0) {
  PositionsReader reader(SourceOf(bytes.bytes()));
  reader.Seek(pointer, has_payloads);
  return reader;
}

TEST(PositionsTest, PassesTheDocumentsOfATerm) {
  PositionsReader reader =
      ReaderOf(ByteWriter().Raw("skip").VInt(0).VInt(300).VInt(0).VInt(70000).VInt(7), false, 4);
  reader.PassDocument(3);
  EXPECT_EQ(reader.offset(), 8U);
  reader.PassDocument(1);
  EXPECT_EQ(reader.offset(), 11U);
}

TEST(PositionsTest, AllowsAFirstPositionOfMinusOne) {
  PositionsReader reader = ReaderOf(ByteWriter().VInt(-1).VInt(1), false);
  reader.PassDocument(2);
  EXPECT_EQ(reader.offset(), 6U);
}

TEST(PositionsTest, RefusesPositionsThatDescend) {
  ExpectDamage(1, "position 4 follows 5",
               [] { ReaderOf(ByteWriter().VInt(5).VInt(-1), false).PassDocument(2); });
  ExpectDamage(0, "position -2 follows -1", [] { ReaderOf(ByteWriter().VInt(-2), false).PassDocument(1); });
  ExpectDamage(5, "follows 2147483647",
               [] { ReaderOf(ByteWriter().VInt(0x7fffffff).VInt(1), false).PassDocument(2); });
}

TEST(PositionsTest, KeepsThePayloadsLengthUntilAnotherIsStated) {
  PositionsReader reader =
      ReaderOf(ByteWriter().VInt(1).VInt(3).Raw("abc").VInt(4).Raw("def").VInt(3).VInt(0).VInt(2), true);
  EXPECT_FALSE(reader.payload_length().has_value());
  reader.PassDocument(2);
  EXPECT_EQ(reader.payload_length(), 3U);
  EXPECT_TRUE(reader.states_length());
  EXPECT_EQ(reader.offset(), 9U);
  reader.PassDocument(1);
  EXPECT_EQ(reader.payload_length(), 0U);
  reader.PassDocument(1);
  EXPECT_FALSE(reader.states_length());
  EXPECT_EQ(reader.offset(), reader.size());
}

TEST(PositionsTest, RefusesPayloadsThatCannotBe) {
  ExpectDamage(0, "not stated", [] { ReaderOf(ByteWriter().VInt(2), true).PassDocument(1); });
  ExpectDamage(2, "wanted to skip 9 bytes",
               [] { ReaderOf(ByteWriter().VInt(1).VInt(9).Raw("abc"), true).PassDocument(1); });
  ExpectDamage(6, "wanted to skip 4294967295 bytes",
               [] { ReaderOf(ByteWriter().VInt(1).VInt(-1).Raw("abc"), true).PassDocument(1); });
}

// As many documents as announced, each with `frequency` positions of that distance.
void ExpectSameInBlocks(int32_t documents, uint32_t frequency, int64_t distance, size_t buffer) {
  ByteWriter postings;
  ByteWriter positions;
  for (int32_t document = 0; document < documents; ++document) {
    postings.VInt(document == 0 ? 0 : 2).VInt(frequency);
    for (uint32_t i = 0; i < frequency; ++i) positions.VInt(distance);
  }
  positions.Raw("the next term");
  PostingsReader reader(SourceOf(postings.bytes()), documents, buffer);
  PositionsReader places(SourceOf(positions.bytes()), buffer);
  reader.Seek({.document_frequency = documents}, false);
  places.Seek(0, false);
  for (int32_t left = documents; left > 0; left -= PostingsReader::kLongestBlock) {
    reader.PassBlock(std::min(left, PostingsReader::kLongestBlock));
    places.PassBlock(reader);
  }
  EXPECT_EQ(reader.document(), documents - 1);
  EXPECT_EQ(reader.offset(), postings.size());
  EXPECT_EQ(places.offset(), positions.size() - 13);
}

TEST(PositionsTest, PassesBlocksAsItPassesDocuments) {
  for (const size_t buffer : {size_t{16}, size_t{100}, size_t{16} << 10}) {
    for (const int32_t documents : {1, 2, 127, 128, 129, 1000}) {
      SCOPED_TRACE(std::to_string(buffer) + " bytes of buffer, " + std::to_string(documents) + " documents");
      ExpectSameInBlocks(documents, 1, 5, buffer);
      ExpectSameInBlocks(documents, 3, 200, buffer);
      ExpectSameInBlocks(documents, 2, 100000, buffer);
      ExpectSameInBlocks(documents, 2, 300000000, buffer);
      ExpectSameInBlocks(documents, 1500, 1, buffer);
    }
  }
}

// What the error says of documents with one position each, passed in one block or one by one.
std::string PositionsDamage(const std::string& positions, int32_t documents, bool in_a_block) {
  const std::string postings = "\1" + std::string(static_cast<size_t>(documents) + 200, '\3');
  PostingsReader reader(SourceOf(postings), documents);
  reader.Seek({.document_frequency = documents}, false);
  PositionsReader places(SourceOf(positions));
  places.Seek(0, false);
  try {
    reader.PassBlock(documents);
    if (in_a_block) {
      places.PassBlock(reader);
    } else {
      for (int32_t i = 0; i < documents; ++i) places.PassDocument(1);
    }
  } catch (const IndexDamagedError& error) {
    return error.what();
  }
  return "";
}

TEST(PositionsTest, RefusesInABlockWhatItRefusesOneByOneAtTheSamePlace) {
  const ByteWriter damaged[] = {ByteWriter().VInt(-2), ByteWriter().Raw("\xff\xff\xff\xff\xff\xff"),
                                ByteWriter().Raw("\x80\x80\x80\x80\x10")};
  for (const ByteWriter& position : damaged) {
    for (size_t place = 0; place < 100; ++place) {
      for (const size_t behind : {size_t{0}, size_t{10}, size_t{2000}}) {
        const std::string bytes = std::string(place, '\3') + position.bytes() + std::string(behind, '\3');
        const auto documents = static_cast<int32_t>(place + 1 + std::min<size_t>(behind, 20));
        const std::string expected = PositionsDamage(bytes, documents, false);
        EXPECT_NE(expected, "");
        EXPECT_EQ(PositionsDamage(bytes, documents, true), expected);
      }
    }
  }
}

TEST(PositionsTest, RefusesInABlockWhatItRefusesInADocument) {
  const std::string postings = ByteWriter().VInt(0).VInt(2).VInt(3).bytes();
  PostingsReader reader(SourceOf(postings), 9);
  reader.Seek({.document_frequency = 2}, false);
  reader.PassBlock(2);
  ExpectDamage(1, "position 4 follows 5",
               [&] { ReaderOf(ByteWriter().VInt(5).VInt(-1).VInt(0), false).PassBlock(reader); });
  ExpectDamage(2, "wanted 1 more bytes",
               [&] { ReaderOf(ByteWriter().VInt(5).VInt(1), false).PassBlock(reader); });
}

TEST(PositionsTest, TakesThePayloadLengthThatHoldsWhereItBegins) {
  PositionsReader reader(SourceOf(ByteWriter().VInt(2).Raw("load").VInt(5).VInt(1).Raw("x").bytes()));
  reader.Seek(0, true, 4);
  reader.PassDocument(2);
  EXPECT_EQ(reader.offset(), 8U);
  reader.Seek(0, true);
  ExpectDamage(0, "length of the term's first payload is not stated", [&] { reader.PassDocument(1); });
}

}  // namespace
}  // namespace vantrel::elastic::format
