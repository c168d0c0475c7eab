#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>

#include "engine/terms/expect_same_terms.h"
#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/files.h"
#include "support/open_files.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::ExpectSameTerms;
using ::quorelastic::testing::FewOpenFiles;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;

void WriteCommit(const TemporaryFolder& folder, int64_t generation,
                 const std::vector<std::string>& segments) {
  ByteWriter out = ByteWriter().Int(-2).Long(1).Int(1).Int(static_cast<int64_t>(segments.size()));
  for (const std::string& name : segments) out.String(name).Int(100).Long(-1).Int(-1).Byte(0xff);
  WriteFile(folder / ("segments_" + std::to_string(generation)), out.bytes());
}

ByteWriter TermsHeader(int64_t count) { return ByteWriter().Int(-4).Long(count).Int(128).Int(16).Int(10); }

// A plain segment of 100 documents with the given dictionary; its index announces `index_terms` and has room for
// them in a hole of the file.
void WriteSegment(const TemporaryFolder& folder, const std::string& name, const std::string& terms,
                  int64_t index_terms = 0, uint64_t index_size = 24) {
  WriteFile(folder / (name + ".fnm"),
            ByteWriter().VInt(-2).VInt(2).String("").Byte(1).String("f").Byte(1).bytes());
  WriteFile(folder / (name + ".tis"), terms);
  WriteFile(folder / (name + ".tii"), TermsHeader(index_terms).bytes());
  std::filesystem::resize_file(folder / (name + ".tii"), index_size);
}

TEST(HandMadeIndexTest, AFieldsNameAndATermMayBeEmpty) {
  const TemporaryFolder folder;
  ByteWriter terms = TermsHeader(3);
  terms.VInt(0).String("").VInt(0).VInt(1).VLong(0).VLong(0);
  terms.VInt(0).String("x").VInt(0).VInt(1).VLong(1).VLong(1);
  terms.VInt(0).String("").VInt(1).VInt(1).VLong(1).VLong(1);
  WriteSegment(folder, "_0", terms.bytes());
  WriteCommit(folder, 1, {"_0"});
  ExpectSameTerms(folder.path(),
                  {{"_0", {{L"", L""}, {L"", L"x"}, {L"f", L""}}, {{L"", L""}, {L"", L"x"}, {L"f", L""}}}});
}

TEST(HandMadeIndexTest, EveryCodePointOfATermIsKept) {
  const TemporaryFolder folder;
  ByteWriter terms = TermsHeader(1);
  terms.VInt(0).String("\xf0\xa0\x80\x80\xef\xbf\xbe\xf4\x8f\xbf\xbf").VInt(1).VInt(1).VLong(0).VLong(0);
  WriteSegment(folder, "_0", terms.bytes());
  WriteCommit(folder, 1, {"_0"});
  const std::vector<quorelastic::testing::LibraryTerm> wanted = {{L"f", L"\U00020000\ufffe\U0010ffff"}};
  ExpectSameTerms(folder.path(), {{"_0", wanted, wanted}});
}

TEST(HandMadeIndexTest, ATermThatIsNotUtf8IsDamageWhereItIsAskedFor) {
  const TemporaryFolder folder;
  WriteSegment(folder, "_0",
               TermsHeader(1).VInt(0).String("a\xff").VInt(1).VInt(1).VLong(0).VLong(0).bytes());
  WriteCommit(folder, 1, {"_0"});
  const auto dictionary = newClassInit<IndexInfo>(folder.path())->GetTermDict(0, false);
  ASSERT_TRUE(dictionary->Next());
  ExpectDamage(24, "term is not valid UTF-8", [&] { dictionary->Term(); });
}

TEST(HandMadeIndexTest, MoreTermsThanCanBeCountedAreAnErrorThatNamesTheDictionary) {
  const TemporaryFolder folder;
  WriteSegment(folder, "_0", TermsHeader(int64_t{1} << 31).bytes());
  std::filesystem::resize_file(folder / "_0.tis", uint64_t{1} << 34);
  WriteCommit(folder, 1, {"_0"});
  const auto dictionary = newClassInit<IndexInfo>(folder.path())->GetTermDict(0, false);
  ExpectIndexError(folder / "_0.tis: dictionary has more terms", [&] { dictionary->GetTermsCount(); });
}

// What the loaded index terms are reckoned to take: 256 bytes a term, and 4 for each byte of their text.
uint64_t LoadedBytes(uint64_t terms, uint64_t size, uint64_t divisor) {
  return (terms + divisor - 1) / divisor * 256 + size / divisor * 4;
}

TEST(SuggestDivisorTest, IsTheSmallestPowerOfTwoThatKeepsTheIndexTermsUnder64MiB) {
  constexpr uint64_t kBudget = uint64_t{64} << 20;
  for (const uint64_t terms :
       {uint64_t{0}, uint64_t{1}, uint64_t{100'000}, uint64_t{200'000}, uint64_t{250'000}, uint64_t{500'000},
        uint64_t{3'000'000}, uint64_t{1'000'000'000}}) {
    for (const uint64_t bytes_per_term : {7U, 20U, 200U}) {
      const TemporaryFolder folder;
      const uint64_t size = 24 + terms * bytes_per_term;
      WriteSegment(folder, "_0", TermsHeader(0).bytes(), static_cast<int64_t>(terms), size);
      WriteSegment(folder, "_1", TermsHeader(0).bytes(), 1000, 24 + 7000);
      WriteCommit(folder, 1, {"_0", "_1"});
      const auto divisor = static_cast<uint64_t>(newClassInit<IndexInfo>(folder.path())->GetSuggestDivisor());
      const auto loaded = [&](uint64_t by) {
        return LoadedBytes(terms, size, by) + LoadedBytes(1000, 7024, by);
      };
      EXPECT_EQ(divisor & (divisor - 1), 0U);
      EXPECT_LT(loaded(divisor), kBudget) << terms << " terms of " << bytes_per_term;
      if (divisor > 1) {
        EXPECT_GE(loaded(divisor / 2), kBudget) << terms << " terms of " << bytes_per_term;
      }
    }
  }
}

TEST(SuggestDivisorTest, ADamagedTermIndexIsAnError) {
  const TemporaryFolder folder;
  WriteSegment(folder, "_0", TermsHeader(0).bytes(), 5);
  WriteCommit(folder, 1, {"_0"});
  const auto info = newClassInit<IndexInfo>(folder.path());
  ExpectDamage(4, "term count 5 does not fit", [&] { info->GetSuggestDivisor(); });
}

TEST(HandMadeIndexTest, ACommitOfTooManySegmentsIsAnErrorThatSaysSoLeavesNothingOpenAndTakesNoOlderCommit) {
  const TemporaryFolder folder;
  std::vector<std::string> segments;
  for (int number = 0; number < 64; ++number) {
    segments.push_back("_" + std::to_string(number));
    WriteSegment(folder, segments.back(), TermsHeader(0).bytes());
  }
  WriteCommit(folder, 2, segments);
  WriteCommit(folder, 1, {"_0"});
  const FewOpenFiles limit(64);
  for (int run = 0; run < 2; ++run) {
    ExpectIndexError("cannot open file: Too many open files",
                     [&] { newClassInit<IndexInfo>(folder.path()); });
  }
  std::filesystem::remove(folder / "segments_2");
  EXPECT_EQ(newClassInit<IndexInfo>(folder.path())->GetSegmentNum(), 1);
}

}  // namespace
}  // namespace vantrel::elastic
