#include "elastic/format/segment/postings.h"

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

struct Posting {
  uint32_t distance;
  uint32_t frequency;
};

// Passes the documents in one block and one by one, and compares. What follows them is long enough for the block to be
// decoded at once, or nothing.
void ExpectSameInABlock(const std::vector<Posting>& postings, bool omits_frequencies, size_t behind) {
  const auto count = static_cast<int32_t>(postings.size());
  ByteWriter bytes;
  for (const auto& [distance, frequency] : postings) {
    bytes.VInt(omits_frequencies ? distance : distance << 1 | (frequency == 1 ? 1 : 0));
    if (!omits_frequencies && frequency != 1) bytes.VInt(frequency);
  }
  const auto source = SourceOf(bytes.bytes() + std::string(behind, 'x'));
  const int32_t documents = std::numeric_limits<int32_t>::max();
  PostingsReader one_by_one(source, documents);
  one_by_one.Seek(Term(count, 0), omits_frequencies);
  std::vector<uint32_t> frequencies;
  uint64_t occurrences = 0;
  uint32_t bits = 0;
  while (one_by_one.Next()) {
    frequencies.push_back(one_by_one.frequency());
    occurrences += one_by_one.frequency();
    bits |= one_by_one.frequency();
  }
  PostingsReader at_once(source, documents);
  at_once.Seek(Term(count, 0), omits_frequencies);
  at_once.PassBlock(count);
  EXPECT_EQ(at_once.offset(), bytes.size());
  EXPECT_EQ(at_once.document(), one_by_one.document());
  EXPECT_EQ(at_once.block_occurrences(), occurrences);
  EXPECT_EQ(at_once.block_bound() | bits, at_once.block_bound());
  EXPECT_LE(at_once.block_bound(), std::max(bits, 127U));
  EXPECT_THAT(at_once.BlockFrequencies(), ElementsAreArray(frequencies));
  EXPECT_EQ(at_once.offset(), bytes.size());
  EXPECT_EQ(at_once.document(), one_by_one.document());
  EXPECT_FALSE(at_once.Next());
}

class PostingsBlockTest : public ::testing::TestWithParam<size_t> {
 protected:
  // A number of that many bits at most.
  uint32_t Number(uint32_t bits) { return static_cast<uint32_t>(1 + random_() % (uint64_t{1} << bits)); }

  std::vector<Posting> Block(uint32_t distance_bits, uint32_t frequency_bits) {
    std::vector<Posting> postings(PostingsReader::kLongestBlock);
    for (Posting& posting : postings) {
      posting = {Number(distance_bits), random_() % 3 == 0 ? Number(frequency_bits) : 1};
    }
    return postings;
  }

 private:
  std::mt19937 random_{1};
};

INSTANTIATE_TEST_SUITE_P(, PostingsBlockTest, ::testing::Values(2000, 0),
                         [](const auto& test) { return test.param == 0 ? "AtTheEnd" : "BeforeOthers"; });

TEST_P(PostingsBlockTest, NumbersOfAnyLengthArePassedAsOneByOne) {
  for (uint32_t distance_bits = 1; distance_bits < 24; ++distance_bits) {
    for (uint32_t frequency_bits = 1; frequency_bits < 28; ++frequency_bits) {
      SCOPED_TRACE(std::to_string(distance_bits) + " and " + std::to_string(frequency_bits) + " bits");
      const std::vector<Posting> postings = Block(distance_bits, frequency_bits);
      ExpectSameInABlock(postings, false, GetParam());
      ExpectSameInABlock(postings, true, GetParam());
    }
  }
}

TEST_P(PostingsBlockTest, ANumberOfFiveBytesIsPassedWhereverItStands) {
  for (size_t place = 0; place < PostingsReader::kLongestBlock; ++place) {
    SCOPED_TRACE(place);
    std::vector<Posting> postings = Block(3, 3);
    postings[place].distance = 1U << 30;
    ExpectSameInABlock(postings, false, GetParam());
    ExpectSameInABlock(postings, true, GetParam());
    postings[place] = {1, 0xffffffff};
    ExpectSameInABlock(postings, false, GetParam());
  }
}

// What the error says of the documents, passed in one block or one by one.
std::string PostingsDamage(const std::string& bytes, int32_t count, bool in_a_block) {
  PostingsReader reader(SourceOf(bytes), 5000);
  reader.Seek(Term(count, 0), false);
  try {
    if (in_a_block) {
      reader.PassBlock(count);
    } else {
      while (reader.Next()) continue;
    }
  } catch (const IndexDamagedError& error) {
    return error.what();
  }
  return "";
}

TEST(PostingsTest, RefusesInABlockWhatItRefusesOneByOneAtTheSamePlace) {
  const ByteWriter damaged[] = {ByteWriter().VInt(1), ByteWriter().VInt(2).VInt(0), ByteWriter().VInt(10001),
                                ByteWriter().VInt(-1), ByteWriter().Byte(0x81).Byte(0)};
  for (const ByteWriter& posting : damaged) {
    for (size_t place = 1; place < 100; ++place) {
      for (const size_t behind : {size_t{0}, size_t{10}, size_t{2000}}) {
        const std::string bytes = std::string(place, '\3') + posting.bytes() + std::string(behind, '\3');
        const auto count = static_cast<int32_t>(place + 1 + std::min<size_t>(behind, 20));
        const std::string expected = PostingsDamage(bytes, count, false);
        EXPECT_NE(expected, "");
        EXPECT_EQ(PostingsDamage(bytes, count, true), expected);
      }
    }
  }
}

TEST(PostingsTest, RefusesInABlockADocumentBeyondTheSegmentAndAFrequencyOf0) {
  const std::string behind(2000, 'x');
  const auto pass = [&](const ByteWriter& bytes) {
    PostingsReader reader(SourceOf(bytes.bytes() + behind), 100);
    reader.Seek(Term(3, 0), false);
    reader.PassBlock(3);
  };
  ExpectDamage(2, "posting lies 60 after document 50",
               [&] { pass(ByteWriter().VInt(21).VInt(81).VInt(121)); });
  ExpectDamage(1, "posting has frequency 0", [&] { pass(ByteWriter().VInt(21).VInt(10).VInt(0).VInt(3)); });
  ExpectDamage(1, "posting lies 0 after document 10", [&] { pass(ByteWriter().VInt(21).VInt(1).VInt(3)); });
}

}  // namespace
}  // namespace vantrel::elastic::format
