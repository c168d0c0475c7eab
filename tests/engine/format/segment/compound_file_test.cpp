#include "elastic/format/segment/compound_file.h"

#include <gtest/gtest.h>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/name_budget.h"
#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ContentOf;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::SourceOf;

// The table takes 1 + 3 * (8 + 7) = 46 bytes.
ByteWriter ThreeParts(int64_t first, int64_t second, int64_t third) {
  return ByteWriter().VInt(3).Long(first).String("_0.fnm").Long(second).String("_0.tis").Long(third).String(
      "_0.tii");
}

TEST(CompoundFileTest, OffersEachSubFileByItsName) {
  const CompoundFile file(SourceOf(ThreeParts(46, 49, 49).Raw("onethird").bytes()));
  EXPECT_TRUE(file.Exists("_0.fnm"));
  EXPECT_FALSE(file.Exists("_0.frq"));
  EXPECT_EQ(ContentOf(*file.Open("_0.fnm")), "one");
  EXPECT_EQ(ContentOf(*file.Open("_0.tis")), "");
  EXPECT_EQ(ContentOf(*file.Open("_0.tii")), "third");
  EXPECT_EQ(file.Open("_0.tii")->name(), "memory (_0.tii)");
  ExpectIndexError("memory: compound file holds no '_0.frq'", [&] { file.Open("_0.frq"); });
}

TEST(CompoundFileTest, ASubFileEndsWhereTheNextBegins) {
  const CompoundFile file(SourceOf(ThreeParts(46, 49, 50).Raw("one2third").bytes()));
  const auto part = file.Open("_0.fnm");
  ByteReader reader(part);
  reader.Skip(3);
  ExpectDamage(3, "the file ends at 3", [&] { reader.ReadByte(); });
}

TEST(CompoundFileTest, ASubFileOutlivesTheTable) {
  std::shared_ptr<const ByteSource> part;
  {
    const CompoundFile file(SourceOf(ThreeParts(46, 46, 46).Raw("third").bytes()));
    part = file.Open("_0.tii");
  }
  EXPECT_EQ(ContentOf(*part), "third");
}

TEST(CompoundFileTest, MayBeEmpty) { EXPECT_FALSE(CompoundFile(SourceOf(std::string(1, '\0'))).Exists("")); }

TEST(CompoundFileTest, RefusesOffsetsOutsideTheFileOrOutOfOrder) {
  ExpectDamage(31, "sub-file begins at 52",
               [] { CompoundFile(SourceOf(ThreeParts(46, 47, 52).Raw("12345").bytes())); });
  ExpectDamage(16, "sub-file begins at 46",
               [] { CompoundFile(SourceOf(ThreeParts(47, 46, 51).Raw("12345").bytes())); });
  ExpectDamage(1, "sub-file begins at -1",
               [] { CompoundFile(SourceOf(ThreeParts(-1, 46, 51).Raw("12345").bytes())); });
}

TEST(CompoundFileTest, RefusesATableThatIsCut) {
  const std::string bytes = ThreeParts(46, 46, 46).bytes();
  for (size_t length = 0; length < bytes.size(); ++length) {
    EXPECT_THROW(CompoundFile(SourceOf(bytes.substr(0, length))), IndexDamagedError) << "cut to " << length;
  }
}

TEST(CompoundFileTest, RefusesATableThatReachesIntoTheSubFiles) {
  ExpectDamage(31, "table reaches into the first sub-file at 45",
               [] { CompoundFile(SourceOf(ThreeParts(45, 46, 46).bytes())); });
}

TEST(CompoundFileTest, RefusesTwoSubFilesOfOneName) {
  ExpectDamage(16, "sub-file bears the name of one before", [] {
    CompoundFile(SourceOf(ByteWriter().VInt(2).Long(31).String("_0.fnm").Long(31).String("_0.fnm").bytes()));
  });
}

TEST(CompoundFileTest, RefusesNamesThatTakeTooMuch) {
  constexpr int64_t kBegin = kMostNameBytes + 10'000;
  // 512 names that take all there is, but for a byte, and one more.
  const auto table = [](size_t first, size_t last) {
    ByteWriter bytes;
    bytes.VInt(513);
    for (int number = 0; number < 512; ++number) {
      const std::string start = std::to_string(1000 + number);
      bytes.Long(kBegin).String(start +
                                std::string((number == 0 ? first : kLongestName) - start.size(), 'a'));
    }
    return bytes.Long(kBegin).String(std::string(last, 'b'));
  };
  const auto open = [](const ByteWriter& bytes) {
    return CompoundFile(SourceOf(bytes.bytes(), 10'000)).parts().size();
  };
  EXPECT_EQ(open(table(kLongestName - 1, 1)), 513U);
  const uint64_t last_start = table(kLongestName - 1, 2).size() - 3 - sizeof(int64_t);
  ExpectDamage(last_start, "names up to this one take more than 2097152 bytes",
               [&] { open(table(kLongestName - 1, 2)); });
  ExpectDamage(2, "name of 4097 bytes is too long", [&] { open(table(kLongestName + 1, 1)); });
}

TEST(CompoundFileTest, AHugeCountOverAHoleInTheFileEndsAtOnce) {
  const std::string huge = ByteWriter().VInt(-1).bytes();
  ExpectDamage(0, "sub-files are too many", [&] { CompoundFile(SourceOf(huge, uint64_t{1} << 40)); });
  const std::string too_many = ByteWriter().VInt(CompoundFile::kMostSubFiles + 1).bytes();
  ExpectDamage(0, "sub-files are too many", [&] { CompoundFile(SourceOf(too_many, uint64_t{1} << 40)); });
  const std::string most = ByteWriter().VInt(CompoundFile::kMostSubFiles).bytes();
  ExpectDamage(3, "table reaches", [&] { CompoundFile(SourceOf(most, uint64_t{1} << 40)); });
}

}  // namespace
}  // namespace vantrel::elastic::format
