#include "elastic/format/segment/term_vectors.h"

#include <gtest/gtest.h>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

constexpr uint32_t kVectorFields = 9;

// A store of one document, whose lists and terms begin at 4.
struct Store {
  int format = 4;
  ByteWriter list = ByteWriter().VInt(1).VInt(3);
  ByteWriter terms = ByteWriter().VInt(1).Byte(0).VInt(0).VInt(1).Raw("a").VInt(1);
  int64_t terms_start = 4;

  TermVectorsReader Open() const {
    ByteWriter index = ByteWriter().Int(format).Long(4);
    if (format >= 3) index.Long(terms_start);
    return {SourceOf(index.bytes()), SourceOf(ByteWriter().Int(format).Raw(list.bytes()).bytes()),
            SourceOf(ByteWriter().Int(format).Raw(terms.bytes()).bytes()), kVectorFields};
  }

  void PassAll() const {
    TermVectorsReader reader = Open();
    reader.Seek(0);
    EXPECT_EQ(reader.list_end(), reader.document_list().size());
    for (size_t field = 0; field < reader.fields().size(); ++field) {
      reader.SeekTerms(field);
      reader.PassTerms();
    }
    EXPECT_EQ(reader.terms_end(), reader.terms().size());
  }
};

TEST(TermVectorsTest, ReadsFieldsAndTerms) {
  Store store;
  store.PassAll();
  EXPECT_EQ(store.Open().documents(), 1U);
  store.list = ByteWriter().VInt(0);
  store.terms = {};
  store.PassAll();
  // Two fields: one with positions, one with offsets, of which one goes back.
  store.list = ByteWriter().VInt(2).VInt(8).VInt(0).VLong(14);
  store.terms = ByteWriter()
                    .VInt(2)
                    .Byte(1)
                    .VInt(0)
                    .VInt(1)
                    .Raw("a")
                    .VInt(2)
                    .VInt(0)
                    .VInt(4)
                    .VInt(1)
                    .VInt(2)
                    .Raw("\xc3\xa4")
                    .VInt(1)
                    .VInt(1)
                    .VInt(1)
                    .Byte(2)
                    .VInt(0)
                    .VInt(1)
                    .Raw("z")
                    .VInt(1)
                    .VInt(-7)
                    .VInt(3);
  TermVectorsReader reader = store.Open();
  reader.Seek(0);
  ASSERT_EQ(reader.fields().size(), 2U);
  EXPECT_EQ(reader.fields()[0].number, 8U);
  EXPECT_EQ(reader.TermsStart(1), 18U);
  store.PassAll();
}

TEST(TermVectorsTest, ReadsOlderLayouts) {
  const ByteWriter units =
      ByteWriter().VInt(0).VInt(2).Units(u"k\u00f6").VInt(1).VInt(1).VInt(1).Units(u"\u4e2d").VInt(9);
  Store{.format = 3, .terms = ByteWriter().VInt(2).Byte(0).Raw(units.bytes())}.PassAll();
  Store{.format = 2,
        .list = ByteWriter().VInt(1).VInt(3).VLong(4),
        .terms = ByteWriter().VInt(2).Byte(0).Raw(units.bytes())}
      .PassAll();
  // Field numbers from the one before, and a number of no meaning for the flags.
  const Store oldest{
      .format = 1,
      .list = ByteWriter().VInt(2).VInt(3).VInt(4).VLong(4).VLong(12),
      .terms = ByteWriter().VInt(2).VInt(300).Raw(units.bytes()).VInt(2).VInt(5).Raw(units.bytes())};
  TermVectorsReader reader = oldest.Open();
  reader.Seek(0);
  EXPECT_EQ(reader.fields()[1].number, 7U);
}

TEST(TermVectorsTest, RefusesListsThatCannotBe) {
  ExpectDamage(4, "vectors of 10 fields of 9", [] { Store{.list = ByteWriter().VInt(10)}.PassAll(); });
  ExpectDamage(5, "field number 9 of 9", [] { Store{.list = ByteWriter().VInt(1).VInt(9)}.PassAll(); });
  ExpectDamage(6, "field number 3 of 9 is repeated",
               [] { Store{.list = ByteWriter().VInt(2).VInt(3).VInt(3).VLong(1)}.PassAll(); });
  ExpectDamage(6, "terms begin at -1", [] { Store{.terms_start = -1}.PassAll(); });
  ExpectDamage(7, "plus 90", [] { Store{.list = ByteWriter().VInt(2).VInt(3).VInt(4).VLong(90)}.PassAll(); });
}

TEST(TermVectorsTest, RefusesTermsThatCannotBe) {
  const auto pass = [](const ByteWriter& terms) { Store{.terms = terms}.PassAll(); };
  const ByteWriter two = ByteWriter().VInt(2).Byte(0).VInt(0).VInt(1).Raw("b").VInt(1);
  ExpectDamage(4, "vector of 0 terms", [&] { pass(ByteWriter().VInt(0)); });
  ExpectDamage(4, "vector of 4 terms", [&] { pass(ByteWriter().VInt(4).Raw("123456789")); });
  ExpectDamage(6, "shares 1 bytes with one of 0",
               [&] { pass(ByteWriter().VInt(1).Byte(0).VInt(1).VInt(1).Raw("ab")); });
  ExpectDamage(10, "does not come after", [&] { pass(ByteWriter(two).VInt(0).VInt(1).Raw("a").VInt(1)); });
  ExpectDamage(10, "does not come after", [&] { pass(ByteWriter(two).VInt(1).VInt(0).VInt(1)); });
  ExpectDamage(10, "not valid UTF-8", [&] { pass(ByteWriter(two).VInt(1).VInt(1).Raw("\xff").VInt(1)); });
  ExpectDamage(13, "frequency is 0", [&] { pass(ByteWriter(two).VInt(1).VInt(1).Raw("a").VInt(0)); });
  ExpectDamage(13, "frequency is -1", [&] { pass(ByteWriter(two).VInt(1).VInt(1).Raw("a").VInt(-1)); });
  ExpectDamage(11, "position 1 follows 2",
               [&] { pass(ByteWriter().VInt(1).Byte(1).VInt(0).VInt(1).Raw("a").VInt(2).VInt(2).VInt(-1)); });
  ExpectDamage(14, "wanted 1 more bytes",
               [&] { pass(ByteWriter().VInt(1).Byte(2).VInt(0).VInt(1).Raw("a").VInt(1 << 30)); });
}

TEST(TermVectorsTest, RefusesHeadersThatDoNotAgree) {
  ExpectDamage(0, "format is 5", [] { Store{.format = 5}.Open(); });
  ExpectDamage(0, "format is 0", [] { Store{.format = 0}.Open(); });
  const auto open = [](int index, int lists, int terms) {
    TermVectorsReader(SourceOf(ByteWriter().Int(index).bytes()), SourceOf(ByteWriter().Int(lists).bytes()),
                      SourceOf(ByteWriter().Int(terms).bytes()), kVectorFields);
  };
  open(4, 4, 4);
  ExpectDamage(0, "the index has format 4", [&] { open(4, 3, 4); });
  ExpectDamage(0, "the index has format 3", [&] { open(3, 3, 4); });
}

}  // namespace
}  // namespace vantrel::elastic::format
