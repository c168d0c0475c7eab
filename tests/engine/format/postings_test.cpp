#include "elastic/format/postings.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <limits>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
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

// Distances and frequencies of one to five bytes each, in any order.
TEST(PostingsTest, PassesABlockAsItPassesItsDocuments) {
  constexpr int32_t kDocuments = PostingsReader::kLongestBlock;
  std::mt19937 random(1);
  const auto below = [&random](uint64_t limit) { return static_cast<uint32_t>(random() % limit); };
  for (int round = 0; round < 500; ++round) {
    const bool omits_frequencies = round % 4 == 0;
    const uint32_t widest = 1 + below(24);  // bits
    ByteWriter bytes;
    for (int32_t i = 0; i < kDocuments; ++i) {
      const uint32_t distance = 1 + below(uint64_t{1} << below(widest));
      const uint32_t frequency = below(3) == 0 ? 2 + below(uint64_t{1} << below(31)) : 1;
      bytes.VInt(omits_frequencies ? distance : distance << 1 | (frequency == 1 ? 1 : 0));
      if (!omits_frequencies && frequency != 1) bytes.VInt(frequency);
    }
    const uint64_t end = bytes.size();
    bytes.Raw(std::string(2000, 'x'));
    const auto source = SourceOf(bytes.bytes());
    PostingsReader one_by_one(source, std::numeric_limits<int32_t>::max());
    one_by_one.Seek(Term(kDocuments, 0), omits_frequencies);
    std::vector<uint32_t> frequencies;
    uint64_t occurrences = 0;
    while (one_by_one.Next()) {
      frequencies.push_back(one_by_one.frequency());
      occurrences += one_by_one.frequency();
    }
    PostingsReader at_once(source, std::numeric_limits<int32_t>::max());
    at_once.Seek(Term(kDocuments, 0), omits_frequencies);
    at_once.PassBlock(kDocuments);
    ASSERT_EQ(at_once.offset(), end);
    ASSERT_EQ(at_once.document(), one_by_one.document());
    ASSERT_THAT(at_once.block_frequencies(), ElementsAreArray(frequencies));
    ASSERT_EQ(at_once.block_occurrences(), occurrences);
    ASSERT_GE(at_once.block_bound(), *std::max_element(frequencies.begin(), frequencies.end()));
    ASSERT_FALSE(at_once.Next());
  }
}

}  // namespace
}  // namespace vantrel::elastic::format
