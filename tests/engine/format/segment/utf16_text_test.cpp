#include "elastic/format/segment/utf16_text.h"

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

std::u16string UnitsOf(const std::string& bytes, uint32_t count) {
  ByteReader reader(SourceOf(bytes));
  std::u16string units;
  ReadUtf16Units(reader, count, units);
  return units;
}

TEST(Utf16TextTest, ReadsUnitsOfOneToThreeBytes) {
  const std::u16string units = {u'a', 0, 0x7f, 0x80, 0x7ff, 0x800, 0xd83d, 0xde00, 0xffff};
  EXPECT_EQ(UnitsOf(ByteWriter().Units(units).bytes(), static_cast<uint32_t>(units.size())), units);
}

TEST(Utf16TextTest, RefusesABrokenUnitWhereItBegins) {
  ExpectDamage(1, "not encoded as its first byte announces", [] { UnitsOf("a\xc3z", 2); });
  ExpectDamage(1, "not encoded as its first byte announces", [] { UnitsOf("a\xe3\x80z", 2); });
  ExpectDamage(3, "wanted 1 more bytes", [] { UnitsOf("a\xe3\x80", 2); });
  ExpectDamage(0, "text of 4294967295 characters", [] { UnitsOf("abc", 0xffffffff); });
  ExpectDamage(0, "text of 4 characters", [] { UnitsOf("abc", 4); });
}

}  // namespace
}  // namespace vantrel::elastic::format
