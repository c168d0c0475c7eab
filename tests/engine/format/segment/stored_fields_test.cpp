#include "elastic/format/segment/stored_fields.h"

#include <gtest/gtest.h>
#include <zlib.h>

#include <string>
#include <vector>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

std::string Compressed(const std::string& text) {
  std::vector<Bytef> out(compressBound(text.size()));
  uLongf length = out.size();
  compress(out.data(), &length, reinterpret_cast<const Bytef*>(text.data()), text.size());
  return {reinterpret_cast<const char*>(out.data()), length};
}

// Reads a store of one document; how many fields it has.
int ReadOne(int format, const ByteWriter& record) {
  ByteWriter index;
  ByteWriter records;
  if (format > 0) index.Int(format);
  if (format > 0) records.Int(format);
  index.Long(static_cast<int64_t>(records.size()));
  StoredFieldsReader reader(SourceOf(index.bytes()), SourceOf(records.Raw(record.bytes()).bytes()));
  EXPECT_EQ(reader.documents(), 1U);
  reader.Seek(0);
  int fields = 0;
  for (; reader.Next(); ++fields) reader.PassValue();
  EXPECT_EQ(reader.records().offset(), reader.end());
  return fields;
}

TEST(StoredFieldsTest, ReadsTextsAndBytes) {
  EXPECT_EQ(ReadOne(2, ByteWriter().VInt(0)), 0);
  EXPECT_EQ(ReadOne(2, ByteWriter()
                           .VInt(3)
                           .VInt(0)
                           .Byte(1)
                           .String("gr\xc3\xb6\xc3\x9f"
                                   "e")
                           .VInt(7)
                           .Byte(2)
                           .String("\xff\xfe")
                           .VInt(1)
                           .Byte(0)
                           .String("")),
            3);
}

TEST(StoredFieldsTest, ReadsOlderLayouts) {
  EXPECT_EQ(ReadOne(0, ByteWriter().VInt(1).VInt(0).Byte(1).UnitsString(u"k\u00f6rper\u4e2d")), 1);
  const std::string text = Compressed(std::string(100000, 'x') + "\xc3\xa4");
  EXPECT_EQ(ReadOne(1, ByteWriter().VInt(1).VInt(0).Byte(5).String(text)), 1);
  EXPECT_EQ(ReadOne(1, ByteWriter().VInt(1).VInt(0).Byte(6).String(Compressed("\xff\xff"))), 1);
}

TEST(StoredFieldsTest, RefusesValuesThatAreNotWhatTheyShouldBe) {
  const auto text = [](const std::string& bytes) {
    ReadOne(2, ByteWriter().VInt(1).VInt(0).Byte(0).String(bytes));
  };
  ExpectDamage(7, "not valid UTF-8", [&] { text("a\xff"); });
  ExpectDamage(7, "not valid UTF-8", [&] { text("cut \xc3"); });
  ExpectDamage(7, "value of 90 reaches past its record's end at 9",
               [] { ReadOne(2, ByteWriter().VInt(1).VInt(0).Byte(0).VInt(90).Raw("a")); });
  ExpectDamage(7, "value of 4294967295 reaches",
               [] { ReadOne(2, ByteWriter().VInt(1).VInt(0).Byte(0).VInt(-1)); });
  ExpectDamage(9, "2 more fields are announced",
               [] { ReadOne(2, ByteWriter().VInt(3).VInt(0).Byte(0).String("a")); });
  const std::string good = Compressed("text");
  const auto compressed = [](int flags, const std::string& bytes) {
    ReadOne(1, ByteWriter().VInt(1).VInt(0).Byte(flags).String(bytes));
  };
  ExpectDamage(7, "cannot be inflated", [&] { compressed(4, "no stream"); });
  ExpectDamage(7, "cannot be inflated", [&] { compressed(4, good + "more"); });
  ExpectDamage(7, "cut off", [&] { compressed(4, good.substr(0, good.size() - 1)); });
  ExpectDamage(7, "cannot be inflated", [&] { compressed(4, Compressed("\xff and more")); });
}

