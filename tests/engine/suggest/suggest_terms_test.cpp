#include "vantrel/elastic/suggest_terms.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <atomic>
#include <chrono>
#include <filesystem>
#include <limits>
#include <thread>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/files.h"
#include "support/library_index.h"
#include "support/numbered.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::Numbered;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::testing::IsEmpty;
using ::testing::SizeIs;

using Terms = std::vector<SuggestedTerm>;

class SuggestTermsTest : public ::testing::Test {
 protected:
  // A segment of documents with these texts in "body", and their number in "id".
  static void WriteSegment(LibraryIndex& index, const std::vector<std::string>& texts) {
    int number = 0;
    for (const std::string& text : texts) {
      index.Add({{.name = "id", .value = std::to_string(number++), .keyword = true},
                 {.name = "body", .value = text}});
    }
    index.Commit();
  }

  Terms Suggest(const std::string& prefix, uint64_t skip = 0, uint64_t limit = 10) const {
    return SuggestTerms({folder_.path()}, {.field = "body", .prefix = prefix, .skip = skip, .limit = limit});
  }

  TemporaryFolder folder_;
};

TEST_F(SuggestTermsTest, PutsTheMostFrequentFirstAndEqualOnesInTheOrderOfTheirBytes) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"tea team tease", "team Tea", "te\xc3\xa9 tez team", "coffee"});
  EXPECT_EQ(Suggest("te"), (Terms{{"team", 3}, {"tea", 1}, {"tease", 1}, {"tez", 1}, {"te\xc3\xa9", 1}}));
}

TEST_F(SuggestTermsTest, TakesTheCaseAsItIs) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"Tea tea"});
  EXPECT_EQ(Suggest("T"), (Terms{{"Tea", 1}}));
  EXPECT_EQ(Suggest("t"), (Terms{{"tea", 1}}));
}

TEST_F(SuggestTermsTest, TheTermItselfIsOneOfThoseThatBeginWithIt) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"tea team"});
  EXPECT_EQ(Suggest("team"), (Terms{{"team", 1}}));
  EXPECT_THAT(Suggest("teams"), IsEmpty());
}

TEST_F(SuggestTermsTest, AnEmptyPrefixBeginsEveryTermOfTheFieldAndOfNoOther) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"b a", "b"});
  EXPECT_EQ(Suggest(""), (Terms{{"b", 2}, {"a", 1}}));
}

TEST_F(SuggestTermsTest, AFieldThatIsNotThereHasNoTerms) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"b a"});
  for (const char* field : {"", "bod", "body2", "zzz", "\xff"}) {
    EXPECT_THAT(SuggestTerms({folder_.path()}, {.field = field, .prefix = ""}), IsEmpty()) << field;
  }
}

TEST_F(SuggestTermsTest, APrefixMayEndWithinACharacter) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"\xc3\xa4rger \xc3\xb6l \xce\xbb", "\xf0\x9f\x98\x80"});
  EXPECT_EQ(Suggest("\xc3"), (Terms{{"\xc3\xa4rger", 1}, {"\xc3\xb6l", 1}}));
  EXPECT_EQ(Suggest("\xf0\x9f\x98"), (Terms{{"\xf0\x9f\x98\x80", 1}}));
}

TEST_F(SuggestTermsTest, APrefixThatIsNotUtf8BeginsNothing) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"a \xc3\xa4 \xf0\x9f\x98\x80"});
  for (const char* prefix : {"\xff", "\xa4", "a\x80", "\xc3\xa4\xff", "\xed\xa0\x80"}) {
    EXPECT_THAT(Suggest(prefix), IsEmpty()) << prefix;
  }
}

TEST_F(SuggestTermsTest, SegmentsCountTogether) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"apple pear", "pear"});
  WriteSegment(index, {"apple apricot", "apple"});
  WriteSegment(index, {"pear"});
  EXPECT_EQ(Suggest("a"), (Terms{{"apple", 3}, {"apricot", 1}}));
  EXPECT_EQ(Suggest("p"), (Terms{{"pear", 3}}));
}

TEST_F(SuggestTermsTest, IndexesCountTogether) {
  LibraryIndex one(folder_ / "one");
  WriteSegment(one, {"apple apricot", "apricot"});
  LibraryIndex two(folder_ / "two");
  WriteSegment(two, {"apple", "apple avocado"});
  EXPECT_EQ(SuggestTerms({folder_ / "one", folder_ / "two"}, {.field = "body", .prefix = "a"}),
            (Terms{{"apple", 3}, {"apricot", 2}, {"avocado", 1}}));
  EXPECT_THAT(SuggestTerms({}, {.field = "body", .prefix = ""}), IsEmpty());
}

