#include "vantrel/elastic/index_info.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <filesystem>

#include "support/expect_damage.h"
#include "support/files.h"
#include "support/library_index.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::FindFile;
using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::TemporaryFolder;
using ::testing::ElementsAre;

std::vector<std::string> AllTerms(const IndexInfo& index, int segment, bool live_only) {
  std::vector<std::string> terms;
  const auto dictionary = index.GetTermDict(segment, live_only);
  while (dictionary->Next()) {
    const Lucene::TermPtr term = dictionary->Term();
    terms.push_back(Lucene::StringUtils::toUTF8(term->field()) + ":" +
                    Lucene::StringUtils::toUTF8(term->text()));
  }
  EXPECT_EQ(static_cast<int>(terms.size()), dictionary->GetTermsCount());
  return terms;
}

TEST(IndexInfoTest, ATermWhoseDocumentsAreAllDeletedIsNoLongerLive) {
  const TemporaryFolder folder;
  {
    LibraryIndex index(folder.path());
    index.Add({{.name = "id", .value = "a", .keyword = true}, {.name = "body", .value = "both first"}});
    index.Add({{.name = "id", .value = "b", .keyword = true}, {.name = "body", .value = "both second"}});
    index.Commit();
    index.Delete("id", "a");
  }
  const auto info = newClassInit<IndexInfo>(folder.path());
  ASSERT_EQ(info->GetSegmentNum(), 1);
  EXPECT_THAT(AllTerms(*info, 0, false),
              ElementsAre("body:both", "body:first", "body:second", "id:a", "id:b"));
  EXPECT_THAT(AllTerms(*info, 0, true), ElementsAre("body:both", "body:second", "id:b"));
}

TEST(IndexInfoTest, AFolderThatBearsTheNameOfACommitIsNoCommit) {
  const TemporaryFolder folder;
  { LibraryIndex(folder.path()).Add({{.name = "body", .value = "word"}}); }
  std::filesystem::create_directory(folder / "segments_old");
  std::filesystem::create_directory(folder / "segments_9");
  EXPECT_THAT(AllTerms(*newClassInit<IndexInfo>(folder.path()), 0, false), ElementsAre("body:word"));
}

TEST(IndexInfoTest, WithoutWhatTellsLiveTermsAllTermsAreStillWalked) {
  for (const std::string ending : {".frq", ".del"}) {
    SCOPED_TRACE(ending);
    const TemporaryFolder folder;
    {
      LibraryIndex index(folder.path(), {.compound = false});
      index.Add({{.name = "id", .value = "a", .keyword = true}});
      index.Add({{.name = "id", .value = "b", .keyword = true}});
      index.Commit();
      index.Delete("id", "a");
    }
    const std::string missing = folder / FindFile(folder.path(), ending);
    std::filesystem::remove(missing);
    const auto info = newClassInit<IndexInfo>(folder.path());
    EXPECT_THAT(AllTerms(*info, 0, false), ElementsAre("id:a", "id:b"));
    ExpectIndexError(missing + ": cannot open file", [&] { info->GetTermDict(0, true); });
  }
}

}  // namespace
}  // namespace vantrel::elastic
