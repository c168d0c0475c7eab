#include "elastic/format/commit/commit.h"

#include <gtest/gtest.h>

#include <initializer_list>
#include <string>
#include <vector>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::SourceOf;

// What a segment of any layout may say; a layout writes as much of it as it knows.
struct SegmentBytes {
  std::string name = "_0";
  int32_t documents = 7;
  int64_t deletions_generation = -1;
  bool shares_store = false;
  int norm_generations = -1;
  int compound = 1;
  int diagnostics = 2;
};

void AppendSegment(ByteWriter& out, int format, const SegmentBytes& segment) {
  out.String(segment.name).Int(segment.documents);
  if (format > -2) return;
  out.Long(segment.deletions_generation);
  if (format <= -4) {
    out.Int(segment.shares_store ? 100 : -1);
    if (segment.shares_store) out.String("_a").Byte(1);
  }
  if (format <= -3) out.Byte(1);
  out.Int(segment.norm_generations);
  for (int i = 0; i < segment.norm_generations; ++i) out.Long(i);
  out.Byte(segment.compound);
  if (format <= -6) out.Int(3);
  if (format <= -7) out.Byte(1);
  if (format > -9) return;
  out.Int(segment.diagnostics);
  for (int i = 0; i < segment.diagnostics; ++i) out.String("key").String("value");
}

// A commit of format -1 to -9; 0 stands for the oldest one, which has no format number.
std::string CommitBytes(int format, const std::vector<SegmentBytes>& segments) {
  ByteWriter out;
  if (format < 0) out.Int(format).Long(1234567890123);
  out.Int(42);
  out.Int(static_cast<int32_t>(segments.size()));
  for (const SegmentBytes& segment : segments) AppendSegment(out, format, segment);
  if (format == 0) out.Long(99);  // a version, which may be absent
  if (format == -8) out.Byte(1).String("user data");
  if (format <= -9) out.Int(1).String("user").String("data");
  if (format <= -5) out.Checksum();
  return out.bytes();
}

// The oldest layout stands in "segments" alone, the file of generation 0.
Commit Read(const std::string& bytes, int64_t generation) { return ReadCommit(SourceOf(bytes), generation); }
Commit Read(const std::string& bytes) { return Read(bytes, bytes[0] < 0 ? 5 : 0); }

class CommitOfAnyFormatTest : public ::testing::TestWithParam<int> {};

INSTANTIATE_TEST_SUITE_P(Formats, CommitOfAnyFormatTest, ::testing::Range(-9, 1),
                         [](const auto& test) { return "Minus" + std::to_string(-test.param); });

TEST_P(CommitOfAnyFormatTest, YieldsItsSegmentsInOrder) {
  const int format = GetParam();
  SegmentBytes plain{.name = "_z", .documents = 2147483640, .deletions_generation = 36, .compound = 0xff};
  SegmentBytes rich{
      .name = "_10", .documents = 0, .shares_store = true, .norm_generations = 3, .compound = 0};
  const Commit commit = Read(CommitBytes(format, {SegmentBytes{}, plain, rich}));
  EXPECT_EQ(commit.generation, format < 0 ? 5 : 0);
  EXPECT_EQ(commit.format, format);
  EXPECT_EQ(commit.counter, 42);
  EXPECT_EQ(commit.end, commit.size);
  ASSERT_EQ(commit.segments.size(), 3U);
  EXPECT_EQ(commit.segments[0].name, "_0");
  EXPECT_EQ(commit.segments[0].document_count, 7);
  EXPECT_EQ(commit.segments[1].name, "_z");
  EXPECT_EQ(commit.segments[1].document_count, 2147483640);
  EXPECT_EQ(commit.segments[2].name, "_10");
  EXPECT_EQ(commit.segments[2].document_count, 0);
  using Compound = SegmentInfo::Compound;
  if (format >= -1) {
    for (const SegmentInfo& segment : commit.segments) {
      EXPECT_EQ(segment.deletions_generation, SegmentInfo::kLookForDeletions);
      EXPECT_EQ(segment.compound, Compound::kLookForFile);
    }
    return;
  }
  EXPECT_EQ(commit.segments[0].deletions_generation, SegmentInfo::kNoDeletions);
  EXPECT_EQ(commit.segments[1].deletions_generation, 36);
  EXPECT_FALSE(commit.segments[0].norm_generations.has_value());
  EXPECT_EQ(commit.segments[2].norm_generations, (std::vector<int64_t>{0, 1, 2}));
  EXPECT_EQ(commit.segments[2].has_norms_file, format <= -3);
  EXPECT_EQ(commit.segments[2].store_offset, format <= -4 ? 100 : SegmentInfo::kOwnStore);
  EXPECT_EQ(commit.segments[2].store_segment, format <= -4 ? "_a" : "");
  EXPECT_EQ(commit.segments[2].deleted_count, format <= -6 ? 3 : SegmentInfo::kNotCounted);
  EXPECT_EQ(commit.segments[2].has_positions.has_value(), format <= -7);
  EXPECT_EQ(commit.segments[0].compound, Compound::kYes);
  EXPECT_EQ(commit.segments[1].compound, Compound::kNo);
  EXPECT_EQ(commit.segments[2].compound, Compound::kLookForFile);
}

