#include "elastic/manifest/manifest.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <span>

#include "elastic/manifest/block_digest.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::MemoryFile;
using ::quorelastic::testing::MemoryFolder;
using ::quorelastic::testing::SourceOf;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

uint64_t Digest(const std::string& bytes) {
  return BlockDigest::Of(std::span(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size()));
}

// A manifest with these lines between its first and its last one.
std::string Sealed(const std::string& lines, const std::string& version = "1") {
  const std::string body = "quorelastic manifest " + version + "\n" + lines;
  return body + "digest " + DigestText(Digest(body)) + "\n";
}

std::optional<Manifest> ReadText(const std::string& text) { return ReadManifest(*SourceOf(text)); }

const std::string kTwoDigests = " 00000000000000ff fedcba9876543210";

TEST(BlockDigestTest, IsTheOneThatManifestsOfOldWereMadeWith) {
  EXPECT_EQ(DigestText(Digest("")), "2d06800538d394c2");
  EXPECT_EQ(DigestText(Digest("a")), "e6c632b61e964e1f");
}

TEST(BlockDigestTest, DoesNotDependOnThePieces) {
  BlockDigest digest;
  for (const char* piece : {"in", "", " three ", "pieces"}) {
    digest.Add(std::span(reinterpret_cast<const uint8_t*>(piece), std::string(piece).size()));
  }
  EXPECT_EQ(digest.value(), Digest("in three pieces"));
}

TEST(BlockDigestTest, AFileHasADigestForEachBlockAndForWhatIsLeft) {
  const std::string block(kDigestBlock, 'b');
  EXPECT_THAT(DigestBlocks(*SourceOf("")), IsEmpty());
  EXPECT_THAT(DigestBlocks(*SourceOf("x")), ElementsAre(Digest("x")));
  EXPECT_THAT(DigestBlocks(*SourceOf(block)), ElementsAre(Digest(block)));
  EXPECT_THAT(DigestBlocks(*SourceOf(block + block + "x")),
              ElementsAre(Digest(block), Digest(block), Digest("x")));
}

TEST(ManifestTest, IsLinesOfText) {
  const Manifest manifest{
      .generation = 36,
      .files = {{.name = "_0.cfs", .size = kDigestBlock + 1, .digests = {0xff, 0xfedcba9876543210}},
                {.name = "_0_1.del"}}};
  const std::string text = Sealed("commit 36\nfile _0.cfs 1048577" + kTwoDigests + "\nfile _0_1.del 0\n");
  EXPECT_EQ(WriteManifest(manifest), text);
  EXPECT_EQ(ReadText(text), manifest);
}

TEST(ManifestTest, EveryFlippedBitInItIsSeen) {
  const std::string text = Sealed("commit 2\nfile _0.frq 3 0123456789abcdef\n");
  ASSERT_TRUE(ReadText(text).has_value());
  for (size_t bit = 0; bit < text.size() * 8; ++bit) {
    std::string flipped = text;
    flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
    EXPECT_THROW(ReadText(flipped), IndexDamagedError) << "bit " << bit;
  }
}

TEST(ManifestTest, IsSeenToBeCutOff) {
  const std::string text = Sealed("commit 2\nfile _0.frq 3 0123456789abcdef\n");
  for (size_t size = 0; size < text.size(); ++size) {
    EXPECT_THROW(ReadText(text.substr(0, size)), IndexDamagedError) << size << " bytes";
  }
}

TEST(ManifestTest, OfALaterVersionSaysNothing) { EXPECT_EQ(ReadText(Sealed("whatever", "2")), std::nullopt); }

