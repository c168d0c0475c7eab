// Decay that no structure tells, found by the manifest that every commit leaves.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <memory>
#include <string>

#include "support/files.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::FindFile;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::testing::AllOf;
using ::testing::ElementsAre;
using ::testing::Field;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

using Use = HealthReport::Manifest;

constexpr size_t kBlock = size_t{1} << 20;

IndexSettings Settings(bool compound) {
  IndexSettings settings;
  settings.compound_files = compound;
  settings.fields = {{.name = "body", .term_vector = TermVector::kPositionsAndOffsets}};
  return settings;
}

class ManifestHealthTest : public ::testing::Test {
 protected:
  ManifestHealthTest() : manifest_(path_ + "/quorelastic.manifest") { Create(false); }

  void Create(bool compound) {
    index_.reset();
    std::filesystem::remove_all(path_);
    index_ = Index::Create(path_, Settings(compound));
    AddBook("a", "the quick brown fox");
    AddBook("b", "jumps over the lazy dog");
    index_->Commit();
  }

  void AddBook(const std::string& id, const std::string& body) const {
    index_->Update(Document{{{"id", id}, {"body", body}}});
  }

  void Flip(const std::string& file, size_t byte, int bit = 0) const {
    std::string bytes = ReadFile(file);
    bytes.at(byte) = static_cast<char>(bytes.at(byte) ^ (1 << bit));
    WriteFile(file, bytes);
  }
  void FlipNorm() const { Flip(path_ + "/_0.nrm", 4, 6); }

  HealthReport Check() const { return CheckIndexHealth(path_, {.threads = 2}); }

  void ExpectFlipsFound() const {
    for (const std::string& name : ListFolder(path_)) {
      if (!name.starts_with('_') && !name.starts_with("segments_") && name != "quorelastic.manifest")
        continue;
      const std::string file = path_ + "/" + name;
      const std::string bytes = ReadFile(file);
      for (size_t bit = 0; bit < bytes.size() * 8; bit += (1 + bit % 5) * ::quorelastic::testing::kFewer) {
        Flip(file, bit / 8, static_cast<int>(bit % 8));
        EXPECT_THAT(CheckIndexHealth(path_, {.threads = 1}).findings, ::testing::Not(IsEmpty()))
            << name << ": bit " << bit;
        WriteFile(file, bytes);
      }
    }
    EXPECT_THAT(Check().findings, IsEmpty());
  }

  const TemporaryFolder folder_;
  const std::string path_ = folder_ / "index";
  const std::string manifest_;
  std::shared_ptr<Index> index_;
};

TEST_F(ManifestHealthTest, EveryCommitIsComparedWithItsOwn) {
  EXPECT_EQ(Check().manifest, Use::kCompared);
  const std::string before = ReadFile(manifest_);
  index_->DeleteById("a");
  index_->Commit();
  EXPECT_NE(ReadFile(manifest_), before);
  EXPECT_EQ(Check().manifest, Use::kCompared);
  index_->Optimize();
  index_->Commit();
  EXPECT_EQ(Check().manifest, Use::kCompared);
  EXPECT_THAT(Check().findings, IsEmpty());
}

TEST_F(ManifestHealthTest, AnIndexJustCreatedHasOneToo) {
  const auto empty = Index::Create(folder_ / "empty", Settings(true));
  EXPECT_EQ(CheckIndexHealth(folder_ / "empty").manifest, Use::kCompared);
}

TEST_F(ManifestHealthTest, ACommitOfNothingLeavesItAlone) {
  struct stat before {};
  ASSERT_EQ(stat(manifest_.c_str(), &before), 0);
  index_->Commit();
  struct stat after {};
  ASSERT_EQ(stat(manifest_.c_str(), &after), 0);
  EXPECT_EQ(before.st_ino, after.st_ino);
}

TEST_F(ManifestHealthTest, AFlippedNormIsSeenWithItAndCannotBeSeenWithout) {
  FlipNorm();
  const std::string norms = path_ + "/" + FindFile(path_, ".nrm");
  EXPECT_THAT(Check().findings,
              ElementsAre(AllOf(Field(&HealthFinding::file, norms), Field(&HealthFinding::offset, 0),
                                Field(&HealthFinding::expected, HasSubstr("the digest in the manifest")),
                                Field(&HealthFinding::grade, HealthFinding::Grade::kDamaged),
                                Field(&HealthFinding::segment, "_0"))));
  std::filesystem::remove(manifest_);
  EXPECT_EQ(Check().manifest, Use::kNone);
  EXPECT_THAT(Check().findings, IsEmpty());
}

TEST_F(ManifestHealthTest, FlippedBitsAllOverAPlainIndexAreFound) {
  index_->DeleteById("a");
  index_->Commit();
  ExpectFlipsFound();
}

TEST_F(ManifestHealthTest, FlippedBitsAllOverACompoundIndexAreFound) {
  Create(true);
  index_->DeleteById("a");
  index_->Commit();
  ExpectFlipsFound();
}