TEST_F(SuggestTermsTest, ATermThatOnlyDeletedDocumentsHoldIsLeftOut) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"gone going", "gone", "gold going", "gold"});
  index.Delete("body", "gone");
  index.Commit();
  EXPECT_EQ(Suggest("go"), (Terms{{"going", 2}, {"gold", 2}})) << "deleted documents still count";
}

TEST_F(SuggestTermsTest, ATermThatLivesInOneSegmentCountsAlsoWhereItIsDeleted) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"here", "here there", "there"});
  index.Delete("body", "here");
  index.Commit();
  WriteSegment(index, {"here"});
  EXPECT_EQ(Suggest(""), (Terms{{"here", 3}, {"there", 2}}));
}

TEST_F(SuggestTermsTest, ATermThatIsLeftOutTakesNobodysPlace) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"a1 a2", "a1 a3", "a1 a4"});
  WriteSegment(index, {"a5"});
  index.Delete("body", "a1");
  index.Commit();
  EXPECT_EQ(Suggest("a", 0, 1), (Terms{{"a5", 1}}));
}

TEST_F(SuggestTermsTest, SkipsAndLimitsInTheOrderOfAll) {
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"a b c d", "a b c", "a b", "a"});
  EXPECT_EQ(Suggest("", 1, 2), (Terms{{"b", 3}, {"c", 2}}));
  EXPECT_EQ(Suggest("", 3, 10), (Terms{{"d", 1}}));
  EXPECT_THAT(Suggest("", 4, 10), IsEmpty());
  EXPECT_THAT(Suggest("", 0, 0), IsEmpty());
  constexpr uint64_t kMost = std::numeric_limits<uint64_t>::max();
  EXPECT_THAT(Suggest("", 0, kMost), SizeIs(4));
  EXPECT_THAT(Suggest("", kMost, kMost), IsEmpty());
}

TEST_F(SuggestTermsTest, FindsEachTermWhereverItStandsInTheDictionarysIndex) {
  LibraryIndex index(folder_.path(), {.compound = false, .term_index_interval = 3});
  std::string text;
  for (int i = 100; i < 200; ++i) text += Numbered("t", i) + " ";
  WriteSegment(index, {text});
  for (int i = 100; i < 200; ++i) {
    const std::string term = Numbered("t", i);
    EXPECT_EQ(Suggest(term), (Terms{{term, 1}}));
    EXPECT_THAT(Suggest(term + "x"), IsEmpty());
  }
  EXPECT_THAT(Suggest("t15", 0, 100), SizeIs(10));
  EXPECT_THAT(Suggest("s"), IsEmpty());
  EXPECT_THAT(Suggest("u"), IsEmpty());
}

TEST_F(SuggestTermsTest, ReadsTheDictionaryOnlyWhereTheTermsAre) {
  {
    LibraryIndex index(folder_.path(), {.compound = false, .term_index_interval = 16});
    std::string text;
    for (int i = 10000; i < 20000; ++i) text += Numbered("t", i) + " ";
    WriteSegment(index, {text});
  }
  const std::string file = folder_ / "_0.tis";
  std::string bytes = ReadFile(file);
  const size_t size = bytes.size();
  const Terms wanted = {{"t15000", 1}, {"t15001", 1}};
  ASSERT_EQ(Suggest("t1500", 0, 2), wanted);
  // The first blocks are read to see where the terms' first letters come from.
  std::fill(bytes.begin() + 1000, bytes.begin() + static_cast<ptrdiff_t>(size * 2 / 5), '\xff');
  std::fill(bytes.begin() + static_cast<ptrdiff_t>(size * 3 / 5), bytes.end(), '\xff');
  WriteFile(file, bytes);
  EXPECT_EQ(Suggest("t1500", 0, 2), wanted);
  ExpectIndexError(file, [&] { Suggest("t1"); });
}

TEST_F(SuggestTermsTest, LooksAtPostingsOnlyWhereDeletionsLeaveADoubt) {
  {
    LibraryIndex index(folder_.path(), {.compound = false});
    WriteSegment(index, {"often seldom", "often rare", "often"});
    index.Delete("body", "rare");
  }
  const std::string file = folder_ / "_0.frq";
  WriteFile(file, std::string(ReadFile(file).size(), '\xff'));
  EXPECT_EQ(Suggest("often"), (Terms{{"often", 3}})) << "one deleted document cannot be all of its three";
  EXPECT_EQ(Suggest("", 0, 1), (Terms{{"often", 3}})) << "the others are not among the best";
  ExpectIndexError(file, [&] { Suggest("seldom"); });
}

TEST_F(SuggestTermsTest, AnEmptyIndexSuggestsNothing) {
  { const LibraryIndex index(folder_.path()); }
  EXPECT_THAT(Suggest(""), IsEmpty());
}

