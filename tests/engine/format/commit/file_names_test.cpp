#include "elastic/format/commit/file_names.h"

#include <gtest/gtest.h>

#include <limits>

namespace vantrel::elastic::format {
namespace {

TEST(FileNamesTest, ReadsTheGenerationOutOfACommitsName) {
  EXPECT_EQ(CommitGeneration("segments"), 0);
  EXPECT_EQ(CommitGeneration("segments_1"), 1);
  EXPECT_EQ(CommitGeneration("segments_z"), 35);
  EXPECT_EQ(CommitGeneration("segments_10"), 36);
  EXPECT_EQ(CommitGeneration("segments_1y2p0ij32e8e7"), std::numeric_limits<int64_t>::max());
}

TEST(FileNamesTest, ANameThatHoldsNoGenerationGivesNone) {
  for (const char* name :
       {"", "segment", "segments_", "segments.gen", "segments.old", "segments_4.bak", "segments_A",
        "segments_-1", "segments_+1", "segments_1 ", "segments-1", "segments1", "segments__1",
        "segments_1y2p0ij32e8e8", "segments_zzzzzzzzzzzzzzzzz", "_segments_1"}) {
    EXPECT_EQ(CommitGeneration(name), std::nullopt) << name;
  }
}

TEST(FileNamesTest, WritesTheNameThatItReads) {
  for (const int64_t generation : {int64_t{0}, int64_t{1}, int64_t{35}, int64_t{36}, int64_t{46655},
                                   std::numeric_limits<int64_t>::max()}) {
    EXPECT_EQ(CommitGeneration(CommitFileName(generation)), generation);
  }
  EXPECT_EQ(CommitFileName(0), "segments");
  EXPECT_EQ(CommitFileName(37), "segments_11");
}

TEST(FileNamesTest, OnlyANumberAfterAnUnderscoreIsASegmentsName) {
  for (const char* name : {"_0", "_z", "_10", "_00", "_1y2p0ij32e8e7"})
    EXPECT_TRUE(IsSegmentName(name)) << name;
  for (const char* name : {"", "_", "0", "_A", "_-1", "_0.cfs", "_0/", "../_0", "_../_0", "_/etc/passwd",
                           "_0\n", "__0", "_\xc3\xa4"}) {
    EXPECT_FALSE(IsSegmentName(name)) << name;
  }
  EXPECT_FALSE(IsSegmentName(std::string_view("_0\0", 3)));
}

TEST(FileNamesTest, ASegmentsNameHasNoMoreDigitsThanA64BitNumber) {
  EXPECT_TRUE(IsSegmentName("_zzzzzzzzzzzzz"));
  EXPECT_FALSE(IsSegmentName("_00000000000000"));
}

TEST(FileNamesTest, TellsTheSegmentOfAFile) {
  for (const char* name : {"_1a.cfs", "_1a.tis", "_1a_2.del", "_1a_z.s3", "_1a.f12", "_1a"}) {
    EXPECT_EQ(SegmentOfFile(name), "_1a") << name;
  }
  for (const char* name : {"", "segments_1", "segments.gen", "quorelastic.manifest", ".nfs_1"}) {
    EXPECT_EQ(SegmentOfFile(name), "") << name;
  }
}

TEST(FileNamesTest, NamesTheDeletionsOfASegment) {
  EXPECT_EQ(DeletionsFileName("_a", 0), "_a.del");
  EXPECT_EQ(DeletionsFileName("_a", 1), "_a_1.del");
  EXPECT_EQ(DeletionsFileName("_a", 36), "_a_10.del");
}

}  // namespace
}  // namespace vantrel::elastic::format