TEST(StoredFieldsTest, RefusesACompressedValueThatBecomesTooLong) {
  // Words that compress to a tenth, so that the length alone is judged.
  const auto text = [](size_t length) {
    std::string words;
    for (uint32_t number = 1; words.size() < length; ++number)
      words += std::to_string(number * 2654435761U) + " and more of it ";
    words.resize(length);
    return words;
  };
  const auto read = [](const std::string& value) {
    return ReadOne(1, ByteWriter().VInt(1).VInt(0).Byte(4).String(Compressed(value)));
  };
  EXPECT_EQ(read(text(StoredFieldsReader::kLongestInflated)), 1);
  ExpectDamage(7, "compressed value inflates to more than 16777216 bytes",
               [&] { read(text(StoredFieldsReader::kLongestInflated + 1)); });
}

TEST(StoredFieldsTest, RefusesCompressedValuesThatBecomeTooManyBytesTogether) {
  const auto read = [](size_t length, int values) {
    const std::string value = Compressed(std::string(length, 'x'));
    ByteWriter record;
    record.VInt(values);
    for (int left = values; left > 0; --left) record.VInt(0).Byte(4).String(value);
    return ReadOne(1, record);
  };
  // A small store may hold what compresses to nearly nothing.
  EXPECT_EQ(read(size_t{1} << 18, 4), 4);
  EXPECT_THROW(read(size_t{1} << 18, 5), IndexDamagedError);
  // 8 MiB that would become 8 GiB.
  ExpectDamage(8, "compressed values up to this one inflate to more than 32 times their size",
               [&] { read(StoredFieldsReader::kLongestInflated, 512); });
  // Short values do not compress well: however many there are, all are read.
  EXPECT_EQ(read(100, 100'000), 100'000);
}

TEST(StoredFieldsTest, RefusesTextThatIsCutByAPieceOnlyWhereItIsBroken) {
  // Longer than any buffer, so that characters of three bytes lie across its ends.
  std::string text;
  while (text.size() < 600000) text += "\xe4\xb8\xad";
  EXPECT_EQ(ReadOne(2, ByteWriter().VInt(1).VInt(0).Byte(0).String(text)), 1);
  text[300000] = 'x';
  ExpectDamage(7, "not valid UTF-8", [&] { ReadOne(2, ByteWriter().VInt(1).VInt(0).Byte(0).String(text)); });
}

TEST(StoredFieldsTest, RefusesPointersThatDoNotAscendOrLieOutside) {
  const auto seek = [](int64_t first, int64_t second) {
    StoredFieldsReader reader(SourceOf(ByteWriter().Int(2).Long(first).Long(second).bytes()),
                              SourceOf(ByteWriter().Int(2).VInt(0).VInt(0).bytes()));
    reader.Seek(0);
    reader.Seek(1);
  };
  seek(4, 5);
  ExpectDamage(4, "pointer is 3", [&] { seek(3, 5); });
  ExpectDamage(12, "pointer is 4, but the one before is 4", [&] { seek(4, 4); });
  ExpectDamage(12, "pointer is 6", [&] { seek(4, 6); });
  ExpectDamage(4, "pointer is -1", [&] { seek(-1, 5); });
}

TEST(StoredFieldsTest, RefusesHeadersThatDoNotAgree) {
  const auto open = [](const ByteWriter& index, const ByteWriter& records) {
    StoredFieldsReader(SourceOf(index.bytes()), SourceOf(records.bytes()));
  };
  open(ByteWriter(), ByteWriter());
  ExpectDamage(0, "format is 3", [&] { open(ByteWriter().Int(3), ByteWriter().Int(3)); });
  ExpectDamage(0, "the index has format 2", [&] { open(ByteWriter().Int(2), ByteWriter().Int(1)); });
  ExpectDamage(7, "within a pointer", [&] { open(ByteWriter().Int(2).Raw("abc"), ByteWriter().Int(2)); });
}

}  // namespace
}  // namespace vantrel::elastic::format
