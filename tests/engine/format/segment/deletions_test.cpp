#include "elastic/format/segment/deletions.h"

#include <gtest/gtest.h>

#include <set>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

std::string BitsOf(int32_t documents, const std::set<int32_t>& deleted) {
  std::string bits(static_cast<size_t>(documents) / 8 + 1, '\0');
  for (const int32_t document : deleted) {
    char& byte = bits[static_cast<size_t>(document) / 8];
    byte = static_cast<char>(byte | 1 << document % 8);
  }
  return bits;
}

std::string Dense(int32_t documents, const std::set<int32_t>& deleted) {
  return ByteWriter()
      .Int(documents)
      .Int(static_cast<int64_t>(deleted.size()))
      .Raw(BitsOf(documents, deleted))
      .bytes();
}

std::string Sparse(int32_t documents, const std::set<int32_t>& deleted) {
  ByteWriter out;
  out.Int(-1).Int(documents).Int(static_cast<int64_t>(deleted.size()));
  const std::string bits = BitsOf(documents, deleted);
  size_t before = 0;
  for (size_t i = 0; i < bits.size(); ++i) {
    if (bits[i] == 0) continue;
    out.VInt(static_cast<int64_t>(i - before)).Byte(bits[i]);
    before = i;
  }
  return out.bytes();
}

void ExpectDeletions(const std::string& bytes, int32_t documents, const std::set<int32_t>& deleted) {
  Deletions deletions(SourceOf(bytes), documents);
  EXPECT_EQ(deletions.count(), static_cast<int32_t>(deleted.size()));
  for (int32_t document = 0; document < documents; ++document) {
    ASSERT_EQ(deletions.Contains(document), deleted.contains(document)) << "document " << document;
  }
}

TEST(DeletionsTest, BothLayoutsTellTheDeletedDocuments) {
  const std::set<int32_t> cases[] = {{}, {0}, {7, 8}, {0, 1, 2, 3, 4, 5, 6, 7}, {99}, {15, 16, 17, 64, 99}};
  for (const std::set<int32_t>& deleted : cases) {
    ExpectDeletions(Dense(100, deleted), 100, deleted);
    ExpectDeletions(Sparse(100, deleted), 100, deleted);
  }
  ExpectDeletions(Dense(8, {0, 7}), 8, {0, 7});  // nine bits' room: one byte more than needed
  ExpectDeletions(Sparse(8, {0, 7}), 8, {0, 7});
}

