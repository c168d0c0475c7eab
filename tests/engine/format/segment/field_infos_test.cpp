#include "elastic/format/segment/field_infos.h"

#include <gtest/gtest.h>

#include "elastic/format/segment/name_budget.h"
#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

std::vector<FieldInfo> Read(const ByteWriter& bytes) { return ReadFieldInfos(SourceOf(bytes.bytes())); }

void ExpectField(const FieldInfo& field, const std::string& name, bool indexed, bool omits_frequencies) {
  EXPECT_EQ(field.name, name);
  EXPECT_EQ(field.indexed, indexed) << name;
  EXPECT_EQ(field.omits_frequencies, omits_frequencies) << name;
}

TEST(FieldInfosTest, ReadsNamesAndFlags) {
  const auto fields = Read(ByteWriter()
                               .VInt(-2)
                               .VInt(4)
                               .String("")
                               .Byte(0x01)
                               .String("stored")
                               .Byte(0x3e)
                               .String("gr\xc3\xb6\xc3\x9f"
                                       "e")
                               .Byte(0x41)
                               .String("\xf0\x9f\x98\x80")
                               .Byte(0xff));
  ASSERT_EQ(fields.size(), 4U);
  ExpectField(fields[0], "", true, false);
  ExpectField(fields[1], "stored", false, false);
  ExpectField(fields[2],
              "gr\xc3\xb6\xc3\x9f"
              "e",
              true, true);
  ExpectField(fields[3], "\xf0\x9f\x98\x80", true, true);
}

TEST(FieldInfosTest, ReadsTheOlderLayoutWithoutAFormatNumber) {
  const auto fields = Read(ByteWriter().VInt(2).String("id").Byte(1).String("k\xc3\xb6rper").Byte(0));
  ASSERT_EQ(fields.size(), 2U);
  ExpectField(fields[0], "id", true, false);
  ExpectField(fields[1], "k\xc3\xb6rper", false, false);
}

TEST(FieldInfosTest, ReadsNamesOfTheOlderLayoutThatAreCountedInCharacters) {
  const auto fields = Read(ByteWriter()
                               .VInt(3)
                               .UnitsString(u"k\u00f6rper")
                               .Byte(1)
                               .UnitsString(u"\U0001F600")
                               .Byte(1)
                               .UnitsString(u"z")
                               .Byte(0));
  ASSERT_EQ(fields.size(), 3U);
  ExpectField(fields[0], "k\xc3\xb6rper", true, false);
  ExpectField(fields[1], "\xf0\x9f\x98\x80", true, false);
  ExpectField(fields[2], "z", false, false);
}

TEST(FieldInfosTest, MayHoldNoField) {
  EXPECT_TRUE(Read(ByteWriter().VInt(-2).VInt(0)).empty());
  EXPECT_TRUE(Read(ByteWriter().VInt(0)).empty());
}

TEST(FieldInfosTest, RefusesAFormatThatIsNotKnown) {
  ExpectDamage(0, "format is -3, but only -2 is known", [] { Read(ByteWriter().VInt(-3).VInt(0)); });
  ExpectDamage(0, "format is -1", [] { Read(ByteWriter().VInt(-1).VInt(0)); });
}

TEST(FieldInfosTest, IsDamagedWhereverItIsCutAndWhereMoreFollows) {
  const std::string bytes = ByteWriter().VInt(-2).VInt(2).String("id").Byte(1).String("body").Byte(1).bytes();
  for (size_t length = 0; length < bytes.size(); ++length) {
    EXPECT_THROW(ReadFieldInfos(SourceOf(bytes.substr(0, length))), IndexDamagedError) << "cut to " << length;
  }
  ExpectDamage(bytes.size(), "fields end here, but the file goes on",
               [&] { ReadFieldInfos(SourceOf(bytes + "x")); });
}

TEST(FieldInfosTest, TheNewerLayoutsNamesAreNeverTakenForCharacters) {
  ExpectDamage(6, "not valid UTF-8",
               [] { Read(ByteWriter().VInt(-2).VInt(1).UnitsString(u"\u00f6").Byte(1)); });
}