TEST_F(ManifestHealthTest, ALaterCommitDoesNotBlessWhatHasDecayedBefore) {
  FlipNorm();
  AddBook("c", "another segment");
  index_->Commit();
  index_ = Index::Open(path_);
  AddBook("d", "of another writer");
  index_->Commit();
  EXPECT_EQ(Check().manifest, Use::kCompared);
  EXPECT_THAT(Check().findings, ElementsAre(Field(&HealthFinding::segment, "_0")));
}

TEST_F(ManifestHealthTest, TheFirstDifferenceInALargeFileIsToldByItsBlock) {
  std::string noise;
  for (uint32_t state = 1; noise.size() < 4 * kBlock; state = state * 1664525 + 1013904223) {
    noise.append(std::to_string(state >> 8)).append(" ");
  }
  AddBook("large", noise);
  index_->Commit();
  ASSERT_THAT(Check().findings, IsEmpty());
  const std::string stored = path_ + "/_1.fdt";
  Flip(stored, 2 * kBlock - 1);
  Flip(stored, 3 * kBlock);
  const auto findings = Check().findings;
  ASSERT_FALSE(findings.empty());
  EXPECT_THAT(findings.back(),
              AllOf(Field(&HealthFinding::file, stored), Field(&HealthFinding::offset, kBlock),
                    Field(&HealthFinding::found, HasSubstr("and 1 more that differ"))));
}

TEST_F(ManifestHealthTest, AFileThatGrewOrIsGoneIsFound) {
  const std::string norms = path_ + "/" + FindFile(path_, ".nrm");
  const std::string bytes = ReadFile(norms);
  WriteFile(norms, bytes + "x");
  EXPECT_THAT(Check().findings,
              ::testing::Contains(Field(&HealthFinding::expected, HasSubstr("the size in the manifest"))));
  std::filesystem::remove(norms);
  EXPECT_THAT(Check().findings, ::testing::Not(IsEmpty()));
}

TEST_F(ManifestHealthTest, TheOneOfAnEarlierCommitIsNotUsed) {
  const std::string earlier = ReadFile(manifest_);
  AddBook("c", "newer");
  index_->Commit();
  WriteFile(manifest_, earlier);
  FlipNorm();
  EXPECT_EQ(Check().manifest, Use::kNotUsed);
  EXPECT_THAT(Check().findings, IsEmpty());
}

TEST_F(ManifestHealthTest, TheOneOfAnotherIndexIsNotUsed) {
  const std::string other = folder_ / "other";
  const auto stranger = Index::Create(other, Settings(false));
  stranger->Update(Document{{{"id", "z"}, {"body", "of the same generation"}}});
  stranger->Commit();
  ASSERT_EQ(FindFile(other, "segments_2"), FindFile(path_, "segments_2"));
  WriteFile(other + "/quorelastic.manifest", ReadFile(manifest_));
  EXPECT_EQ(CheckIndexHealth(other).manifest, Use::kNotUsed);
  EXPECT_THAT(CheckIndexHealth(other).findings, IsEmpty());
}

TEST_F(ManifestHealthTest, ADamagedOneIsAFinding) {
  Flip(manifest_, 30);
  EXPECT_EQ(Check().manifest, Use::kNotUsed);
  EXPECT_THAT(Check().findings,
              ElementsAre(AllOf(Field(&HealthFinding::file, manifest_),
                                Field(&HealthFinding::grade, HealthFinding::Grade::kDamaged))));
}

TEST_F(ManifestHealthTest, WhatIsNoFileInItsPlaceIsAFinding) {
  std::filesystem::remove(manifest_);
  ASSERT_EQ(mkfifo(manifest_.c_str(), 0600), 0);
  EXPECT_THAT(Check().findings,
              ElementsAre(AllOf(Field(&HealthFinding::file, manifest_),
                                Field(&HealthFinding::found, HasSubstr("not a regular file")))));
}

TEST_F(ManifestHealthTest, ACommitThatCannotHaveOneStandsAllTheSame) {
  std::filesystem::remove(manifest_);
  std::filesystem::create_directories(manifest_ + "/in the way");
  AddBook("c", "still here");
  index_->Commit();
  EXPECT_EQ(index_->CountDocuments().live, 3U);
  std::filesystem::remove_all(manifest_);
  EXPECT_EQ(Check().manifest, Use::kNone);
  AddBook("d", "and its successor has one");
  index_->Commit();
  EXPECT_EQ(Check().manifest, Use::kCompared);
}

TEST_F(ManifestHealthTest, ComparingReadsHardlyMore) {
  std::string text;
  for (int number = 0; number < 2000; ++number) {
    text.append(std::to_string(number * 7919)).append(" ");
    AddBook(std::to_string(number), text);
  }
  index_->Optimize();
  index_->Commit();
  HealthProgress last;
  const HealthReport report = CheckIndexHealth(
      path_, {.threads = 1, .progress = [&](const HealthProgress& progress) { last = progress; }});
  ASSERT_EQ(report.manifest, Use::kCompared);
  uint64_t bytes = 0;
  for (const std::string& file : report.files) bytes += std::filesystem::file_size(file);
  ASSERT_GT(bytes, 10 * kBlock);
  EXPECT_EQ(last.bytes_opened, bytes);
  EXPECT_LT(static_cast<double>(last.bytes_read), 1.2 * static_cast<double>(bytes));
}

}  // namespace
}  // namespace vantrel::elastic