TEST_P(CommitOfAnyFormatTest, MayHoldNoSegment) {
  EXPECT_TRUE(Read(CommitBytes(GetParam(), {})).segments.empty());
}

TEST_P(CommitOfAnyFormatTest, IsDamagedWhereverItIsCut) {
  const std::string bytes = CommitBytes(GetParam(), {SegmentBytes{}, SegmentBytes{.name = "_1"}});
  const size_t trailing = GetParam() == 0 ? 8 : 0;  // the version at the end is not asked for
  for (size_t length = 0; length < bytes.size() - trailing; ++length) {
    EXPECT_THROW(Read(bytes.substr(0, length)), IndexDamagedError) << "cut to " << length;
  }
}

// Without a checksum, what follows is all that shows that the bytes are of another layout.
TEST_P(CommitOfAnyFormatTest, IgnoresWhatFollowsAChecksumAndNothingElse) {
  const std::string bytes = CommitBytes(GetParam(), {SegmentBytes{}});
  if (GetParam() <= -5) {
    EXPECT_EQ(Read(bytes + "more").segments.size(), 1U);
  } else {
    ExpectDamage(bytes.size(), "4 bytes behind the end of the commit", [&] { Read(bytes + "more"); });
  }
}

TEST_P(CommitOfAnyFormatTest, ShowsAnyFlippedBitWhereItHasAChecksum) {
  if (GetParam() > -5) return;  // the layouts before have none
  const std::string bytes = CommitBytes(GetParam(), {SegmentBytes{}, SegmentBytes{.name = "_1"}});
  for (size_t bit = 0; bit < bytes.size() * 8; ++bit) {
    if (bit / 8 == 3) continue;  // the format number: another layout may be read
    std::string flipped = bytes;
    flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ 1 << bit % 8);
    EXPECT_THROW(Read(flipped), IndexDamagedError) << "bit " << bit;
  }
}

TEST(CommitTest, ABitOfTheFormatThatFlippedIsSeenInWhatIsWrittenToday) {
  for (const std::vector<SegmentBytes>& segments : {std::vector<SegmentBytes>{}, {SegmentBytes{}}}) {
    const std::string bytes = CommitBytes(-9, segments);
    for (size_t bit = 0; bit < 32; ++bit) {
      std::string flipped = bytes;
      flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ 1 << bit % 8);
      EXPECT_THROW(Read(flipped, 5), IndexDamagedError) << "bit " << bit;
    }
  }
}

TEST(CommitTest, TheOldestLayoutIsRefusedInAFileWithAGeneration) {
  const std::string bytes = CommitBytes(0, {SegmentBytes{}});
  EXPECT_EQ(Read(bytes, 0).segments.size(), 1U);
  ExpectDamage(0, "format is 42, but a file with a generation in its name has a negative one",
               [&] { Read(bytes, 1); });
}

TEST(CommitTest, AFileOfZerosIsAnEmptyIndexOnlyWhereTheOldestLayoutEndsThere) {
  EXPECT_TRUE(Read(std::string(8, '\0'), 0).segments.empty());
  for (const size_t size : std::initializer_list<size_t>{9, 15, 16, 17, 23, 24, 100, 4096}) {
    EXPECT_THROW(Read(std::string(size, '\0'), 0), IndexDamagedError) << size;
  }
  for (const size_t size : std::initializer_list<size_t>{8, 16, 4096}) {
    EXPECT_THROW(Read(std::string(size, '\0'), 1), IndexDamagedError) << size;
  }
}

