// Damage in an index that is searched and written: told, never followed.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>

#include "read_back.h"
#include "support/files.h"
#include "support/open_files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_health.h"
#include "vantrel/elastic/search.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::CopyFolder;
using ::quorelastic::testing::CountOpenFiles;
using ::quorelastic::testing::FindFile;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::testing::HasSubstr;

constexpr const char* kManifest = "/quorelastic.manifest";

// What the search for every document, and one with norms and positions, answer.
std::string Answer(const Index& index) {
  std::string answer;
  for (const char* query : {"*:*", "body:\"red word\" body:blue"}) {
    SearchRequest request;
    request.query = query;
    const SearchResult result = index.Search(request);
    answer += std::to_string(result.total) + ":";
    for (const SearchHit& hit : result.hits) {
      answer += " " + hit.id + " " + std::to_string(hit.score);
      for (const FieldValues& field : hit.fields) answer += " " + field.name + "=" + field.values.at(0);
    }
    answer += "\n";
  }
  return answer;
}

std::string ErrorOf(const std::function<void()>& operation) {
  try {
    operation();
  } catch (const IndexError& error) {
    return error.what();
  }
  return "no error";
}

void FlipBit(const std::string& path, size_t offset) {
  std::string bytes = ReadFile(path);
  bytes.at(offset) = static_cast<char>(bytes.at(offset) ^ 0x04);
  WriteFile(path, bytes);
}

// Two segments with a deleted document and a manifest, and nobody who writes.
class DamagedIndexUseTest : public ::testing::TestWithParam<bool> {
 protected:
  DamagedIndexUseTest() {
    IndexSettings settings = ::quorelastic::testing::IdAndBody();
    settings.fields[1].term_vector = TermVector::kPositions;
    settings.compound_files = GetParam();
    const auto index = Index::Create(path_, settings);
    index->Add(MakeDocument("a", "red word"));
    index->Add(MakeDocument("b", "blue word"));
    index->Commit();
    index->Add(MakeDocument("c", "a red word and a blue one"));
    index->DeleteById("a");
    index->Commit();
    answer_ = Answer(*index);
  }

  const std::string& path() const { return path_; }
  const std::string& answer() const { return answer_; }
  // Whether the check finds nothing that could hurt the index library.
  bool IsSafe() const {
    const HealthReport report = CheckIndexHealth(path_);
    return std::none_of(report.findings.begin(), report.findings.end(), [](const HealthFinding& finding) {
      return finding.grade == HealthFinding::Grade::kUnsafe;
    });
  }

  std::string FirstSegment() const { return path_ + (GetParam() ? "/_0.cfs" : "/_0.tis"); }

 private:
  TemporaryFolder folder_;
  std::string path_ = folder_ / "index";
  std::string answer_;
};

INSTANTIATE_TEST_SUITE_P(, DamagedIndexUseTest, ::testing::Bool(),
                         [](const auto& test) { return test.param ? "Compound" : "Plain"; });

TEST_P(DamagedIndexUseTest, AFlippedBitAnywhereIsToldOrNeverRead) {
  size_t told = 0;
  size_t flips = 0;
  for (const std::string& name : ListFolder(path())) {
    if (!name.starts_with("_")) continue;
    const std::string file = path() + "/" + name;
    const std::string whole = ReadFile(file);
    for (size_t offset = 0; offset < whole.size(); offset += 5) {
      FlipBit(file, offset);
      ++flips;
      try {
        EXPECT_EQ(Answer(*Index::Open(path())), answer()) << file << " " << offset;
      } catch (const IndexError& error) {
        ++told;
        EXPECT_THAT(error.what(), HasSubstr(name + ": offset 0: the block that begins here is not what was"));
      }
      WriteFile(file, whole);
    }
  }
  // Term vectors are not read by a search.
  EXPECT_GT(told, flips / 2);
  EXPECT_EQ(Answer(*Index::Open(path())), answer());
}

TEST_P(DamagedIndexUseTest, AnIndexThatIsWholeAgainIsSearchedAgain) {
  const auto index = Index::Open(path());
  const std::string whole = ReadFile(FirstSegment());
  FlipBit(FirstSegment(), whole.size() / 2);
  EXPECT_THAT(ErrorOf([&] { Answer(*index); }), HasSubstr("is not what was written"));
  WriteFile(FirstSegment(), whole);
  EXPECT_EQ(Answer(*index), answer());
}

TEST_P(DamagedIndexUseTest, SearchesThatFailLeaveNoFileOpen) {
  const auto index = Index::Open(path());
  FlipBit(path() + (GetParam() ? "/_1.cfs" : "/_1.nrm"), 5);
  ErrorOf([&] { Answer(*index); });
  const size_t before = CountOpenFiles();
  for (int i = 0; i < 50; ++i) EXPECT_NE(ErrorOf([&] { Answer(*index); }), "no error");
  EXPECT_LE(CountOpenFiles(), before);
}

TEST_P(DamagedIndexUseTest, AFileThatIsCutIsToldWithItsSize) {
  std::string bytes = ReadFile(FirstSegment());
  const std::string size = std::to_string(bytes.size());
  bytes.pop_back();
  WriteFile(FirstSegment(), bytes);
  EXPECT_THAT(ErrorOf([&] { Answer(*Index::Open(path())); }),
              HasSubstr("the file is not what was written: it has " + std::to_string(bytes.size()) +
                        " bytes, not " + size));
}