TEST(FieldInfosTest, RefusesCountsAndLengthsPastTheEnd) {
  ExpectDamage(5, "2147483647 fields, but", [] { Read(ByteWriter().VInt(-2).VInt(0x7fffffff)); });
  ExpectDamage(5, "4294967295 fields, but",
               [] { Read(ByteWriter().VInt(-2).VInt(-1).String("id").Byte(1)); });
  ExpectDamage(6, "string of 4294967295 bytes",
               [] { Read(ByteWriter().VInt(-2).VInt(1).VInt(-1).Raw("id")); });
}

TEST(FieldInfosTest, RefusesTwoFieldsOfOneName) {
  ExpectDamage(10, "field 1 bears the name of one before",
               [] { Read(ByteWriter().VInt(-2).VInt(2).String("id").Byte(1).String("id").Byte(1)); });
}

TEST(FieldInfosTest, AHugeCountOverAHoleInTheFileEndsAtOnce) {
  const std::string head = ByteWriter().VInt(-2).VInt(0x7fffffff).bytes();
  ExpectDamage(5, "fields are too many", [&] { ReadFieldInfos(SourceOf(head, uint64_t{1} << 40)); });
  const std::string too_many = ByteWriter().VInt(-2).VInt(kMostFields + 1).bytes();
  ExpectDamage(5, "fields are too many", [&] { ReadFieldInfos(SourceOf(too_many, uint64_t{1} << 40)); });
  const std::string most = ByteWriter().VInt(-2).VInt(kMostFields).bytes();
  ExpectDamage(10, "field 1 bears the name", [&] { ReadFieldInfos(SourceOf(most, uint64_t{1} << 40)); });
  const std::string older = ByteWriter().VInt(kMostFields).bytes();
  ExpectDamage(5, "field 1 bears the name", [&] { ReadFieldInfos(SourceOf(older, uint64_t{1} << 40)); });
  const std::string long_name = ByteWriter().VInt(-2).VInt(1).VInt(-1).bytes();
  ExpectDamage(6, "string of 4294967295 bytes",
               [&] { ReadFieldInfos(SourceOf(long_name, uint64_t{1} << 40)); });
}

TEST(FieldInfosTest, RefusesANameThatIsTooLong) {
  const auto one = [](size_t length) {
    return ByteWriter().VInt(-2).VInt(1).String(std::string(length, 'a')).Byte(0);
  };
  EXPECT_EQ(Read(one(kLongestName)).size(), 1U);
  ExpectDamage(6, "name of 4097 bytes is too long", [&] { Read(one(kLongestName + 1)); });
}

TEST(FieldInfosTest, RefusesNamesThatTakeTooMuchTogether) {
  // 512 names that take all there is, but for a byte, and one more.
  const auto fields = [](size_t last) {
    ByteWriter bytes;
    bytes.VInt(-2).VInt(513);
    for (int number = 0; number < 512; ++number) {
      const std::string start = std::to_string(1000 + number);
      bytes.String(start + std::string(kLongestName - start.size() - (number == 0 ? 1 : 0), 'a')).Byte(0);
    }
    return bytes.String(std::string(last, 'b')).Byte(0);
  };
  static_assert(kMostNameBytes == 512 * kLongestName);
  EXPECT_EQ(Read(fields(1)).size(), 513U);
  ExpectDamage(fields(2).size() - 4, "names up to this one take more than 2097152 bytes",
               [&] { Read(fields(2)); });
}

TEST(FieldInfosTest, RefusesNamesInCharactersThatTakeTooMuchTogether) {
  const auto fields = [](int count) {
    ByteWriter bytes;
    bytes.VInt(count);
    for (int number = 1; number <= count; ++number) {
      // Three bytes of UTF-8 each.
      const auto ending = static_cast<char16_t>(0x4e00 + number);
      bytes.UnitsString(std::u16string(1300, u'\u4e00') + ending).Byte(0);
    }
    return bytes;
  };
  EXPECT_EQ(Read(fields(500)).size(), 500U);
  EXPECT_THROW(Read(fields(600)), IndexDamagedError);
}

TEST(FieldInfosTest, PassesAMediumErrorOn) {
  EXPECT_THROW(ReadFieldInfos(SourceOf(ByteWriter().VInt(1).String("id").Byte(1).bytes(), 0, 0)),
               IndexIoError);
}

}  // namespace
}  // namespace vantrel::elastic::format