TEST(DeletionsTest, ManyPagesAreHeldAFewAtATime) {
  // 5 million documents take 10 pages of bits, 70 million take 134: more than are held.
  constexpr int32_t kDocuments = 70'000'000;
  std::set<int32_t> deleted;
  for (int32_t document = 5; document < kDocuments; document += 99'991) deleted.insert(document);
  Deletions deletions(SourceOf(Dense(kDocuments, deleted)), kDocuments);
  EXPECT_EQ(deletions.count(), static_cast<int32_t>(deleted.size()));
  constexpr int32_t kPage = 65536 * 8;
  // To and fro between pages that share a place.
  for (int32_t offset = 0; offset < kPage; offset += 1237) {
    for (const int32_t document : {offset, offset + 64 * kPage, offset + 128 * kPage, offset + 5 * kPage}) {
      ASSERT_EQ(deletions.Contains(document), deleted.contains(document)) << document;
    }
  }
  for (const int32_t document : deleted) ASSERT_TRUE(deletions.Contains(document)) << document;
}

TEST(DeletionsTest, ManySparseBytesAreHeldAFewAtATime) {
  // Every 24th document from number 3 on: each third byte, 1.7 million of them, of which a million are held.
  constexpr int32_t kDocuments = 40'000'000;
  constexpr int32_t kDeleted = (kDocuments - 3 + 23) / 24;
  ByteWriter bytes = ByteWriter().Int(-1).Int(kDocuments).Int(kDeleted);
  for (int32_t i = 0; i < kDeleted; ++i) bytes.VInt(i == 0 ? 0 : 3).Byte(1 << 3);
  Deletions deletions(SourceOf(bytes.bytes()), kDocuments);
  EXPECT_EQ(deletions.count(), kDeleted);
  for (int32_t document = 0; document < kDocuments; document += 1013) {
    ASSERT_EQ(deletions.Contains(document), document % 24 == 3) << document;
    const int32_t far = (document + kDocuments / 2) % kDocuments;
    ASSERT_EQ(deletions.Contains(far), far % 24 == 3) << far;
  }
}

TEST(DeletionsTest, RefusesToBeAboutAnotherNumberOfDocuments) {
  ExpectDamage(0, "about 100 documents, but the segment has 99",
               [] { Deletions(SourceOf(Dense(100, {1})), 99); });
  ExpectDamage(4, "about 100 documents, but the segment has 101",
               [] { Deletions(SourceOf(Sparse(100, {1})), 101); });
  ExpectDamage(0, "about -2 documents", [] { Deletions(SourceOf(ByteWriter().Int(-2).Int(0).bytes()), 99); });
}

TEST(DeletionsTest, RefusesACountThatItsBitsContradict) {
  std::string bytes = Dense(100, {1, 50});
  bytes[7] = 3;
  ExpectDamage(8, "2 by their bits, but 3 by their count", [&] { Deletions(SourceOf(bytes), 100); });
  bytes[7] = 101;
  ExpectDamage(4, "count of deleted documents is 101", [&] { Deletions(SourceOf(bytes), 100); });
  bytes[4] = '\xff';
  ExpectDamage(4, "count of deleted documents is -", [&] { Deletions(SourceOf(bytes), 100); });
  bytes = Sparse(100, {1, 50});
  bytes[11] = 3;
  ExpectDamage(16, "more bytes", [&] { Deletions(SourceOf(bytes), 100); });
  bytes = Sparse(100, {1, 48, 49, 50});
  bytes[11] = 3;
  ExpectDamage(14, "byte holds 3 deleted documents of 2 that are left",
               [&] { Deletions(SourceOf(bytes), 100); });
}

TEST(DeletionsTest, RefusesSparseBytesThatAreZeroRepeatedOrOutside) {
  const ByteWriter head = ByteWriter().Int(-1).Int(100).Int(2);
  ExpectDamage(12, "byte holds 0 deleted",
               [&] { Deletions(SourceOf(ByteWriter(head).VInt(0).Byte(0).bytes()), 100); });
  ExpectDamage(14, "gap 0 leads to byte 1",
               [&] { Deletions(SourceOf(ByteWriter(head).VInt(1).Byte(1).VInt(0).Byte(2).bytes()), 100); });
  ExpectDamage(12, "leads to byte 13 of 13",
               [&] { Deletions(SourceOf(ByteWriter(head).VInt(13).Byte(1).bytes()), 100); });
  ExpectDamage(14, "leads to byte 4294967296 of 13",
               [&] { Deletions(SourceOf(ByteWriter(head).VInt(1).Byte(1).VInt(-1).Byte(1).bytes()), 100); });
}

TEST(DeletionsTest, IsDamagedWhereverItIsCut) {
  for (const std::string& bytes : {Dense(100, {1, 50, 99}), Sparse(100, {1, 50, 99})}) {
    for (size_t length = 0; length < bytes.size(); ++length) {
      EXPECT_THROW(Deletions(SourceOf(bytes.substr(0, length)), 100), IndexDamagedError)
          << "cut to " << length;
    }
  }
}

TEST(DeletionsTest, AMediumErrorPassesOnAndDoesNotStick) {
  EXPECT_THROW(Deletions(SourceOf(Dense(100, {1}), 0, 3), 100), IndexIoError);
}

}  // namespace
}  // namespace vantrel::elastic::format
