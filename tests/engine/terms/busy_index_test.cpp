#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <iostream>
#include <string>

#include "support/library_index.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index_info.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::TemporaryFolder;

constexpr int kCommits = 150;

// Adds one document a commit; every few commits all segments are merged, so that their files vanish.
void KeepWriting(LibraryIndex& index) {
  for (int number = 0; number < kCommits; ++number) {
    index.Add({{.name = "id", .value = std::to_string(number), .keyword = true},
               {.name = "body", .value = "some words of number " + std::to_string(number)}});
    index.Delete("id", std::to_string(number - 10));
    index.Commit();
    if (number % 4 == 3) index.Optimize();
  }
}

// How many documents are there, by their terms; each has one of its own in the field "id".
int CountDocuments(const std::string& path) {
  const auto info = newClassInit<IndexInfo>(path);
  int documents = 0;
  for (int segment = 0; segment < info->GetSegmentNum(); ++segment) {
    const auto dictionary = info->GetTermDict(segment, true);
    while (dictionary->Next()) {
      if (dictionary->Term()->field() == L"id") ++documents;
    }
  }
  return documents;
}

TEST(BusyIndexTest, CanBeReadAtAnyMomentWhileItIsWritten) {
  const TemporaryFolder folder;
  auto index = std::make_unique<LibraryIndex>(folder.path(), LibraryIndex::Options{.compound = false});
  index->Commit();
  const pid_t writer = fork();
  ASSERT_GE(writer, 0);
  if (writer == 0) {
    KeepWriting(*index);
    index->Close();
    _exit(0);
  }
  int status = 0;
  int readings = 0;
  while (waitpid(writer, &status, WNOHANG) == 0) {
    EXPECT_LE(CountDocuments(folder.path()), 11);
    ++readings;
  }
  EXPECT_EQ(status, 0);
  EXPECT_EQ(CountDocuments(folder.path()), 10);
  std::cout << readings << " readings during " << kCommits << " commits\n";
}

}  // namespace
}  // namespace vantrel::elastic