TEST_P(DamagedIndexUseTest, AFileThatIsMissingIsToldThoughTheLibraryCouldDoWithout) {
  const std::string file = GetParam() ? FirstSegment() : path() + "/_0.tvx";
  std::filesystem::remove(file);
  EXPECT_EQ(ErrorOf([&] { Answer(*Index::Open(path())); }),
            file + ": cannot open file: No such file or directory");
}

TEST_P(DamagedIndexUseTest, DeletingFromADamagedSegmentFailsAndTheCommitStays) {
  const std::string whole = ReadFile(FirstSegment());
  FlipBit(FirstSegment(), whole.size() / 2);
  {
    const auto index = Index::Open(path());
    EXPECT_THAT(ErrorOf([&] {
                  index->DeleteById("b");
                  index->Commit();
                }),
                HasSubstr("is not what was written"));
  }
  WriteFile(FirstSegment(), whole);
  const auto index = Index::Open(path());
  EXPECT_EQ(Answer(*index), answer());
  index->DeleteById("b");
  index->Commit();
  EXPECT_EQ(index->CountDocuments().live, 1U);
}

TEST_P(DamagedIndexUseTest, MergingADamagedSegmentFailsAndTheCommitStays) {
  const std::string file = GetParam() ? FirstSegment() : path() + "/_0.fdt";
  const std::string whole = ReadFile(file);
  FlipBit(file, whole.size() / 2);
  EXPECT_THAT(ErrorOf([&] { Index::Open(path())->Optimize(); }), HasSubstr("is not what was written"));
  WriteFile(file, whole);
  EXPECT_EQ(Answer(*Index::Open(path())), answer());
}

TEST_P(DamagedIndexUseTest, WithoutAManifestTheSegmentsAreCheckedFirst) {
  std::filesystem::remove(path() + kManifest);
  EXPECT_EQ(Answer(*Index::Open(path())), answer());
  FlipBit(FirstSegment(), ReadFile(FirstSegment()).size() / 2);
  ASSERT_FALSE(IsSafe()) << "another byte should be damaged for this test";
  const auto index = Index::Open(path());
  const std::string first = ErrorOf([&] { Answer(*index); });
  EXPECT_THAT(first, HasSubstr(": expected "));
  EXPECT_EQ(ErrorOf([&] { Answer(*index); }), first);
  EXPECT_EQ(ErrorOf([&] { index->Add(MakeDocument("d", "text")); }), first);
}

TEST_P(DamagedIndexUseTest, WithoutAManifestHarmlessDamageDoesNotHinderASearch) {
  std::filesystem::remove(path() + kManifest);
  size_t harmless = 0;
  for (const std::string& name : ListFolder(path())) {
    if (!name.starts_with("_")) continue;
    const std::string file = path() + "/" + name;
    const std::string whole = ReadFile(file);
    WriteFile(file, whole + "more");
    if (IsSafe()) {
      ++harmless;
      EXPECT_FALSE(CheckIndexHealth(path()).clean());
      EXPECT_EQ(Answer(*Index::Open(path())), answer()) << file;
    }
    WriteFile(file, whole);
  }
  EXPECT_GT(harmless, 0U);
}

TEST_P(DamagedIndexUseTest, ADamagedManifestIsNoneAndTheNextCommitLeavesANewOne) {
  FlipBit(path() + kManifest, 30);
  const auto index = Index::Open(path());
  EXPECT_EQ(Answer(*index), answer());
  index->Add(MakeDocument("d", "text"));
  index->Commit();
  EXPECT_EQ(CheckIndexHealth(path()).manifest, HealthReport::Manifest::kCompared);
  FlipBit(FirstSegment(), ReadFile(FirstSegment()).size() / 2);
  EXPECT_THAT(ErrorOf([&] { Answer(*Index::Open(path())); }), HasSubstr("is not what was written"));
}

TEST_P(DamagedIndexUseTest, ABackupPutInTheIndexsPlaceIsSearchedByWhoHadItOpen) {
  const TemporaryFolder other;
  CopyFolder(path(), other / "backup");
  const auto reader = Index::Open(path());
  {
    const auto writer = Index::Open(path());
    writer->Add(MakeDocument("d", "blue"));
    writer->Optimize();
    writer->Commit();
  }
  EXPECT_NE(Answer(*reader), answer());
  std::filesystem::remove_all(path());
  CopyFolder(other / "backup", path());
  EXPECT_EQ(Answer(*reader), answer());
}

TEST_P(DamagedIndexUseTest, WhatIsWrittenWhileSearchesGoOnIsVerifiedOnceItHasAManifest) {
  const auto index = Index::Open(path());
  index->Add(MakeDocument("d", "blue"));
  EXPECT_EQ(Answer(*index), answer());
  index->Commit();
  EXPECT_NE(Answer(*index), answer());
  index->Optimize();
  index->Commit();
  const std::string merged = path() + "/" + FindFile(path(), GetParam() ? ".cfs" : ".fdt");
  FlipBit(merged, ReadFile(merged).size() / 2);
  EXPECT_THAT(ErrorOf([&] { Answer(*Index::Open(path())); }), HasSubstr("is not what was written"));
}

}  // namespace
}  // namespace vantrel::elastic