TEST_F(SuggestTermsTest, AFolderThatHoldsNoIndexIsAnErrorThatNamesIt) {
  ExpectIndexError(folder_.path() + ": no index in this folder", [&] { Suggest("a"); });
  ExpectIndexError(folder_ / "missing: cannot open index folder: No such file or directory",
                   [&] { SuggestTerms({folder_ / "missing"}, {.field = "", .prefix = "", .limit = 0}); });
  EXPECT_THAT(ListFolder(folder_.path()), IsEmpty());
}

TEST_F(SuggestTermsTest, AMissingFileIsAnErrorThatNamesIt) {
  {
    LibraryIndex index(folder_.path(), {.compound = false});
    WriteSegment(index, {"a", "b"});
    index.Delete("body", "b");
  }
  for (const char* name : {"_0.fnm", "_0.tis", "_0.tii", "_0.frq", "_0_1.del"}) {
    const std::string file = folder_ / name;
    const std::string bytes = ReadFile(file);
    std::filesystem::remove(file);
    ExpectIndexError(file + ": cannot open file", [&] { Suggest("a"); });
    WriteFile(file, bytes);
  }
  EXPECT_EQ(Suggest("a"), (Terms{{"a", 1}}));
}

TEST_F(SuggestTermsTest, GivesUpAfterItsTimeLimit) {
  LibraryIndex index(folder_.path());
  std::string text;
  for (int i = 0; i < 200'000; ++i) text += Numbered("t", i) + " ";
  WriteSegment(index, {text});
  const SuggestRequest hasty = {.field = "body", .prefix = "t", .time_limit = std::chrono::milliseconds(1)};
  EXPECT_THROW(SuggestTerms({folder_.path()}, hasty), SearchTimeoutError);
  SuggestRequest patient = hasty;
  for (const auto limit : {std::chrono::milliseconds(3'600'000), std::chrono::milliseconds::max()}) {
    patient.time_limit = limit;
    EXPECT_THAT(SuggestTerms({folder_.path()}, patient), SizeIs(10));
  }
}

// One term in so many documents, all of them deleted.
void WriteDeletedTerm(const TemporaryFolder& folder, int32_t documents) {
  ByteWriter terms = ByteWriter().Int(-4).Long(1).Int(128).Int(0x7fffffff).Int(10);
  WriteFile(folder / "_0.tis", terms.VInt(0).String("t").VInt(0).VInt(documents).VLong(0).VLong(0).bytes());
  ByteWriter index = ByteWriter().Int(-4).Long(1).Int(128).Int(0x7fffffff).Int(10);
  WriteFile(folder / "_0.tii", index.VInt(0).String("").VInt(-1).VInt(0).VLong(0).VLong(0).VLong(24).bytes());
  std::string postings(static_cast<size_t>(documents), '\x03');  // the next document, once
  postings.front() = '\x01';                                     // the first one
  WriteFile(folder / "_0.frq", postings);
  std::string deleted(static_cast<size_t>(documents / 8 + 1), '\xff');
  deleted.back() = 0;
  WriteFile(folder / "_0_1.del", ByteWriter().Int(documents).Int(documents).Raw(deleted).bytes());
  WriteFile(folder / "_0.fnm", ByteWriter().VInt(-2).VInt(1).String("body").Byte(1).bytes());
  WriteFile(folder / "segments_1", ByteWriter()
                                       .Int(-2)
                                       .Long(1)
                                       .Int(1)
                                       .Int(1)
                                       .String("_0")
                                       .Int(documents)
                                       .Long(1)
                                       .Int(-1)
                                       .Byte(0xff)
                                       .bytes());
}

TEST_F(SuggestTermsTest, GivesUpAlsoWhileItLooksForALiveDocument) {
  WriteDeletedTerm(folder_, 8'000'000);
  EXPECT_THAT(Suggest("t"), IsEmpty());
  // Nothing reads as many postings in that time.
  EXPECT_THROW(SuggestTerms({folder_.path()},
                            {.field = "body", .prefix = "t", .time_limit = std::chrono::milliseconds(1)}),
               SearchTimeoutError);
}

TEST_F(SuggestTermsTest, SeesAnIndexAsOfOneCommitBesideABusyWriter) {
  std::atomic<bool> stop = false;
  LibraryIndex index(folder_.path());
  WriteSegment(index, {"always"});
  std::thread writer([&] {
    for (int i = 0; !stop; ++i) {
      WriteSegment(index, {"always", Numbered("never", i)});
      index.Delete("id", "1");
      if (i % 5 == 0) index.Optimize();
    }
  });
  for (int round = 0; round < 300; ++round) {
    const Terms terms = Suggest("always");
    ASSERT_THAT(terms, SizeIs(1));
    ASSERT_GE(terms.front().document_frequency, 1U);
  }
  stop = true;
  writer.join();
}

}  // namespace
}  // namespace vantrel::elastic