TEST_P(CommitOfAnyFormatTest, RefusesASegmentThatIsThereTwice) {
  const std::string bytes =
      CommitBytes(GetParam(), {SegmentBytes{}, SegmentBytes{.name = "_1"}, SegmentBytes{}});
  ExpectIndexError("memory: offset 0: segment _0 is there twice", [&] { Read(bytes); });
}

TEST_P(CommitOfAnyFormatTest, RefusesMoreDocumentsThanAnIndexCanHave) {
  const std::string bytes = CommitBytes(
      GetParam(), {SegmentBytes{.documents = 2147483647}, SegmentBytes{.name = "_1", .documents = 1}});
  ExpectIndexError("memory: offset 0: 2147483648 documents are too many", [&] { Read(bytes); });
}

TEST(CommitTest, RefusesNumbersThatContradictThemselves) {
  const ByteWriter one = ByteWriter().Int(-4).Long(1).Int(1).Int(1).String("_0").Int(1).Long(-1);
  ExpectIndexError("memory: offset 0: segment _0 has its documents at -2 in the document store", [&] {
    Read(ByteWriter(one).Int(-2).String("_0").Byte(1).Byte(1).Int(-1).Byte(1).bytes());
  });
  ExpectIndexError("memory: offset 0: segment _0 has norms of generation -2",
                   [&] { Read(ByteWriter(one).Int(-1).Byte(1).Int(2).Long(3).Long(-2).Byte(1).bytes()); });
}

// A commit of segments of five documents each, which have them at these places in the store "_0".
std::string CommitOfSlices(const std::vector<int32_t>& offsets) {
  const auto count = static_cast<int32_t>(offsets.size());
  ByteWriter out = ByteWriter().Int(-4).Long(1).Int(count).Int(count);
  for (int32_t i = 0; i < count; ++i) {
    out.String("_" + std::to_string(i)).Int(5).Long(-1);
    out.Int(offsets[static_cast<size_t>(i)]).String("_0").Byte(0).Byte(1).Int(-1).Byte(1);
  }
  return out.bytes();
}

TEST(CommitTest, RefusesDocumentsOfASharedStoreThatTwoSegmentsHave) {
  EXPECT_EQ(Read(CommitOfSlices({10, 0, 5})).segments.size(), 3U);
  ExpectIndexError("memory: offset 0: two segments have document 10 of the document store _0", [&] {
    Read(CommitOfSlices({10, 0, 6}));
  });
  ExpectIndexError("two segments have document 0 of the document store _0", [&] {
    Read(CommitOfSlices({0, 20, 0}));
  });
}

TEST(CommitTest, RefusesMoreNormGenerationsThanThereIsRoomFor) {
  constexpr int32_t kEach = int32_t{1} << 16;
  constexpr int32_t kSegments = kMostNormGenerations / kEach;
  const auto commit_of = [&](int32_t segments) {
    ByteWriter out = ByteWriter().Int(-2).Long(1).Int(segments).Int(segments);
    for (int32_t i = 0; i < segments; ++i) {
      out.String("_" + std::to_string(i)).Int(0).Long(-1).Int(kEach);
      out.Raw(std::string(size_t{8} * kEach, '\0')).Byte(1);
    }
    return out.bytes();
  };
  EXPECT_EQ(Read(commit_of(kSegments)).segments.size(), static_cast<size_t>(kSegments));
  ExpectIndexError("the commit has more than 524288 norm generations",
                   [&] { Read(commit_of(kSegments + 1)); });
}

TEST(CommitTest, RefusesALayoutNewerThanKnown) {
  ExpectDamage(0, "format is -10, but -9 is the newest known", [] { Read(CommitBytes(-10, {})); });
}

TEST(CommitTest, SaysWhichChecksumItFoundAndExpected) {
  std::string bytes = CommitBytes(-9, {SegmentBytes{}});
  bytes.back() = static_cast<char>(bytes.back() ^ 1);
  ExpectDamage(bytes.size() - 8, "checksum is", [&] { Read(bytes); });
  bytes = CommitBytes(-9, {SegmentBytes{}});
  bytes[bytes.size() - 8] = 1;  // the upper half of the stored number must be 0
  ExpectDamage(bytes.size() - 8, "but the file says", [&] { Read(bytes); });
  EXPECT_EQ(ReadCommit(SourceOf(bytes), 1, CommitChecksum::kPassOver).end, bytes.size());
}

