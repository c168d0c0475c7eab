#include "elastic/terms/selected_terms.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <memory>

#include "elastic/format/io/folder.h"
#include "support/library_index.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::TemporaryFolder;

// How many files of a folder this process has open, by their endings.
std::map<std::string, int> OpenFilesByEnding(const std::string& folder) {
  std::map<std::string, int> counts;
  for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
    std::error_code error;
    const std::filesystem::path file = std::filesystem::read_symlink(entry.path(), error);
    if (!error && file.parent_path() == folder) ++counts[file.extension().string()];
  }
  return counts;
}

bool StepsToATerm(SelectedTerms& terms) {
  while (true) {
    const SelectedTerms::Move move = terms.Step();
    if (move != SelectedTerms::Move::kPassedOver) return move == SelectedTerms::Move::kTerm;
  }
}

TEST(SelectedTermsTest, HoldsOnlyTheFilesOpenThatItStillReads) {
  constexpr int kSegments = 4;
  const TemporaryFolder folder;
  {
    LibraryIndex index(folder.path(), {.compound = false});
    for (int i = 0; i < kSegments; ++i) {
      index.Add({{.name = "body", .value = "tea team"},
                 {.name = "id", .value = std::to_string(i), .keyword = true}});
      index.Add({{.name = "body", .value = "tea"}});
      index.Commit();
    }
    index.Delete("id", "0");
    index.Commit();
  }
  std::vector<std::unique_ptr<SelectedTerms>> walks;
  AddSelectedTerms(format::OpenNewestSegments(format::DiskFolder(folder.path()), format::Need::kAll),
                   {.field = "body", .text = "te"}, walks);
  ASSERT_EQ(walks.size(), static_cast<size_t>(kSegments));
  const std::map<std::string, int> expected = {{".tis", kSegments}, {".frq", 1}, {".del", 1}};
  EXPECT_EQ(OpenFilesByEnding(folder.path()), expected);
  for (const auto& walk : walks) {
    ASSERT_TRUE(StepsToATerm(*walk));
    const format::TermCursor& cursor = walk->walk().cursor();
    EXPECT_EQ(cursor.text(), "tea");
    EXPECT_TRUE(walk->IsLive(cursor.info(), cursor.field()));
    EXPECT_TRUE(StepsToATerm(*walk));
    EXPECT_FALSE(StepsToATerm(*walk));
    EXPECT_FALSE(StepsToATerm(*walk));
  }
  walks.clear();
  EXPECT_TRUE(OpenFilesByEnding(folder.path()).empty());
}

}  // namespace
}  // namespace vantrel::elastic