TEST(ManifestTest, RefusesWhatItsWriterWouldNotWrite) {
  const auto refuses = [](const std::string& lines, uint64_t offset, const std::string& problem) {
    ExpectDamage(offset, problem, [&] { ReadText(Sealed(lines)); });
  };
  refuses("", 22, "\"\ncommit \" is missing");
  refuses("commit x\n", 30, "no number where one must be");
  refuses("commit 9223372036854775808\n", 30, "no number where one must be");
  refuses("commit 2\nfolder\n", 32, "\"file \" is missing");
  refuses("commit 2\nfile  1\n", 37, "a word is missing");
  refuses("commit 2\nfile ../_0.frq 0\n", 37, "is no file of a commit");
  refuses("commit 2\nfile _0/.frq 0\n", 37, "is no file of a commit");
  refuses("commit 2\nfile segments.gen 0\n", 37, "is no file of a commit");
  refuses("commit 2\nfile _0.frq -1\n", 44, "no number where one must be");
  refuses("commit 2\nfile _0.frq 18446744073709551616\n", 44, "no number where one must be");
  refuses("commit 2\nfile _0.frq 1\n", 45, "digests and size do not agree");
  refuses("commit 2\nfile _0.frq 1 ff\n", 46, "no number where one must be");
  refuses("commit 2\nfile _0.frq 1" + kTwoDigests + "\n", 79, "digests and size do not agree");
  refuses("commit 2\nfile _1.del 0\nfile _0.del 0\n", 60, "files out of order");
  refuses("commit 2\nfile _1.del 0\nfile _1.del 0\n", 60, "files out of order");
}

TEST(ManifestTest, IsNotReadWhereItIsLargerThanAny) {
  ExpectIndexError("too large for a manifest",
                   [] { ReadManifest(*SourceOf("quorelastic", uint64_t{1} << 40)); });
}

class OwnManifestTest : public ::testing::Test {
 protected:
  OwnManifestTest() {
    folder_.files["segments_2"] = MemoryFile{.bytes = "the commit"};
    commit_.generation = 2;
    manifest_ = MakeManifest(folder_, commit_);
  }

  MemoryFolder folder_;
  Commit commit_;
  Manifest manifest_;
};

TEST_F(OwnManifestTest, BelongsToTheCommitWhoseFileItDescribes) {
  EXPECT_TRUE(manifest_.BelongsTo(folder_, commit_));
}

TEST_F(OwnManifestTest, DoesNotBelongToAnotherGeneration) {
  commit_.generation = 3;
  EXPECT_FALSE(manifest_.BelongsTo(folder_, commit_));
}

TEST_F(OwnManifestTest, DoesNotBelongToTheSameGenerationOfAnotherIndex) {
  folder_.files["segments_2"] = MemoryFile{.bytes = "a stranger"};
  EXPECT_FALSE(manifest_.BelongsTo(folder_, commit_));
}

TEST_F(OwnManifestTest, DoesNotBelongAnywhereWithoutACommitInIt) {
  manifest_.files.clear();
  EXPECT_FALSE(manifest_.BelongsTo(folder_, commit_));
}

// Segments of an older layout: their files of norms are looked for in the folder.
TEST(ManifestOfSegmentsTest, ListsTheFolderOnceForAllSegments) {
  MemoryFolder folder;
  folder.files["segments_2"] = MemoryFile{.bytes = "the commit"};
  Commit commit;
  commit.generation = 2;
  for (const char* segment : {"_0", "_00", "_1"}) {
    commit.segments.push_back({.name = segment, .document_count = 1});
    for (const char* extension : {".fnm", ".f0", ".f12", ".s3", ".fx", "_2.s3"}) {
      folder.files[std::string(segment) + extension] = MemoryFile{.bytes = "x"};
    }
  }
  const Manifest manifest = MakeManifest(folder, commit);
  EXPECT_EQ(folder.listed, 1);
  for (const char* segment : {"_0", "_00", "_1"}) {
    for (const char* extension : {".fnm", ".f0", ".f12", ".s3"}) {
      EXPECT_NE(manifest.Find(std::string(segment) + extension), nullptr) << segment << extension;
    }
  }
  EXPECT_EQ(manifest.files.size(), 13U);
}

// A commit may name very many files of norms: only those that are there are asked for.
TEST(ManifestOfSegmentsTest, AsksForNoFileOfNormsThatTheFolderDoesNotList) {
  MemoryFolder folder;
  folder.files["segments_2"] = MemoryFile{.bytes = "the commit"};
  folder.files["_0_1.s7"] = MemoryFile{.bytes = "x"};
  Commit commit;
  commit.generation = 2;
  SegmentInfo segment{.name = "_0", .document_count = 1, .compound = SegmentInfo::Compound::kNo};
  segment.norm_generations.emplace(1000, 1);
  commit.segments.push_back(segment);
  EXPECT_NE(MakeManifest(folder, commit).Find("_0_1.s7"), nullptr);
  EXPECT_LT(folder.opened, 100);
}

}  // namespace
}  // namespace vantrel::elastic::format