TEST(CommitTest, RefusesCountsThatCannotBe) {
  const ByteWriter head = ByteWriter().Int(-9).Long(1).Int(1);
  ExpectDamage(16, "segment count is -1", [&] { Read(ByteWriter(head).Int(-1).bytes()); });
  ExpectDamage(16, "segment count is 4097", [&] { Read(ByteWriter(head).Int(4097).bytes()); });
  ExpectDamage(20, "more bytes", [&] { Read(ByteWriter(head).Int(4096).bytes()); });
  const ByteWriter one = ByteWriter(head).Int(1).String("_0");
  ExpectDamage(23, "document count is -2", [&] { Read(ByteWriter(one).Int(-2).bytes()); });
  ExpectDamage(27, "generation of deletions is -2", [&] { Read(ByteWriter(one).Int(1).Long(-2).bytes()); });
  const ByteWriter norms = ByteWriter(one).Int(1).Long(-1).Int(-1).Byte(1);
  ExpectDamage(40, "count of norm generations is -2", [&] { Read(ByteWriter(norms).Int(-2).bytes()); });
  ExpectDamage(40, "count of norm generations is 2147483647",
               [&] { Read(ByteWriter(norms).Int(0x7fffffff).bytes()); });
  ExpectDamage(40, "count of norm generations is 2",
               [&] { Read(ByteWriter(norms).Int(2).Long(1).Raw("short").bytes()); });
  const ByteWriter strings = ByteWriter(norms).Int(-1).Byte(1).Int(0).Byte(1);
  ExpectDamage(54, "more bytes", [&] { Read(ByteWriter(strings).Int(0x7fffffff).bytes()); });
  const auto read_strings = [&](uint64_t count, const std::string& text) {
    ByteWriter commit = ByteWriter(strings);
    commit.Int(static_cast<int64_t>(count / 2));
    for (uint64_t left = count; left > 0; --left) commit.String(text);
    return Read(commit.Int(0).Checksum().bytes());
  };
  EXPECT_NO_THROW(read_strings(kMostCommitStrings, ""));
  ExpectIndexError("more than 131072 strings", [&] { read_strings(kMostCommitStrings + 2, ""); });
  EXPECT_NO_THROW(read_strings(2, std::string(kMostCommitStringBytes / 2, 'x')));
  ExpectIndexError("more than 2097152 bytes",
                   [&] { read_strings(2, std::string(kMostCommitStringBytes / 2 + 1, 'x')); });
  ExpectDamage(59, "wanted to skip 4294967295 bytes",
               [&] { Read(ByteWriter(strings).Int(1).VInt(-1).bytes()); });
}

TEST(CommitTest, ASegmentsNameCannotLeaveTheFolder) {
  for (const char* name : {"../_0", "_../_0", "/etc/passwd", "_0/_1", "", "_", "0", "_0.tis", "_A"}) {
    ExpectDamage(20, "segment name is not '_' and a number",
                 [&] { Read(CommitBytes(-9, {{.name = name}})); });
    ExpectDamage(8, "segment name is not '_' and a number", [&] { Read(CommitBytes(0, {{.name = name}})); });
  }
  ExpectDamage(20, "not valid UTF-8", [&] { Read(CommitBytes(-9, {{.name = "_\xff"}})); });
}

TEST(CommitTest, AFileThatIsLargerThanAnyCommitIsNotReadAtAll) {
  const std::string head = ByteWriter().Int(-9).Long(1).Int(1).Int(0).Int(0x7fffffff).bytes();
  ExpectIndexError("memory: offset 0: 1099511627800 bytes are too many for a commit",
                   [&] { ReadCommit(SourceOf(head, uint64_t{1} << 40, 0), 1); });
}

TEST(CommitTest, PassesAMediumErrorOn) {
  const std::string bytes = CommitBytes(-9, {SegmentBytes{}});
  EXPECT_THROW(ReadCommit(SourceOf(bytes, 0, 0), 1), IndexIoError);
}

}  // namespace
}  // namespace vantrel::elastic::format
