#include "elastic/format/postings.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <utility>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;
using ::testing::ElementsAre;
using ::testing::Pair;

TermInfo Term(int32_t document_frequency, uint64_t pointer) {
  return {.document_frequency = document_frequency, .postings_pointer = pointer};
}

std::vector<std::pair<int32_t, uint32_t>> Walk(PostingsReader& reader) {
  std::vector<std::pair<int32_t, uint32_t>> all;
  while (reader.Next()) all.emplace_back(reader.document(), reader.frequency());
  return all;
}

TEST(PostingsTest, YieldsDocumentsAndFrequencies) {
  PostingsReader reader(SourceOf(ByteWriter()
                                     .Raw("skip")
                                     .VInt(0 << 1 | 1)
                                     .VInt(3 << 1)
                                     .VInt(200)
                                     .VInt(96 << 1 | 1)
                                     .Raw("rest")
                                     .bytes()),
                        100);
  reader.Seek(Term(3, 4), false);
  EXPECT_THAT(Walk(reader), ElementsAre(Pair(0, 1U), Pair(3, 200U), Pair(99, 1U)));
  EXPECT_FALSE(reader.Next());
}

TEST(PostingsTest, YieldsDocumentsAloneWhereFrequenciesAreOmitted) {
  PostingsReader reader(SourceOf(ByteWriter().VInt(0).VInt(1).VInt(98).bytes()), 100);
  reader.Seek(Term(3, 0), true);
  EXPECT_THAT(Walk(reader), ElementsAre(Pair(0, 1U), Pair(1, 1U), Pair(99, 1U)));
}

TEST(PostingsTest, MayBeSoughtAgainInAnyOrder) {
  PostingsReader reader(SourceOf(ByteWriter().VInt(11).VInt(21).bytes()), 100);
  reader.Seek(Term(1, 1), false);
  EXPECT_THAT(Walk(reader), ElementsAre(Pair(10, 1U)));
  reader.Seek(Term(2, 0), false);
  EXPECT_THAT(Walk(reader), ElementsAre(Pair(5, 1U), Pair(15, 1U)));
}

TEST(PostingsTest, RefusesDocumentsThatDoNotAscendOrLieOutside) {
  const auto walk = [](const ByteWriter& bytes, bool omits_frequencies) {
    PostingsReader reader(SourceOf(bytes.bytes()), 100);
    reader.Seek(Term(2, 0), omits_frequencies);
    Walk(reader);
  };
  ExpectDamage(1, "posting lies 0 after document 5 of 100",
               [&] { walk(ByteWriter().VInt(11).VInt(1), false); });
  ExpectDamage(1, "posting lies 0 after document 5 of 100",
               [&] { walk(ByteWriter().VInt(5).VInt(0), true); });
  ExpectDamage(0, "posting lies 100 after document 0 of 100", [&] { walk(ByteWriter().VInt(201), false); });
  ExpectDamage(1, "posting lies 1 after document 99", [&] { walk(ByteWriter().VInt(99).VInt(1), true); });
  ExpectDamage(1, "posting lies 4294967295 after document 99",
               [&] { walk(ByteWriter().VInt(99).VInt(-1), true); });
}

TEST(PostingsTest, RefusesFrequencyZeroAndAnEndInMidTerm) {
  const auto walk = [](const std::string& bytes, uint64_t pointer) {
    PostingsReader reader(SourceOf(bytes), 100);
    reader.Seek(Term(2, pointer), false);
    Walk(reader);
  };
  ExpectDamage(0, "posting has frequency 0", [&] { walk(ByteWriter().VInt(10).VInt(0).bytes(), 0); });
  ExpectDamage(1, "wanted 1 more bytes", [&] { walk(ByteWriter().VInt(11).bytes(), 0); });
  ExpectDamage(2, "past the end of the file at 1", [&] { walk(ByteWriter().VInt(11).bytes(), 2); });
  ExpectDamage(uint64_t{1} << 62, "past the end", [&] { walk("", uint64_t{1} << 62); });
}

TEST(PostingsTest, NoDocumentLiesInASegmentWithoutDocuments) {
  PostingsReader reader(SourceOf(ByteWriter().VInt(1).bytes()), 0);
  reader.Seek(Term(1, 0), false);
  ExpectDamage(0, "posting lies 0 after document 0 of 0", [&] { reader.Next(); });
}

TEST(PostingsTest, GoesOnBehindSomeOfTheDocuments) {
  PostingsReader reader(SourceOf(ByteWriter().VInt(11).VInt(21).VInt(7).bytes()), 100);
  reader.Resume(1, 40, 2, false);
  EXPECT_THAT(Walk(reader), ElementsAre(Pair(50, 1U), Pair(53, 1U)));
  reader.Resume(2, 97, 1, false);
  ExpectDamage(2, "posting lies 3 after document 97 of 100", [&] { reader.Next(); });
  ExpectDamage(9, "past the end", [&] { reader.Resume(9, 0, 1, false); });
}

}  // namespace
}  // namespace vantrel::elastic::format
